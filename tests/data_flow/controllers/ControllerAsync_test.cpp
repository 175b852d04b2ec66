#include "orvo/core/memory/AllocationFailure.h"

#include "tests/data_flow/controllers/AsyncFrames.h"
#include "tests/data_flow/controllers/TestAccess.h"

#include <pthread.h>

#include <chrono>
#include <limits>
#include <memory>
#include <new>
#include <stdexcept>
#include <thread>

namespace ORVO::Test {

using DataFlow::internal::TestAccess;

namespace {
class ControllerAsyncTest : public AsyncFrameTest {};

/// While it lives, no thread can be started: each would need a larger stack than there are addresses.
class HugeThreadStacks {
public:
    HugeThreadStacks() {
        pthread_attr_t oHuge;
        pthread_getattr_default_np(&oDefault_);
        pthread_attr_init(&oHuge);
        pthread_attr_setstacksize(&oHuge, std::size_t(1) << 48);
        EXPECT_EQ(0, pthread_setattr_default_np(&oHuge));
        pthread_attr_destroy(&oHuge);
    }
    HugeThreadStacks(HugeThreadStacks const&) = delete;
    HugeThreadStacks& operator=(HugeThreadStacks const&) = delete;
    ~HugeThreadStacks() {
        pthread_setattr_default_np(&oDefault_);
        pthread_attr_destroy(&oDefault_);
    }

private:
    pthread_attr_t oDefault_;
};
} // namespace

TEST_F(ControllerAsyncTest, FrameRunsOnAThreadOfItsOwn) {
    Controller controller;
    Chain chain(controller, 3);
    std::thread::id frameThread;
    Signal goOn;
    chain[0].onRun_ = [&] {
        goOn.await();
        frameThread = std::this_thread::get_id();
        EXPECT_EQ(1, static_cast<int>(controller.controllerStatus()));
    };
    controller.processAsync();
    EXPECT_EQ(1, static_cast<int>(controller.controllerStatus())) << "the call returned while the frame runs";
    goOn.raise();
    waitForEnd(controller);
    EXPECT_EQ(0, static_cast<int>(controller.controllerStatus()));
    EXPECT_EQ(3, chain.sink().result());
    EXPECT_NE(std::this_thread::get_id(), frameThread);
    EXPECT_NE(std::thread::id(), frameThread);
}

TEST_F(ControllerAsyncTest, HostThatOnlyPollsTheStatusSeesTheResult) {
    Controller controller;
    Chain chain(controller, 3);
    for (int i = 0; i < 200; ++i) {
        controller.processAsync();
        while (controller.controllerStatus() != Controller::CONTROLLER_STOPPED) {
            std::this_thread::yield();
        }
        ASSERT_EQ(3, chain.sink().result());
        ASSERT_TRUE(controller.flushGraph());
    }
}

TEST_F(ControllerAsyncTest, MissingSinkIsReportedByCheckException) {
    Controller controller;
    CallbackRecord record;
    record.registerWith(controller);
    controller.processAsync();
    waitForEnd(controller);
    expectSaved<InternalException>(controller, "pSink");
    EXPECT_EQ(1, record.nCalls);
    EXPECT_EQ(0, static_cast<int>(controller.controllerStatus()));
    EXPECT_NO_THROW(controller.checkException()) << "reported once";
}

TEST_F(ControllerAsyncTest, LaunchWithoutRootFails) {
    Controller controller;
    Chain chain(controller, 2);
    auto root = TestAccess::takeRoot(controller);
    ORVO_EXPECT_INTERNAL(controller.processAsync(), "Enforce root != NULL");
    ORVO_EXPECT_INTERNAL(controller.process(), "Enforce root != NULL");
    EXPECT_EQ(0, static_cast<int>(controller.controllerStatus()));
    EXPECT_TRUE(controller.wait(1.0, 0.001));
    EXPECT_TRUE(controller.flushGraph());
    TestAccess::giveRoot(controller, std::move(root));
    controller.process();
    EXPECT_EQ(2, chain.sink().result());
}

TEST_F(ControllerAsyncTest, LaunchWithoutAThreadFails) {
    Controller controller;
    Chain chain(controller, 2);
    CallbackRecord record;
    record.registerWith(controller);
    {
        HugeThreadStacks const stacks;
        ORVO_EXPECT_RESOURCE(controller.processAsync(), "No thread could be started for the frame.");
    }
    EXPECT_EQ(0, static_cast<int>(controller.controllerStatus()));
    EXPECT_EQ(1u, TestAccess::rootCount(controller));
    EXPECT_EQ(0, record.nCalls);
    EXPECT_TRUE(controller.wait(-1.0, 1.0));
    controller.processAsync();
    waitForEnd(controller);
    EXPECT_EQ(2, chain.sink().result());
    EXPECT_EQ(1, record.nCalls);
}

TEST_F(ControllerAsyncTest, LaunchWithoutMemoryForTheTaskFails) {
    Controller controller;
    Chain chain(controller, 2);
    {
        Core::AllocationFailure const failure(1);
        ORVO_EXPECT_INTERNAL(controller.processAsync(), "Enforce new_task != NULL");
        EXPECT_TRUE(failure.hasFired());
    }
    EXPECT_EQ(0, static_cast<int>(controller.controllerStatus()));
    controller.processAsync();
    waitForEnd(controller);
    EXPECT_EQ(2, chain.sink().result());
}

// Exceptions

TEST_F(ControllerAsyncTest, FailureOfANodeIsSavedAsAClone) {
    Controller controller;
    Chain chain(controller, 3);
    chain[1].onRun_ = failInternally;
    CallbackRecord record;
    record.registerWith(controller);
    controller.processAsync();
    waitForEnd(controller);
    EXPECT_EQ(1, record.nCalls) << "completion is notified after a failure too";
    expectSaved<InternalException>(controller, "broken");
    EXPECT_TRUE(chain[1].isProcessing());
    EXPECT_EQ(0, chain[2].nRuns_);

    chain[1].onRun_ = nullptr;
    EXPECT_TRUE(controller.flushGraph());
    controller.processAsync();
    waitForEnd(controller);
    EXPECT_NO_THROW(controller.checkException());
    EXPECT_EQ(3, chain.sink().result());
}

TEST_F(ControllerAsyncTest, AfterAFailedFrameTheOtherOutputsKeepWhatTheyHold) {
    Controller controller;
    SumNode first("first", 0), second("second", 0), sink("sink", 2);
    DataFlow::Connect(first.out(), sink.in(0));
    DataFlow::Connect(second.out(), sink.in(1));
    for (SumNode* pNode : {&first, &second, &sink}) {
        controller.addNode(pNode);
    }
    controller.setSinkNode(sink);
    second.onRun_ = failInternally;
    // The second launch finds the lock of the failed node free and the node still marked.
    for (bool const bFails : {true, false}) {
        controller.processAsync();
        waitForEnd(controller);
        if (bFails) {
            expectSaved<InternalException>(controller, "broken");
        } else {
            EXPECT_NO_THROW(controller.checkException());
        }
        EXPECT_TRUE(first.out().hasData());
        EXPECT_EQ(1, first.nRuns_);
        EXPECT_FALSE(first.isProcessing());
        EXPECT_TRUE(second.isProcessing());
        EXPECT_EQ(0, sink.nRuns_);
    }
    EXPECT_TRUE(controller.flushGraph());
    EXPECT_FALSE(first.out().hasData());
    EXPECT_FALSE(second.isProcessing());
}

TEST_F(ControllerAsyncTest, ForeignFailureBecomesACPURuntimeException) {
    Controller controller;
    Chain chain(controller, 1);
    auto const failWith = [&](std::function<void()> failure) {
        controller.flushGraph();
        chain[0].onRun_ = std::move(failure);
        controller.processAsync();
        waitForEnd(controller);
        expectSharedUnknown([&] { controller.checkException(); });
    };
    failWith([] { throw std::runtime_error("text that is lost"); });
    failWith([] { throw 42; });
}

TEST_F(ControllerAsyncTest, FailureThatCannotBeCopiedIsStillReported) {
    struct Uncopyable : ExceptionBase {
        Uncopyable* clone() const override { throw std::bad_alloc(); }
    };
    Controller controller;
    Chain chain(controller, 1);
    chain[0].onRun_ = [] { throw Uncopyable(); };
    controller.processAsync();
    waitForEnd(controller);
    expectSharedUnknown([&] { controller.checkException(); });
}

TEST_F(ControllerAsyncTest, SavedExceptionIsReplacedClearedAndThrownOnce) {
    Controller controller;
    controller.saveException(new InternalException("file", 1, "first"));
    controller.saveException(new InternalException("file", 2, "second"));
    expectSaved<InternalException>(controller, "second");
    EXPECT_NO_THROW(controller.checkException());
    controller.saveException(new InternalException("file", 3, "third"));
    controller.saveException(nullptr);
    EXPECT_NO_THROW(controller.checkException());
}

TEST_F(ControllerAsyncTest, SavingAnExceptionStopsTheFrameAndSavingNullDoesNot) {
    Controller controller;
    controller.cancelProcess();
    controller.saveException(nullptr);
    EXPECT_EQ(2, static_cast<int>(controller.controllerStatus()));
    controller.saveException(new InternalException("file", 1, "text"));
    EXPECT_EQ(0, static_cast<int>(controller.controllerStatus()));
}

TEST_F(ControllerAsyncTest, SharedExceptionIsNotWrappedTwice) {
    Controller controller;
    SharedException const inner(std::make_shared<InternalException>("file", 1, "kernel"));
    controller.saveException(inner.clone());
    expectSaved<InternalException>(controller, "kernel");
}

TEST_F(ControllerAsyncTest, LaunchDropsAnOldException) {
    Controller controller;
    Chain chain(controller, 1);
    controller.saveException(new InternalException("file", 1, "old"));
    controller.processAsync();
    waitForEnd(controller);
    EXPECT_NO_THROW(controller.checkException());
}

TEST_F(ControllerAsyncTest, DestructorDropsASavedException) {
    Controller controller;
    controller.saveException(new InternalException("file", 1, "never asked for"));
}

// The body of the frame, as a host may call it

TEST_F(ControllerAsyncTest, FrameBodyRunsAFrameOnTheThreadThatCallsIt) {
    Controller controller;
    Chain chain(controller, 2);
    CallbackRecord record;
    record.registerWith(controller);
    std::thread::id frameThread;
    chain[0].onRun_ = [&] {
        frameThread = std::this_thread::get_id();
        EXPECT_EQ(1, static_cast<int>(controller.controllerStatus()));
    };
    controller.processFrameFunction();
    EXPECT_EQ(std::this_thread::get_id(), frameThread);
    EXPECT_EQ(2, chain.sink().result());
    EXPECT_EQ(1, record.nCalls);
    EXPECT_EQ(0, static_cast<int>(controller.controllerStatus()));

    controller.setSinkNode(nullptr);
    EXPECT_NO_THROW(controller.processFrameFunction());
    expectSaved<InternalException>(controller, "pSink");
    EXPECT_EQ(2, record.nCalls);
}

// Waiting

TEST_F(ControllerAsyncTest, WaitOnAnIdleControllerIsTrueAtOnce) {
    CountingController controller;
    EXPECT_TRUE(controller.wait(-1.0, 1.0));
    EXPECT_EQ(0, controller.nSleeps);
}

TEST_F(ControllerAsyncTest, WaitComparesTheSumOfItsIntervals) {
    struct Row {
        double timeout;
        double interval;
        int nSleeps;
    };
    // With timeout 1 and interval 0.5 the sums are 0, 0.5, 1 and 1.5: the fourth test fails.
    Row const aRows[] = {{-1.0, 0.5, 0}, {0.0, 0.5, 1}, {0.4, 0.5, 1}, {1.0, 0.5, 3}, {1.0, 0.25, 5}};
    CountingController controller;
    Chain chain(controller, 1);
    Signal goOn;
    chain[0].onRun_ = [&] { goOn.await(); };
    controller.processAsync();
    for (Row const& row : aRows) {
        controller.nSleeps = 0;
        controller.dSlept = 0.0;
        EXPECT_FALSE(controller.wait(row.timeout, row.interval));
        EXPECT_EQ(row.nSleeps, controller.nSleeps)
            << "timeout " << row.timeout << ", interval " << row.interval;
        EXPECT_EQ(row.nSleeps * row.interval, controller.dSlept);
        EXPECT_EQ(1, static_cast<int>(controller.controllerStatus())) << "the frame is left running";
    }
    goOn.raise();
    EXPECT_TRUE(controller.wait(1e9, 0.0));
    EXPECT_EQ(1, chain.sink().result());
}

TEST_F(ControllerAsyncTest, WaitWithIntervalZeroSpinsUntilTheEnd) {
    CountingController controller;
    Chain chain(controller, 1);
    Signal goOn;
    chain[0].onRun_ = [&] { goOn.await(); };
    controller.afterSleep = [&] {
        if (controller.nSleeps == 1000) {
            goOn.raise();
        }
        std::this_thread::yield();
    };
    controller.processAsync();
    EXPECT_TRUE(controller.wait(0.0, 0.0));
    EXPECT_GE(controller.nSleeps, 1000);
}

TEST_F(ControllerAsyncTest, WaitAfterTheEndCollectsTheFrame) {
    Controller controller;
    Chain chain(controller, 1);
    controller.processAsync();
    while (controller.controllerStatus() != Controller::CONTROLLER_STOPPED) {
        std::this_thread::yield();
    }
    EXPECT_TRUE(controller.wait(-1.0, 1.0)) << "the status is 0, so that the timeout is not looked at";
    EXPECT_EQ(1u, TestAccess::rootCount(controller));
}

TEST_F(ControllerAsyncTest, WaitDoesNotReturnBeforeTheTailOfTheFrame) {
    Controller controller;
    Chain chain(controller, 1);
    CallbackRecord record;
    std::atomic<bool> bTailDone{false};
    record.onCall = [&] {
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
        bTailDone = true;
    };
    record.registerWith(controller);
    controller.processAsync();
    waitForEnd(controller);
    EXPECT_TRUE(bTailDone);
}

TEST_F(ControllerAsyncTest, WaitInTheCallbackFindsTheFrameEnded) {
    Controller controller;
    Chain chain(controller, 1);
    CallbackRecord record;
    bool bEnded = false;
    record.onCall = [&] { bEnded = controller.wait(0.0, 0.001); };
    record.registerWith(controller);
    controller.processAsync();
    waitForEnd(controller);
    EXPECT_TRUE(bEnded);
}

TEST_F(ControllerAsyncTest, SleepTakesSecondsAndSurvivesOddNumbers) {
    Controller controller;
    auto const begin = std::chrono::steady_clock::now();
    controller.sleep(0.02);
    EXPECT_GE(std::chrono::steady_clock::now() - begin, std::chrono::milliseconds(20));
    // A sleep of the length that a careless conversion would make of these would never end.
    for (double const seconds : {0.0, -1.0, 1e-12, -std::numeric_limits<double>::infinity(),
                                 std::numeric_limits<double>::quiet_NaN()}) {
        controller.sleep(seconds);
    }
}

// Cancelling

TEST_F(ControllerAsyncTest, FrameCancelledBeforeItStartsRunsNothingAndIsStillCompleted) {
    struct Counting : Controller {
        ~Counting() override { cancelAndJoin(); }
        void processFrameFunction() override {
            ++nBodies;
            Controller::processFrameFunction();
        }
        std::atomic<int> nBodies{0};
    };
    Counting controller;
    Chain chain(controller, 3);
    CallbackRecord record;
    record.registerWith(controller);
    bHoldFrames = true;
    SchedulingHooks::setFrameHook(holdFrame);
    controller.processAsync();
    controller.cancelProcess();
    EXPECT_EQ(2, static_cast<int>(controller.controllerStatus()));
    bHoldFrames = false;
    waitForEnd(controller);
    EXPECT_EQ(0, chain.runs());
    EXPECT_EQ(0, controller.nBodies) << "it goes straight to its completion";
    EXPECT_EQ(1, record.nCalls);
    EXPECT_EQ(0, static_cast<int>(controller.controllerStatus()));

    controller.processAsync();
    waitForEnd(controller);
    EXPECT_EQ(3, chain.sink().result());
    EXPECT_EQ(1, controller.nBodies);
    EXPECT_EQ(2, record.nCalls);
}

TEST_F(ControllerAsyncTest, CancelledFrameRunsNoFurtherNodeAndKeepsNoPartialResult) {
    Controller controller;
    Chain chain(controller, 5);
    Signal running;
    Signal cancelled;
    chain[2].onRun_ = [&] {
        running.raise();
        cancelled.await();
    };
    controller.processAsync();
    running.await();
    controller.cancelProcess();
    EXPECT_EQ(2, static_cast<int>(controller.controllerStatus()));
    cancelled.raise();
    waitForEnd(controller);
    EXPECT_EQ(3, chain.runs());
    EXPECT_EQ(0, static_cast<int>(controller.controllerStatus()));
    for (std::size_t i = 0; i < chain.size(); ++i) {
        EXPECT_FALSE(chain[i].out().hasData()) << "node " << i;
    }
    controller.processAsync();
    waitForEnd(controller);
    EXPECT_EQ(5, chain.sink().result());
}

TEST_F(ControllerAsyncTest, WaitLeavesItsLoopWhenTheFrameIsCancelled) {
    CountingController controller;
    Chain chain(controller, 1);
    Signal running;
    Signal goOn;
    chain[0].onRun_ = [&] {
        running.raise();
        goOn.await();
    };
    controller.afterSleep = [&] {
        controller.cancelProcess();
        goOn.raise();
    };
    controller.processAsync();
    running.await();
    EXPECT_TRUE(controller.wait(1e9, 1.0));
    EXPECT_EQ(1, controller.nSleeps);
}

TEST_F(ControllerAsyncTest, WaitLeavesItsLoopWhenOnlyTheGroupIsCancelled) {
    CountingController controller;
    Chain chain(controller, 2);
    Signal running;
    Signal goOn;
    chain[0].onRun_ = [&] {
        running.raise();
        goOn.await();
    };
    controller.afterSleep = [&] { goOn.raise(); };
    controller.processAsync();
    running.await();
    TestAccess::cancelGroup(controller);
    EXPECT_EQ(1, static_cast<int>(controller.controllerStatus()));
    std::thread other([&] {
        std::this_thread::sleep_for(std::chrono::milliseconds(5));
        goOn.raise();
    });
    EXPECT_TRUE(controller.wait(1e9, 1.0));
    EXPECT_EQ(0, controller.nSleeps);
    other.join();
    EXPECT_FALSE(chain.sink().out().hasData()) << "the graph was flushed";
    controller.process();
    EXPECT_EQ(2, chain.sink().result());
}

TEST_F(ControllerAsyncTest, CancelWithoutWaitDoesNotSpoilTheNextFrame) {
    Controller controller;
    Chain chain(controller, 3);
    chain[1].setSlices(100);
    for (bool const bAsync : {false, true}) {
        chain[1].nItemsDone_ = 0;
        controller.processAsync();
        controller.cancelProcess();
        // No wait: the launch joins and cleans up.
        if (bAsync) {
            chain[1].nItemsDone_ = 0;
            controller.processAsync();
            while (controller.controllerStatus() != Controller::CONTROLLER_STOPPED) {
                std::this_thread::yield();
            }
        } else {
            controller.process();
        }
        EXPECT_EQ(3, chain.sink().result());
        EXPECT_GE(chain[1].nItemsDone_, 100);
    }
}

TEST_F(ControllerAsyncTest, WaitAfterACancelFlushesThroughTheSlot) {
    struct Flushing : Controller {
        bool flushGraph() override {
            ++nFlushes;
            return bAccept && Controller::flushGraph();
        }
        int nFlushes = 0;
        bool bAccept = true;
    };
    Flushing controller;
    controller.cancelProcess();
    EXPECT_TRUE(controller.wait(1.0, 0.001));
    EXPECT_EQ(1, controller.nFlushes);
    EXPECT_TRUE(controller.wait(1.0, 0.001));
    EXPECT_EQ(1, controller.nFlushes) << "nothing was cancelled any more";

    controller.cancelProcess();
    controller.bAccept = false;
    ORVO_EXPECT_INTERNAL(controller.wait(1.0, 0.001), "bGraphFlushed");
    controller.bAccept = true;
    EXPECT_TRUE(controller.wait(1.0, 0.001));
    EXPECT_EQ(0, static_cast<int>(controller.controllerStatus()));
}

TEST_F(ControllerAsyncTest, ResetWithoutACancelDoesNothing) {
    OpenController controller;
    Chain chain(controller, 1);
    controller.process();
    controller.resetIfCancelled();
    EXPECT_EQ(1, chain.sink().result()) << "not flushed";
    controller.cancelProcess();
    controller.resetIfCancelled();
    EXPECT_EQ(-1, chain.sink().result());
}

TEST_F(ControllerAsyncTest, FlushGraphDuringAFrameEndsIt) {
    Controller controller;
    Chain chain(controller, 3);
    Signal running;
    chain[0].onRun_ = [&] {
        running.raise();
        while (controller.controllerStatus() == Controller::CONTROLLER_RUNNING) {
            std::this_thread::yield();
        }
    };
    controller.processAsync();
    running.await();
    EXPECT_TRUE(controller.flushGraph());
    EXPECT_EQ(1, chain.runs());
    EXPECT_FALSE(chain[0].out().hasData());
}

TEST_F(ControllerAsyncTest, SynchronousFrameCanBeCancelledAndWaitedForFromAnotherThread) {
    Controller controller;
    Chain chain(controller, 3);
    Signal running;
    Signal cancelled;
    chain[1].onRun_ = [&] {
        running.raise();
        cancelled.await();
        std::this_thread::sleep_for(std::chrono::milliseconds(2));
    };
    std::thread other([&] {
        running.await();
        controller.cancelProcess();
        cancelled.raise();
        EXPECT_TRUE(controller.wait(60.0, 0.001));
        EXPECT_FALSE(chain[1].isProcessing()) << "the graph is flushed only after the frame";
    });
    controller.process();
    other.join();
    EXPECT_EQ(2, chain.runs());
    chain[1].onRun_ = nullptr;
    controller.process();
    EXPECT_EQ(3, chain.sink().result());
}

} // namespace ORVO::Test
