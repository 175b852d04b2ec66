#include "orvo/core/exceptions/ExceptionBase.h"
#include "orvo/core/memory/AllocationFailure.h"
#include "orvo/data_flow/controllers/Controller.h"
#include "orvo/data_flow/controllers/SchedulingHooks.h"

#include "tests/data_flow/controllers/TestNodes.h"
#include "tests/support/DataFlowLayers.h"

#include <gtest/gtest.h>

#include <chrono>
#include <cstdint>
#include <new>
#include <random>
#include <thread>

namespace ORVO::Test {

using DataFlow::Connect;
using DataFlow::Controller;
using DataFlow::internal::SchedulingHooks;

namespace {

/// A graph with a fan-out, two sliced nodes and a sink:
///
///     source -- left (sliced) --+
///        |                      sink
///        +----- right (sliced) -+
struct Graph {
    Graph() {
        Connect(source.out(0), left.in());
        Connect(source.out(1), right.in());
        Connect(left.out(), sink.in(0));
        Connect(right.out(), sink.in(1));
        left.setSlices(nItems);
        right.setSlices(nItems);
        for (SumNode* pNode : {&source, &left, &right, &sink}) {
            controller.addNode(pNode);
        }
        controller.setSinkNode(sink);
    }

    static constexpr int nItems = 24;
    static constexpr int iExpected = 5 + 1 + 5 + 2 + 3;

