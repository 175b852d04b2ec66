#include "orvo/data_flow/controllers/Controller.h"
#include "orvo/data_flow/controllers/SchedulingHooks.h"

#include "tests/data_flow/controllers/SharedFailure.h"
#include "tests/data_flow/controllers/TestNodes.h"
#include "tests/support/DataFlowLayers.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>
#include <tbb/global_control.h>
#include <tbb/info.h>
#include <tbb/parallel_for.h>
#include <tbb/partitioner.h>
#include <tbb/task_arena.h>

#include <algorithm>
#include <chrono>
#include <set>
#include <stdexcept>
#include <thread>

namespace ORVO::Test {

using DataFlow::Controller;
using DataFlow::internal::SchedulingHooks;

namespace {

class ControllerSlicesTest : public ::testing::Test, protected DataFlowLayers {
protected:
    ~ControllerSlicesTest() override { SchedulingHooks::setSliceHook(nullptr); }

    /// A sliced node alone in a controller.
    Controller controller;
    SumNode node{"sliced", 0};

    void SetUp() override {
        controller.addNode(&node);
        controller.setSinkNode(node);
    }
    void frame() {
        ASSERT_TRUE(controller.flushGraph());
        node.nItemsDone_ = 0;
        controller.process();
    }
};

/// Slices as they come from several threads.
class SliceRecord {
public:
    struct Slice {
        std::size_t begin;
        std::size_t end;
        std::thread::id oThread;
    };

