#include "orvo/core/exceptions/CPURuntimeException.h"
#include "orvo/core/exceptions/SharedException.h"
#include "orvo/core/memory/AllocationFailure.h"
#include "orvo/data_flow/controllers/Controller.h"
#include "orvo/data_flow/controllers/SchedulingHooks.h"

#include "tests/data_flow/controllers/TestAccess.h"
#include "tests/data_flow/controllers/TestNodes.h"
#include "tests/support/DataFlowLayers.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>
#include <tbb/parallel_for.h>
#include <tbb/task_group.h>

#include <chrono>
#include <limits>
#include <new>
#include <stdexcept>
#include <thread>

namespace ORVO::Test {

using DataFlow::Controller;
using DataFlow::internal::SchedulingHooks;
using DataFlow::internal::TestAccess;

namespace {

class ControllerAsyncTest : public ::testing::Test, protected DataFlowLayers {
protected:
    ~ControllerAsyncTest() override { SchedulingHooks::setFrameHook(nullptr); }
};

/// Fails the test instead of hanging it.
void waitForEnd(Controller& controller) { ASSERT_TRUE(controller.wait(60.0, 0.0002)); }

void failInternally() { ORVO_FAIL("broken"); }

/// The exception that checkException() throws must be a SharedException around an `Exception`; gives its
/// text.
template <typename Exception>
std::string sharedText(Controller& controller) {
    try {
        controller.checkException();
    } catch (SharedException const& shared) {
        auto const* pInner = dynamic_cast<Exception const*>(shared.exception().get());
        return pInner != nullptr ? pInner->message() : std::string("another class: ") + shared.what();
    }
    return "nothing was thrown";
}

/// Counts its sleeps and does not sleep.
struct CountingController : Controller {
    void sleep(double seconds) override {
        ++nSleeps;
        dSlept += seconds;
        if (afterSleep) {
            afterSleep();
        }
    }
    int nSleeps = 0;
    double dSlept = 0.0;
    std::function<void()> afterSleep;
};

struct CallbackRecord {
    Controller* pController = nullptr;
    std::atomic<int> nCalls{0};
    std::atomic<int> iStatus{-1};
    std::thread::id oThread;
    std::function<void()> onCall;

    static bool call(void* pData) {
        auto& record = *static_cast<CallbackRecord*>(pData);
        record.iStatus = static_cast<int>(record.pController->controllerStatus());
        record.oThread = std::this_thread::get_id();
        ++record.nCalls;
        if (record.onCall) {
            record.onCall();
        }
        return false;
    }
    void registerWith(Controller& controller) {
        pController = &controller;
        ASSERT_TRUE(controller.registerProcessingCompletedCallback(&CallbackRecord::call, this));
    }
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
    EXPECT_EQ("pSink", sharedText<InternalException>(controller));
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
    EXPECT_EQ("broken", sharedText<InternalException>(controller));
    EXPECT_TRUE(chain[1].isProcessing());
    EXPECT_EQ(0, chain[2].nRuns_);

