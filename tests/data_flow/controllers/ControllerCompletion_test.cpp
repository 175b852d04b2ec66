#include "orvo/core/exceptions/InternalException.h"

#include "tests/data_flow/controllers/AsyncFrames.h"

#include <tbb/task_group.h>

#include <atomic>
#include <chrono>
#include <memory>
#include <stdexcept>
#include <thread>

namespace ORVO::Test {

namespace {
class ControllerCompletionTest : public AsyncFrameTest {};
} // namespace

// The completion callback

TEST_F(ControllerCompletionTest, CallbackRunsOnTheFramesThreadWithItsArgument) {
    Controller controller;
    Chain chain(controller, 1);
    std::thread::id frameThread;
    chain[0].onRun_ = [&] { frameThread = std::this_thread::get_id(); };
    CallbackRecord record;
    record.registerWith(controller);
    controller.processAsync();
    waitForEnd(controller);
    EXPECT_EQ(1, record.nCalls);
    EXPECT_EQ(frameThread, record.oThread);
    EXPECT_EQ(0, record.iStatus) << "the frame was stopped before the callback";
    EXPECT_EQ(0, static_cast<int>(controller.controllerStatus()));

    ASSERT_TRUE(controller.registerProcessingCompletedCallback(nullptr, nullptr));
    controller.flushGraph();
    controller.processAsync();
    waitForEnd(controller);
    EXPECT_EQ(1, record.nCalls);
}

TEST_F(ControllerCompletionTest, SynchronousFrameCallsNoCallback) {
    Controller controller;
    Chain chain(controller, 1);
    CallbackRecord record;
    record.registerWith(controller);
    controller.process();
    EXPECT_EQ(0, record.nCalls);
    controller.cancelProcess();
    controller.notifyOfCompletion();
    EXPECT_EQ(1, record.nCalls);
    EXPECT_EQ(2, record.iStatus);
    EXPECT_EQ(0, static_cast<int>(controller.controllerStatus())) << "stop() runs after the callback";
    controller.wait(1.0, 0.001);
}

TEST_F(ControllerCompletionTest, CallbackThatThrowsStillCompletesTheFrame) {
    Controller controller;
    Chain chain(controller, 1);
    CallbackRecord record;
    record.registerWith(controller);
    record.onCall = failInternally;
    controller.processAsync();
    waitForEnd(controller);
    EXPECT_EQ(0, static_cast<int>(controller.controllerStatus()));
    expectSaved<InternalException>(controller, "broken");
    EXPECT_EQ(1, chain.sink().result());
    EXPECT_EQ(1, record.nCalls);

    record.onCall = [] { throw std::runtime_error("lost"); };
    controller.processAsync();
    waitForEnd(controller);
    EXPECT_THROW(controller.checkException(), SharedException);
    EXPECT_EQ(2, record.nCalls);
}

TEST_F(ControllerCompletionTest, CallbackMayLaunchTheNextFrame) {
    constexpr int nFrames = 12;
    Controller controller;
    Chain chain(controller, 4);
    // Long enough for the tail of the frame before, which must not end this one.
    chain[1].onRun_ = [] { std::this_thread::sleep_for(std::chrono::milliseconds(2)); };
    CallbackRecord record;
    Signal allDone;
    record.onCall = [&] {
        EXPECT_EQ(4, chain.sink().result());
        if (record.nCalls == nFrames) {
            allDone.raise();
            return;
        }
        EXPECT_TRUE(controller.flushGraph());
        controller.processAsync();
    };
    record.registerWith(controller);
    controller.processAsync();
    allDone.await();
    waitForEnd(controller);
    EXPECT_EQ(nFrames, record.nCalls);
    EXPECT_EQ(4 * nFrames, chain.runs());
}

TEST_F(ControllerCompletionTest, CallbackMayRunAFrameAtOnce) {
    Controller controller;
    Chain chain(controller, 2);
    CallbackRecord record;
    record.onCall = [&] {
        EXPECT_TRUE(controller.flushGraph());
        controller.process();
    };
    record.registerWith(controller);
    controller.processAsync();
    waitForEnd(controller);
    EXPECT_EQ(4, chain.runs());
    EXPECT_EQ(2, chain.sink().result());
}

TEST_F(ControllerCompletionTest, CallbackOfACancelledFrameMayLaunchTheNext) {
    Controller controller;
    Chain chain(controller, 3);
    CallbackRecord record;
    Signal launched;
    record.onCall = [&] {
        if (record.nCalls == 1) {
            controller.processAsync();
            launched.raise();
        }
    };
    record.registerWith(controller);
    bHoldFrames = true;
    SchedulingHooks::setFrameHook(holdFrame);
    controller.processAsync();
    controller.cancelProcess();
    bHoldFrames = false;
    launched.await();
    waitForEnd(controller);
    EXPECT_EQ(2, record.nCalls);
    EXPECT_EQ(3, chain.sink().result());
}

TEST_F(ControllerCompletionTest, LaunchJoinsTheTailOfTheOldFrame) {
    // The host launches as soon as it has seen the completion, while the old frame has still to call its last
    // stop(). That stop falls into the middle of the new frame, unless the launch waits for it.
    Controller controller;
    Chain chain(controller, 3);
    chain[1].onRun_ = [] { std::this_thread::sleep_for(std::chrono::milliseconds(2)); };
    CallbackRecord record;
    std::atomic<int> nSeen{0};
    record.onCall = [&] {
        ++nSeen;
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    };
    record.registerWith(controller);
    for (int i = 1; i <= 20; ++i) {
        controller.processAsync();
        while (nSeen < i) {
            std::this_thread::yield();
        }
        ASSERT_EQ(3, chain.sink().result()) << "frame " << i << " was stopped by the tail of another";
        chain.sink().flushOutputs();
        if (i % 2 == 0) {
            controller.process();
            ASSERT_EQ(3, chain.sink().result()) << "the frame after " << i << " was stopped by its tail";
            chain.sink().flushOutputs();
        }
    }
    waitForEnd(controller);
    EXPECT_EQ(20, record.nCalls);
}

TEST_F(ControllerCompletionTest, CallbackSetAfterTheEndIsNotCalledForTheOldFrame) {
    struct Slow : Controller {
        ~Slow() override { cancelAndJoin(); }
        void notifyOfCompletion() override {
            ended.raise();
            goOn.await();
            Controller::notifyOfCompletion();
        }
        Signal ended;
        Signal goOn;
    };
    Slow controller;
    Chain chain(controller, 1);
    CallbackRecord old;
    CallbackRecord fresh;
    old.registerWith(controller);
    controller.processAsync();
    controller.ended.await();
    fresh.registerWith(controller);
    controller.goOn.raise();
    waitForEnd(controller);
    EXPECT_EQ(1, old.nCalls);
    EXPECT_EQ(0, fresh.nCalls);
    controller.processAsync();
    waitForEnd(controller);
    EXPECT_EQ(1, old.nCalls);
    EXPECT_EQ(1, fresh.nCalls);
}

// Overrides that fail

TEST_F(ControllerCompletionTest, FrameBodyThatFailsOutsideTheBaseIsSavedAndCompletedOnce) {
    struct Failing : Controller {
        ~Failing() override { cancelAndJoin(); }
        void processFrameFunction() override {
            if (bBefore) {
                ORVO_FAIL("before");
            }
            Controller::processFrameFunction();
            ORVO_FAIL("after");
        }
        bool bBefore = true;
    };
    Failing controller;
    Chain chain(controller, 1);
    CallbackRecord record;
    record.registerWith(controller);
    controller.processAsync();
    waitForEnd(controller);
    expectSaved<InternalException>(controller, "before");
    EXPECT_EQ(1, record.nCalls);
    EXPECT_EQ(0, static_cast<int>(controller.controllerStatus()));

    controller.bBefore = false;
    controller.processAsync();
    waitForEnd(controller);
    expectSaved<InternalException>(controller, "after");
    EXPECT_EQ(2, record.nCalls);
    EXPECT_EQ(1, chain.sink().result());
}

TEST_F(ControllerCompletionTest, NotificationThatFailsIsSaved) {
    struct Failing : Controller {
        ~Failing() override { cancelAndJoin(); }
        void notifyOfCompletion() override { ORVO_FAIL("mute"); }
    };
    Failing controller;
    Chain chain(controller, 1);
    controller.processAsync();
    waitForEnd(controller);
    expectSaved<InternalException>(controller, "mute");
    EXPECT_EQ(1, chain.sink().result());
}

// Several at a time

TEST_F(ControllerCompletionTest, CancelLeavesAnotherControllerAlone) {
    Controller cancelled;
    Controller other;
    Chain cancelledChain(cancelled, 2);
    Chain otherChain(other, 2);
    Signal running;
    Signal goOn;
    cancelledChain[0].onRun_ = [&] {
        running.raise();
        goOn.await();
    };
    otherChain[0].onRun_ = [&] { goOn.await(); };
    otherChain[1].setSlices(1000);
    cancelled.processAsync();
    other.processAsync();
    running.await();
    cancelled.cancelProcess();
    goOn.raise();
    waitForEnd(other);
    waitForEnd(cancelled);
    EXPECT_EQ(2, otherChain.sink().result());
    EXPECT_EQ(1000, otherChain[1].nItemsDone_);
    EXPECT_EQ(-1, cancelledChain.sink().result());
}

TEST_F(ControllerCompletionTest, FramesThatWaitForEachOtherAllGetAThread) {
    constexpr std::size_t nFrames = 12;
    std::vector<std::unique_ptr<Controller>> apControllers;
    std::vector<std::unique_ptr<Chain>> apChains;
    std::vector<std::unique_ptr<Signal>> apStarted;
    for (std::size_t i = 0; i < nFrames; ++i) {
        apStarted.push_back(std::make_unique<Signal>());
    }
    for (std::size_t i = 0; i < nFrames; ++i) {
        apControllers.push_back(std::make_unique<Controller>());
        apChains.push_back(std::make_unique<Chain>(*apControllers[i], 1));
        (*apChains[i])[0].onRun_ = [&, i] {
            apStarted[i]->raise();
            apStarted[(i + 1) % nFrames]->await();
        };
    }
    for (auto const& pController : apControllers) {
        pController->processAsync();
    }
    for (std::size_t i = 0; i < nFrames; ++i) {
        waitForEnd(*apControllers[i]);
        EXPECT_EQ(1, apChains[i]->sink().result());
    }
}

TEST_F(ControllerCompletionTest, FrameEndsWhileItsHostWaitsInsideATask) {
    tbb::task_group group;
    std::atomic<int> nRight{0};
    for (int i = 0; i < 8; ++i) {
        group.run([&] {
            Controller controller;
            SumNode node("node", 0);
            node.setSlices(200);
            controller.addNode(&node);
            controller.setSinkNode(node);
            controller.processAsync();
            if (controller.wait(60.0, 0.0002) && node.result() == 1 && node.nItemsDone_ == 200) {
                ++nRight;
            }
        });
        group.wait(); // nodes are made by one thread at a time
    }
    EXPECT_EQ(8, nRight);
}

TEST_F(ControllerCompletionTest, DestructorCancelsAndJoinsAFrameThatRuns) {
    CallbackRecord record;
    std::atomic<bool> bLeft{false};
    auto pController = std::make_unique<Controller>();
    Controller& controller = *pController;
    Chain chain(controller, 4);
    Signal running;
    chain[1].onRun_ = [&] {
        running.raise();
        while (controller.controllerStatus() == Controller::CONTROLLER_RUNNING) {
            std::this_thread::yield();
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(2));
        bLeft = true;
    };
    record.registerWith(controller);
    controller.processAsync();
    running.await();
    pController.reset();
    EXPECT_TRUE(bLeft);
    EXPECT_EQ(2, chain.runs());
    EXPECT_EQ(1, record.nCalls);
}

TEST_F(ControllerCompletionTest, CancelAndJoinLetsADerivedClassDie) {
    struct Derived : Controller {
        ~Derived() override { cancelAndJoin(); }
        void notifyOfCompletion() override {
            ++*pNotified;
            Controller::notifyOfCompletion();
        }
        std::atomic<int>* pNotified = nullptr;
    };
    std::atomic<int> nNotified{0};
    for (int i = 0; i < 100; ++i) {
        SumNode node("node", 0);
        Derived controller;
        controller.pNotified = &nNotified;
        controller.addNode(&node);
        controller.setSinkNode(node);
        controller.processAsync();
    }
    EXPECT_EQ(100, nNotified);
}

} // namespace ORVO::Test