    SumNode source{"source", 0, 2, 5};
    SumNode left{"left", 1, 1, 1};
    SumNode right{"right", 1, 1, 2};
    SumNode sink{"sink", 2, 1, 3};
    Controller controller; // dies first: it may have to end a frame
};

void spin(std::chrono::nanoseconds time) {
    auto const end = std::chrono::steady_clock::now() + time;
    while (std::chrono::steady_clock::now() < end) {
    }
}

/// A delay that differs from call to call, without a state that threads would share.
void delay() {
    spin(std::chrono::nanoseconds(std::chrono::steady_clock::now().time_since_epoch().count() % 2000));
}

class ControllerStressTest : public ::testing::Test, protected DataFlowLayers {
protected:
    ~ControllerStressTest() override {
        SchedulingHooks::setSliceHook(nullptr);
        SchedulingHooks::setFrameHook(nullptr);
    }
};

bool countCompletion(void* pCount) {
    ++*static_cast<std::atomic<int>*>(pCount);
    return true;
}

} // namespace

TEST_F(ControllerStressTest, FramesCancelledAtRandomMomentsLeaveTheNextFrameRight) {
    constexpr int nFrames = 10000;
    Graph graph;
    Controller& controller = graph.controller;
    std::atomic<int> nCompleted{0};
    ASSERT_TRUE(controller.registerProcessingCompletedCallback(countCompletion, &nCompleted));
    SchedulingHooks::setSliceHook(delay);
    SchedulingHooks::setFrameHook(delay);

    std::mt19937 random(20260101);
    int nLaunched = 0;
    int nWhole = 0;
    for (int i = 0; i < nFrames; ++i) {
        controller.processAsync();
        ++nLaunched;
        spin(std::chrono::nanoseconds(random() % 120000));
        controller.cancelProcess();
        if (random() % 4 != 0) {
            ASSERT_TRUE(controller.wait(60.0, 0.0)) << "frame " << i;
            ASSERT_EQ(0, static_cast<int>(controller.controllerStatus()));
            ASSERT_EQ(-1, graph.sink.result()) << "a cancelled frame's results are flushed";
        }
        if (random() % 8 == 0) {
            graph.left.nItemsDone_ = 0;
            if (random() % 2 == 0) {
                controller.process();
            } else {
                controller.processAsync();
                ++nLaunched;
                ASSERT_TRUE(controller.wait(60.0, 0.0));
            }
            controller.checkException();
            ASSERT_EQ(Graph::iExpected, graph.sink.result()) << "frame " << i;
            ++nWhole;
            ASSERT_TRUE(controller.flushGraph());
        }
    }
    ASSERT_TRUE(controller.wait(60.0, 0.0));
    EXPECT_EQ(nLaunched, nCompleted) << "every frame is completed once";
    EXPECT_GT(nWhole, nFrames / 16);
}

TEST_F(ControllerStressTest, CancelsFromAnotherThreadNeitherHangNorLeaveAPartialResult) {
    Graph graph;
    Controller& controller = graph.controller;
    std::atomic<bool> bStop{false};
    std::thread canceller([&] {
        std::mt19937 random(7);
        while (!bStop) {
            controller.cancelProcess();
            spin(std::chrono::nanoseconds(random() % 200000));
        }
    });
    for (int i = 0; i < 500; ++i) {
        if (i % 2 == 0) {
            controller.processAsync();
            EXPECT_TRUE(controller.wait(60.0, 0.0));
        } else {
            controller.process();
        }
    }
    bStop = true;
    canceller.join();
    controller.process();
    EXPECT_EQ(Graph::iExpected, graph.sink.result());
}

TEST_F(ControllerStressTest, ManyControllersRunAtOnce) {
    constexpr std::size_t nGraphs = 8;
    std::vector<std::unique_ptr<Graph>> apGraphs;
    for (std::size_t i = 0; i < nGraphs; ++i) {
        apGraphs.push_back(std::make_unique<Graph>());
    }
    std::mt19937 random(11);
    for (int iRound = 0; iRound < 100; ++iRound) {
        for (auto const& pGraph : apGraphs) {
            pGraph->controller.processAsync();
        }
        std::size_t const iCancelled = random() % nGraphs;
        apGraphs[iCancelled]->controller.cancelProcess();
        for (std::size_t i = 0; i < nGraphs; ++i) {
            ASSERT_TRUE(apGraphs[i]->controller.wait(60.0, 0.0));
            if (i != iCancelled) {
                ASSERT_EQ(Graph::iExpected, apGraphs[i]->sink.result());
            }
            ASSERT_TRUE(apGraphs[i]->controller.flushGraph());
        }
    }
}

TEST_F(ControllerStressTest, ControllersDieInTheMiddleOfTheirFrames) {
    std::mt19937 random(13);
    SchedulingHooks::setSliceHook(delay);
    for (int i = 0; i < 300; ++i) {
        Graph graph;
        graph.controller.processAsync();
        spin(std::chrono::nanoseconds(random() % 100000));
    }
}

TEST_F(ControllerStressTest, EveryAllocationOfAFrameMayFailInTurn) {
    Graph graph;
    Controller& controller = graph.controller;
    for (bool const bAsync : {false, true}) {
        bool bFired = true;
        int nFailed = 0;
        for (std::uint64_t n = 1; bFired; ++n) {
            bool bThrown = false;
            {
                Core::AllocationFailure const failure(n);
                try {
                    if (bAsync) {
                        controller.processAsync();
                        EXPECT_TRUE(controller.wait(60.0, 0.0));
                        controller.checkException();
                    } else {
                        controller.process();
                    }
                } catch (std::bad_alloc const&) {
                    bThrown = true;
                } catch (ExceptionBase const&) {
                    bThrown = true;
                }
                bFired = failure.hasFired();
            }
            EXPECT_EQ(bFired, bThrown) << "allocation " << n;
            nFailed += bThrown ? 1 : 0;
            ASSERT_EQ(0, static_cast<int>(controller.controllerStatus()));
            ASSERT_TRUE(controller.flushGraph());
            controller.process();
            ASSERT_EQ(Graph::iExpected, graph.sink.result()) << "after the failure of allocation " << n;
            ASSERT_TRUE(controller.flushGraph());
        }
        // The five numbers in the outputs, and the task of the asynchronous frame.
        EXPECT_EQ(bAsync ? 6 : 5, nFailed);
    }
}

} // namespace ORVO::Test