    chain[1].onRun_ = nullptr;
    EXPECT_TRUE(controller.flushGraph());
    controller.processAsync();
    waitForEnd(controller);
    EXPECT_NO_THROW(controller.checkException());
    EXPECT_EQ(3, chain.sink().result());
}

TEST_F(ControllerAsyncTest, ForeignFailureBecomesACPURuntimeException) {
    Controller controller;
    Chain chain(controller, 1);
    auto const failWith = [&](std::function<void()> failure) {
        controller.flushGraph();
        chain[0].onRun_ = std::move(failure);
        controller.processAsync();
        waitForEnd(controller);
        try {
            controller.checkException();
            ADD_FAILURE() << "nothing was thrown";
        } catch (SharedException const& shared) {
            auto const* pInner = dynamic_cast<CPURuntimeException const*>(shared.exception().get());
            ASSERT_NE(nullptr, pInner);
            EXPECT_EQ(6, static_cast<int>(pInner->condition()));
        }
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
    try {
        controller.checkException();
        ADD_FAILURE() << "nothing was thrown";
    } catch (SharedException const& shared) {
        auto const* pInner = dynamic_cast<CPURuntimeException const*>(shared.exception().get());
        ASSERT_NE(nullptr, pInner);
        EXPECT_EQ(6, static_cast<int>(pInner->condition()));
    }
}

TEST_F(ControllerAsyncTest, SavedExceptionIsReplacedClearedAndThrownOnce) {
    Controller controller;
    controller.saveException(new InternalException("file", 1, "first"));
    controller.saveException(new InternalException("file", 2, "second"));
    EXPECT_EQ("second", sharedText<InternalException>(controller));
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
    EXPECT_EQ("kernel", sharedText<InternalException>(controller));
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
    for (double const seconds : {0.0, -1.0, 1e-12, -std::numeric_limits<double>::infinity(),
                                 std::numeric_limits<double>::quiet_NaN()}) {
        controller.sleep(seconds);
    }
    EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(10));
}

// Cancelling

namespace {
std::atomic<bool> bHoldFrames{false};
void holdFrame() {
    while (bHoldFrames) {
        std::this_thread::yield();
    }
}
} // namespace

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

// The completion callback

TEST_F(ControllerAsyncTest, CallbackRunsOnTheFramesThreadWithItsArgument) {
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

TEST_F(ControllerAsyncTest, SynchronousFrameCallsNoCallback) {
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

TEST_F(ControllerAsyncTest, CallbackThatThrowsStillCompletesTheFrame) {
    Controller controller;
    Chain chain(controller, 1);
    CallbackRecord record;
    record.registerWith(controller);
    record.onCall = failInternally;
    controller.processAsync();
    waitForEnd(controller);
    EXPECT_EQ(0, static_cast<int>(controller.controllerStatus()));
    EXPECT_EQ("broken", sharedText<InternalException>(controller));
    EXPECT_EQ(1, chain.sink().result());
    EXPECT_EQ(1, record.nCalls);

    record.onCall = [] { throw std::runtime_error("lost"); };
    controller.processAsync();
    waitForEnd(controller);
    EXPECT_THROW(controller.checkException(), SharedException);
    EXPECT_EQ(2, record.nCalls);
}

TEST_F(ControllerAsyncTest, CallbackMayLaunchTheNextFrame) {
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

TEST_F(ControllerAsyncTest, CallbackMayRunAFrameAtOnce) {
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

TEST_F(ControllerAsyncTest, CallbackOfACancelledFrameMayLaunchTheNext) {
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

TEST_F(ControllerAsyncTest, LaunchJoinsTheTailOfTheOldFrame) {
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

TEST_F(ControllerAsyncTest, CallbackSetAfterTheEndIsNotCalledForTheOldFrame) {
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

TEST_F(ControllerAsyncTest, FrameBodyThatFailsOutsideTheBaseIsSavedAndCompletedOnce) {
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
    EXPECT_EQ("before", sharedText<InternalException>(controller));
    EXPECT_EQ(1, record.nCalls);
    EXPECT_EQ(0, static_cast<int>(controller.controllerStatus()));

    controller.bBefore = false;
    controller.processAsync();
    waitForEnd(controller);
    EXPECT_EQ("after", sharedText<InternalException>(controller));
    EXPECT_EQ(2, record.nCalls);
    EXPECT_EQ(1, chain.sink().result());
}

TEST_F(ControllerAsyncTest, NotificationThatFailsIsSaved) {
    struct Failing : Controller {
        ~Failing() override { cancelAndJoin(); }
        void notifyOfCompletion() override { ORVO_FAIL("mute"); }
    };
    Failing controller;
    Chain chain(controller, 1);
    controller.processAsync();
    waitForEnd(controller);
    EXPECT_EQ("mute", sharedText<InternalException>(controller));
    EXPECT_EQ(1, chain.sink().result());
}

// Several at a time

TEST_F(ControllerAsyncTest, CancelLeavesAnotherControllerAlone) {
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

TEST_F(ControllerAsyncTest, FramesThatWaitForEachOtherAllGetAThread) {
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

TEST_F(ControllerAsyncTest, FrameEndsWhileItsHostWaitsInsideATask) {
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

TEST_F(ControllerAsyncTest, DestructorCancelsAndJoinsAFrameThatRuns) {
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

TEST_F(ControllerAsyncTest, CancelAndJoinLetsADerivedClassDie) {
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