    void add(std::size_t begin, std::size_t end) {
        std::lock_guard const lock(oLock_);
        aSlices_.push_back({begin, end, std::this_thread::get_id()});
    }
    std::vector<Slice> take() {
        std::lock_guard const lock(oLock_);
        std::sort(aSlices_.begin(), aSlices_.end(),
                  [](Slice const& a, Slice const& b) { return a.begin < b.begin; });
        return std::exchange(aSlices_, {});
    }

private:
    std::mutex oLock_;
    std::vector<Slice> aSlices_;
};

/// The slices must be the items [0, nItems), each once.
void expectCovered(std::vector<SliceRecord::Slice> const& aSlices, std::size_t nItems) {
    std::size_t iNext = 0;
    for (auto const& slice : aSlices) {
        ASSERT_EQ(iNext, slice.begin);
        ASSERT_LT(slice.begin, slice.end);
        iNext = slice.end;
    }
    EXPECT_EQ(nItems, iNext);
}

/// Counts how many threads are inside at a time. A thread stays until as many are there as are expected, or
/// for a while.
class Crowd {
public:
    explicit Crowd(int nExpected) : nExpected_(nExpected) {}
    void visit() {
        int const nInside = ++nInside_;
        int nMost = nMost_;
        while (nInside > nMost && !nMost_.compare_exchange_weak(nMost, nInside)) {
        }
        auto const end =
            std::chrono::steady_clock::now() + std::chrono::milliseconds(nMost_ < nExpected_ ? 50 : 1);
        while (std::chrono::steady_clock::now() < end && (nMost_ < nExpected_ || nInside_ <= nExpected_)) {
            std::this_thread::yield();
        }
        --nInside_;
    }
    int most() const { return nMost_; }

private:
    int nExpected_;
    std::atomic<int> nInside_{0};
    std::atomic<int> nMost_{0};
};

} // namespace

TEST_F(ControllerSlicesTest, EveryItemIsProcessedOnce) {
    SettingsScope const settings;
    SliceRecord record;
    node.onSlice_ = [&](std::size_t begin, std::size_t end) { record.add(begin, end); };
    for (std::size_t const nThreads : {1u, 2u, 8u}) {
        Controller::setNumberOfThreads(nThreads);
        for (std::size_t const nItems : {1u, 2u, 7u, 16u, 17u, 33u, 1080u}) {
            node.setSlices(nItems);
            frame();
            expectCovered(record.take(), nItems);
        }
    }
}

TEST_F(ControllerSlicesTest, EmptyRangesCallNoSliceButReportASavedException) {
    struct Row {
        std::size_t nItems;
        std::size_t nUnits;
    };
    node.onSlice_ = [](std::size_t, std::size_t) { ADD_FAILURE() << "a slice was run"; };
    for (Row const& row : {Row{0, 0}, Row{0, 100}, Row{100, 0}}) {
        node.setSlices(row.nItems, row.nUnits);
        frame();
        controller.saveException(new InternalException("file", 1, "saved"));
        EXPECT_THROW(controller.processSlices(&node), SharedException);
        EXPECT_NO_THROW(controller.processSlices(&node));
    }
}

TEST_F(ControllerSlicesTest, NullNodeIsRefused) {
    ORVO_EXPECT_INTERNAL(controller.processSlices(nullptr), "Enforce pNode != NULL");
}

TEST_F(ControllerSlicesTest, NodeThatReportsItemsMustOverrideProcessSlice) {
    struct Careless : DataFlow::Node {
        Careless() : Node("careless") {}
        BlockedRange rangeToProcess() override {
            BlockedRange range;
            range.items = 4;
            range.unitsPerItem = 1;
            return range;
        }
        void internalProcess() override { controller()->processSlices(this); }
    };
    Careless careless;
    controller.addNode(&careless);
    controller.setSinkNode(careless);
    expectShared<InternalException>([&] { controller.process(); }, "0");
}

// Grain

TEST_F(ControllerSlicesTest, GrainIsGivenInWorkUnits) {
    struct Row {
        std::size_t nMinimum;
        std::size_t nUnits;
        std::size_t nGrain;
    };
    // nGrain = max(1, nMinimum / nUnits)
    Row const aRows[] = {{1, 1, 1},       {0, 1000, 1},    {1, 1000, 1},      {999, 1000, 1},
                         {1999, 1000, 1}, {2000, 1000, 2}, {65536, 1000, 65}, {7, 1, 7}};
    SettingsScope const settings;
    SliceRecord record;
    node.onSlice_ = [&](std::size_t begin, std::size_t end) { record.add(begin, end); };
    constexpr std::size_t nItems = 640;
    for (Row const& row : aRows) {
        Controller::setMinimumGrainSize(row.nMinimum);
        node.setSlices(nItems, row.nUnits);
        frame();
        auto const aSlices = record.take();
        expectCovered(aSlices, nItems);
        for (auto const& slice : aSlices) {
            // Splitting in halves leaves no less than half a grain.
            EXPECT_GE(slice.end - slice.begin, std::max<std::size_t>(1, row.nGrain / 2))
                << row.nMinimum << " over " << row.nUnits;
        }
        // A range of one grain is not cut, one item more is.
        node.setSlices(row.nGrain, row.nUnits);
        frame();
        EXPECT_EQ(1u, record.take().size()) << row.nMinimum << " over " << row.nUnits;
        node.setSlices(row.nGrain + 1, row.nUnits);
        frame();
        EXPECT_EQ(2u, record.take().size()) << row.nMinimum << " over " << row.nUnits;
    }
}

TEST_F(ControllerSlicesTest, RangeOfOneGrainIsOneSliceOnTheFramesThread) {
    SettingsScope const settings;
    Controller::setMinimumGrainSize(64 * 100);
    SliceRecord record;
    node.onSlice_ = [&](std::size_t begin, std::size_t end) { record.add(begin, end); };
    node.setSlices(64, 100);
    frame();
    auto aSlices = record.take();
    ASSERT_EQ(1u, aSlices.size());
    EXPECT_EQ(std::this_thread::get_id(), aSlices[0].oThread);
    node.setSlices(65, 100);
    frame();
    EXPECT_GT(record.take().size(), 1u);
}

// Threads

TEST_F(ControllerSlicesTest, OneThreadMeansTheFramesOwn) {
    SettingsScope const settings;
    for (std::size_t const nThreads : {0u, 1u}) {
        Controller::setNumberOfThreads(nThreads);
        SliceRecord record;
        node.onSlice_ = [&](std::size_t begin, std::size_t end) { record.add(begin, end); };
        node.setSlices(500);
        frame();
        auto const aSlices = record.take();
        expectCovered(aSlices, 500);
        for (auto const& slice : aSlices) {
            EXPECT_EQ(std::this_thread::get_id(), slice.oThread);
        }
    }
}

TEST_F(ControllerSlicesTest, NumberOfThreadsIsHonouredExactly) {
    // More workers than the machine may have processors, so that fewer can be asked for.
    tbb::global_control const workers(tbb::global_control::max_allowed_parallelism, 5);
    tbb::task_arena arena(5);
    SettingsScope const settings;
    for (int const nThreads : {2, 3, 5}) {
        Controller::setNumberOfThreads(static_cast<std::size_t>(nThreads));
        Crowd crowd(nThreads);
        node.onSlice_ = [&](std::size_t, std::size_t) { crowd.visit(); };
        node.setSlices(64);
        // Workers may wake up late where the machine is busy.
        for (int i = 0; i < 20 && crowd.most() < nThreads; ++i) {
            arena.execute([&] { frame(); });
            EXPECT_EQ(64, node.nItemsDone_);
        }
        EXPECT_EQ(nThreads, crowd.most());
    }
}

TEST_F(ControllerSlicesTest, AsynchronousFrameUsesSeveralThreads) {
    int const nThreads = std::min(2, tbb::info::default_concurrency());
    Crowd crowd(nThreads);
    node.onSlice_ = [&](std::size_t, std::size_t) { crowd.visit(); };
    node.setSlices(64);
    controller.processAsync();
    ASSERT_TRUE(controller.wait(60.0, 0.0005));
    EXPECT_GE(crowd.most(), nThreads);
}

TEST_F(ControllerSlicesTest, SingleThreadModeRunsAllItemsInOneCall) {
    controller.setSingleThreadMode(true);
    SliceRecord record;
    node.onSlice_ = [&](std::size_t begin, std::size_t end) { record.add(begin, end); };
    node.setSlices(1000);
    frame();
    auto aSlices = record.take();
    ASSERT_EQ(1u, aSlices.size());
    EXPECT_EQ(0u, aSlices[0].begin);
    EXPECT_EQ(1000u, aSlices[0].end);
    EXPECT_EQ(std::this_thread::get_id(), aSlices[0].oThread);

    controller.setSingleThreadMode(false);
    frame();
    EXPECT_GT(record.take().size(), 1u);
}

TEST_F(ControllerSlicesTest, WaitingForSlicesTakesUpNoWorkOfTheHost) {
    // A host runs frames inside a loop of its own. While one of its iterations waits for the last slices of
    // its frame, it must not begin another iteration: that could need a lock which its own thread holds
    // further out.
    struct Graph {
        Controller controller;
        SumNode node{"sliced", 0};
    };
    SettingsScope const settings;
    Controller::setNumberOfThreads(64);
    tbb::global_control const workers(tbb::global_control::max_allowed_parallelism, 4);
    tbb::task_arena arena(4);
    std::vector<std::unique_ptr<Graph>> apGraphs;
    for (int i = 0; i < 96; ++i) {
        apGraphs.push_back(std::make_unique<Graph>());
        Graph& graph = *apGraphs.back();
        graph.controller.addNode(&graph.node);
        graph.controller.setSinkNode(graph.node);
        graph.node.setSlices(8);
        graph.node.onSlice_ = [](std::size_t begin, std::size_t) {
            std::this_thread::sleep_for(std::chrono::microseconds(begin % 3 * 200));
        };
    }
    static thread_local bool bInside = false;
    std::atomic<int> nNested{0};
    auto const iteration = [&](std::size_t i) {
        nNested += bInside ? 1 : 0;
        bInside = true;
        apGraphs[i]->controller.process();
        bInside = false;
    };
    constexpr int nRounds = 5;
    for (int iRound = 0; iRound < nRounds; ++iRound) {
        arena.execute([&] {
            tbb::parallel_for(std::size_t(0), apGraphs.size(), iteration, tbb::simple_partitioner());
        });
        for (auto const& pGraph : apGraphs) {
            EXPECT_TRUE(pGraph->controller.flushGraph());
        }
    }
    EXPECT_EQ(0, nNested);
    for (auto const& pGraph : apGraphs) {
        EXPECT_EQ(8 * nRounds, pGraph->node.nItemsDone_);
    }
}

// Failures

TEST_F(ControllerSlicesTest, FailureInASliceComesBackAsASharedException) {
    node.setSlices(500);
    node.onSlice_ = [](std::size_t begin, std::size_t end) {
        if (begin <= 250 && 250 < end) {
            ORVO_FAIL("item 250");
        }
    };
    expectShared<InternalException>([&] { controller.process(); }, "item 250");
    EXPECT_EQ(0, static_cast<int>(controller.controllerStatus()));
    EXPECT_NO_THROW(controller.checkException());
    EXPECT_FALSE(node.out().hasData());

    // The next launch clears the cancelled group: every slice runs again.
    node.onSlice_ = nullptr;
    frame();
    EXPECT_EQ(500, node.nItemsDone_);
    EXPECT_EQ(1, node.result());
}

TEST_F(ControllerSlicesTest, FailureInASliceOfAnAsynchronousFrameIsReportedOnce) {
    node.setSlices(500);
    node.onSlice_ = [](std::size_t, std::size_t) { ORVO_FAIL_PARAMETER("kernel"); };
    controller.processAsync();
    ASSERT_TRUE(controller.wait(60.0, 0.0005));
    expectShared<ParameterException>([&] { controller.checkException(); }, "kernel");
    EXPECT_NO_THROW(controller.checkException());
    node.onSlice_ = nullptr;
    frame();
    EXPECT_EQ(500, node.nItemsDone_);
}

TEST_F(ControllerSlicesTest, ForeignFailureInASliceBecomesACPURuntimeException) {
    node.setSlices(8);
    for (bool const bStandard : {true, false}) {
        node.onSlice_ = [bStandard](std::size_t, std::size_t) {
            if (bStandard) {
                throw std::runtime_error("lost");
            }
            throw 1;
        };
        expectSharedUnknown([&] { frame(); });
    }
}

TEST_F(ControllerSlicesTest, FailuresInTwoSlicesAtOnceGiveOneException) {
    tbb::global_control const workers(tbb::global_control::max_allowed_parallelism, 2);
    tbb::task_arena arena(2);
    std::atomic<int> nThrown{0};
    node.setSlices(2);
    // A worker that wakes up late finds its slice cancelled by the failure of the other.
    for (int i = 0; i < 100 && nThrown < 2; ++i) {
        Crowd crowd(2);
        nThrown = 0;
        node.onSlice_ = [&](std::size_t begin, std::size_t) {
            crowd.visit();
            ++nThrown;
            ORVO_FAIL(begin == 0 ? "slice 0" : "slice 1");
        };
        EXPECT_TRUE(controller.flushGraph());
        EXPECT_THROW(arena.execute([&] { controller.process(); }), SharedException);
        EXPECT_NO_THROW(controller.checkException());
        EXPECT_EQ(0, static_cast<int>(controller.controllerStatus()));
    }
    EXPECT_EQ(2, nThrown);
}

TEST_F(ControllerSlicesTest, FailureCancelsTheSlicesThatHaveNotStarted) {
    struct Recording : Controller {
        void cancelProcess() override {
            ++nCancels;
            Controller::cancelProcess();
        }
        std::atomic<int> nCancels{0};
    };
    Recording recording;
    SumNode sliced("sliced", 0);
    recording.addNode(&sliced);
    recording.setSinkNode(sliced);
    std::atomic<int> nStarted{0};
    sliced.setSlices(100000);
    sliced.onSlice_ = [&](std::size_t, std::size_t) {
        ++nStarted;
        ORVO_FAIL("at once");
    };
    EXPECT_THROW(recording.process(), SharedException);
    EXPECT_EQ(nStarted, recording.nCancels);
    EXPECT_LE(nStarted, static_cast<int>(std::thread::hardware_concurrency()) + 1);
    EXPECT_EQ(0, sliced.nItemsDone_);
}

TEST_F(ControllerSlicesTest, CancelThatFailsStillStopsTheSlicesAndKeepsTheFailure) {
    struct Failing : Controller {
        void cancelProcess() override { throw std::runtime_error("cancel"); }
    };
    Failing failing;
    SumNode sliced("sliced", 0);
    failing.addNode(&sliced);
    failing.setSinkNode(sliced);
    sliced.setSlices(100000);
    sliced.onSlice_ = [](std::size_t, std::size_t) { ORVO_FAIL("kernel"); };
    expectShared<InternalException>([&] { failing.process(); }, "kernel");
    EXPECT_EQ(0, sliced.nItemsDone_);
}

TEST_F(ControllerSlicesTest, SingleThreadModePassesAFailureOnAsItIs) {
    struct Recording : Controller {
        void cancelProcess() override { ++nCancels; }
        int nCancels = 0;
    };
    Recording recording;
    recording.setSingleThreadMode(true);
    SumNode sliced("sliced", 0);
    recording.addNode(&sliced);
    recording.setSinkNode(sliced);
    sliced.setSlices(10);
    sliced.onSlice_ = [](std::size_t, std::size_t) { ORVO_FAIL("direct"); };
    ORVO_EXPECT_INTERNAL(recording.process(), "direct");
    EXPECT_EQ(0, recording.nCancels);
    EXPECT_NO_THROW(recording.checkException());
}

// Cancelling

TEST_F(ControllerSlicesTest, CancelSkipsTheSlicesThatHaveNotStarted) {
    SettingsScope const settings;
    for (std::size_t const nThreads : {1u, 2u}) {
        Controller::setNumberOfThreads(nThreads);
        Signal running;
        Signal cancelled;
        node.setSlices(100000);
        node.onSlice_ = [&](std::size_t, std::size_t) {
            running.raise();
            cancelled.await();
        };
        ASSERT_TRUE(controller.flushGraph());
        node.nItemsDone_ = 0;
        controller.processAsync();
        running.await();
        controller.cancelProcess();
        cancelled.raise();
        ASSERT_TRUE(controller.wait(60.0, 0.0005));
        EXPECT_GT(node.nItemsDone_, 0) << "running slices finish";
        EXPECT_LT(node.nItemsDone_, 100000) << "the others are skipped";
        EXPECT_FALSE(node.out().hasData());

        node.onSlice_ = nullptr;
        frame();
        EXPECT_EQ(100000, node.nItemsDone_);
    }
}

namespace {
std::atomic<int> nHookCalls{0};
void countCall() { ++nHookCalls; }
void failInHook() { throw std::runtime_error("hook"); }
} // namespace

TEST_F(ControllerSlicesTest, SliceHookRunsBeforeEverySlice) {
    SliceRecord record;
    node.onSlice_ = [&](std::size_t begin, std::size_t end) { record.add(begin, end); };
    node.setSlices(300);
    nHookCalls = 0;
    SchedulingHooks::setSliceHook(countCall);
    frame();
    EXPECT_EQ(record.take().size(), static_cast<std::size_t>(nHookCalls));
    SchedulingHooks::setSliceHook(failInHook);
    EXPECT_THROW(frame(), SharedException);
}

} // namespace ORVO::Test
