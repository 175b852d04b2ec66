// Asynchronous frames: status, polling, waiting, callbacks, cancellation, failures, and what a host may do
// meanwhile.
#include <atomic>
#include <chrono>
#include <random>
#include <stdexcept>
#include <thread>

#include "orvo/core/exceptions/CPURuntimeException.h"
#include "orvo/core/exceptions/SharedException.h"
#include "orvo/data_flow/controllers/Controller.h"
#include "orvo/filter_graph/impl/FilterGraphLibrary.h"
#include "orvo/filter_graph/internal/Processor.h"
#include "tests/support/Expect.h"
#include "tests/support/FrameTest.h"

namespace ORVO::FilterGraph {
namespace {

using namespace ORVO::Test;

constexpr double kLong = 60.0; // seconds, far beyond what any frame here takes

/// source -> add -> slow -> throwing -> sink; every row is a slice.
class AsyncFramesTest : public FrameTest {
protected:
    AsyncFramesTest() {
        SlowNode::openGate();
        oInput_.pixels().assign(oInput_.pixels().size(), 1.0f);
        Connect(spSource_, spAdd_);
        Connect(spAdd_, spSlow_);
        Connect(spSlow_, spThrowing_);
        Connect(spThrowing_, spSink_);
    }

    ~AsyncFramesTest() override { SlowNode::openGate(); }

    void launch() { pHandle_ = spProcessor_->asyncProcessFrame(cpuOptions()); }
    IProcessorBase::eFrameStatus wait() { return spProcessor_->waitForFrame(kLong, 0.0005); }

    void compute() {
        oOutput_.pixels().assign(oOutput_.pixels().size(), -1.0f);
        launch();
        EXPECT_EQ(wait(), IProcessorBase::FRAME_COMPLETE);
    }

    /// Launches a frame and returns once a slice of the slow node is held at the gate.
    void launchAndHold() {
        int const nBegun = SlowNode::slicesBegun();
        SlowNode::closeGate();
        launch();
        while (SlowNode::slicesBegun() == nBegun) {
            std::this_thread::yield();
        }
    }

    std::vector<float> filled(float value) const {
        return std::vector<float>(oOutput_.pixels().size(), value);
    }

    FloatImage oInput_{3, 16};
    FloatImage oOutput_{3, 16};
    SourcePtr spSource_ = makeSource(oInput_);
    FilterPtr spAdd_ = makeFilter<AddConstantNode>("add");
    FilterPtr spSlow_ = makeFilter<SlowNode>("slow");
    FilterPtr spThrowing_ = makeFilter<ThrowingNode>("throwing");
    SinkPtr spSink_ = makeSink(oOutput_);
    std::shared_ptr<IProcessor> spProcessor_ = createProcessor(spSink_, nullptr);
    void* pHandle_ = nullptr;
};

TEST_F(AsyncFramesTest, RunsToItsEnd) {
    compute();
    EXPECT_TRUE(pHandle_);
    EXPECT_EQ(oOutput_.pixels(), filled(2.0f));
}

TEST_F(AsyncFramesTest, ReadsAsRunningUntilTheEndIsSeen) {
    launchAndHold();
    EXPECT_EQ(spProcessor_->frameStatus(), IProcessorBase::FRAME_RUNNING);
    EXPECT_EQ(spProcessor_->waitForFrame(0.001, 0.001), IProcessorBase::FRAME_RUNNING);
    EXPECT_EQ(spProcessor_->waitForFrame(-1.0, 0.001), IProcessorBase::FRAME_RUNNING);
    SlowNode::openGate();
    EXPECT_EQ(wait(), IProcessorBase::FRAME_COMPLETE);
    EXPECT_EQ(spProcessor_->frameStatus(), IProcessorBase::FRAME_COMPLETE);
}

TEST_F(AsyncFramesTest, ThePixelsAreThereForAHostThatOnlyPolls) {
    for (int frame = 0; frame < 50; ++frame) {
        setParameter(*spAdd_, "value", static_cast<float>(frame));
        launch();
        while (spProcessor_->frameStatus() != IProcessorBase::FRAME_COMPLETE) {
            spProcessor_->sleep(0.0001);
        }
        ASSERT_EQ(oOutput_.pixels(), filled(1.0f + static_cast<float>(frame)));
    }
}

TEST_F(AsyncFramesTest, ALaunchWaitsForTheFrameBeforeIt) {
    compute();
    setParameter(*spSlow_, "microseconds", 200);
    for (int frame = 0; frame < 20; ++frame) {
        setParameter(*spAdd_, "value", static_cast<float>(frame));
        launch();
    }
    EXPECT_EQ(wait(), IProcessorBase::FRAME_COMPLETE);
    EXPECT_EQ(oOutput_.pixels(), filled(20.0f));
}

TEST_F(AsyncFramesTest, ASynchronousFrameWaitsForTheAsynchronousOne) {
    compute();
    setParameter(*spSlow_, "microseconds", 500);
    launch();
    setParameter(*spAdd_, "value", 4.0f);
    spProcessor_->processFrame(cpuOptions());
    EXPECT_EQ(oOutput_.pixels(), filled(5.0f));
}

TEST_F(AsyncFramesTest, ARebuildWaitsForTheFrame) {
    compute();
    setParameter(*spSlow_, "microseconds", 500);
    launch();
    auto const spGain = makeFilter<GainNode>();
    setParameter(*spGain, "gain", 10.0f);
    Connect(spSource_, spGain);
    Connect(spGain, spAdd_);
    launch();
    EXPECT_EQ(wait(), IProcessorBase::FRAME_COMPLETE);
    EXPECT_EQ(oOutput_.pixels(), filled(11.0f));
}

// ---- Callbacks

struct CallbackRecord {
    std::atomic<int> nCalls{0};
    std::atomic<void*> pHandle{nullptr};
    std::atomic<int> eStatusInside{0};
    std::atomic<bool> bOnAnotherThread{false};
    std::thread::id oHost;
    IProcessorBase* pProcessor = nullptr;
    std::string sRefusal;
    OptimizationOptions oOptions = cpuOptions();
}* pRecord = nullptr;

TEST_F(AsyncFramesTest, TheCallbackGetsTheHandleAndStillSeesARunningFrame) {
    CallbackRecord record;
    pRecord = &record;
    record.oHost = std::this_thread::get_id();
    record.pProcessor = spProcessor_.get();
    compute();
    spProcessor_->setCompletionCallback([](void* pHandle) {
        pRecord->pHandle = pHandle;
        pRecord->bOnAnotherThread = std::this_thread::get_id() != pRecord->oHost;
        pRecord->eStatusInside = pRecord->pProcessor->frameStatus();
        ++pRecord->nCalls;
        return false; // ignored
    });
    compute();
    EXPECT_EQ(record.nCalls, 1);
    EXPECT_EQ(record.pHandle, pHandle_);
    EXPECT_EQ(record.eStatusInside, IProcessorBase::FRAME_RUNNING);
    EXPECT_TRUE(record.bOnAnotherThread);

    spProcessor_->processFrame(cpuOptions());
    EXPECT_EQ(record.nCalls, 1) << "no callback on the synchronous road";
    spProcessor_->setCompletionCallback(nullptr);
    compute();
    EXPECT_EQ(record.nCalls, 1);
}

TEST_F(AsyncFramesTest, ACallbackThatThrowsEndsTheFrameAndIsReported) {
    compute();
    spProcessor_->setCompletionCallback([](void*) -> bool { throw std::runtime_error("from the callback"); });
    launch();
    try {
        wait();
        ADD_FAILURE() << "nothing was reported";
    } catch (SharedException const& exception) {
        auto const* const pCarried = dynamic_cast<CPURuntimeException const*>(exception.exception().get());
        ASSERT_TRUE(pCarried);
        EXPECT_EQ(pCarried->condition(), CPURuntimeException::CONDITION_UNKNOWN);
    }
    EXPECT_EQ(spProcessor_->frameStatus(), IProcessorBase::FRAME_COMPLETE);
    EXPECT_EQ(oOutput_.pixels(), filled(2.0f));
    spProcessor_->setCompletionCallback(nullptr);
    compute();
}

TEST_F(AsyncFramesTest, ALaunchFromWithinTheCallbackIsRefused) {
    CallbackRecord record;
    pRecord = &record;
    record.pProcessor = spProcessor_.get();
    compute();
    spProcessor_->setCompletionCallback([](void*) {
        try {
            dynamic_cast<IProcessor&>(*pRecord->pProcessor).asyncProcessFrame(pRecord->oOptions);
        } catch (InternalException const& exception) {
            pRecord->sRefusal = exception.message();
        }
        return true;
    });
    compute();
    EXPECT_EQ(record.sRefusal, "The completion callback must not change the frame that it ends");
    EXPECT_EQ(oOutput_.pixels(), filled(2.0f));
}

// ---- Cancelling

TEST_F(AsyncFramesTest, ACancelledFrameReadsAsCancelledUntilItHasStopped) {
    launchAndHold();
    EXPECT_EQ(spProcessor_->cancelFrame(), IProcessorBase::FRAME_CANCELLED);
    EXPECT_EQ(spProcessor_->frameStatus(), IProcessorBase::FRAME_CANCELLED);
    SlowNode::openGate();
    EXPECT_EQ(wait(), IProcessorBase::FRAME_COMPLETE);
}

TEST_F(AsyncFramesTest, AfterACancelTheNextFrameIsRightWhetherOrNotItWasWaitedFor) {
    compute();
    for (int round = 0; round < 6; ++round) {
        setParameter(*spAdd_, "value", 1.0f + static_cast<float>(round));
        launchAndHold();
        spProcessor_->cancelFrame();
        SlowNode::openGate();
        if (round % 3 == 0) {
            wait();
        } else if (round % 3 == 1) {
            while (spProcessor_->frameStatus() != IProcessorBase::FRAME_COMPLETE) {
            }
        }
        if (round % 2 == 0) {
            compute();
        } else {
            spProcessor_->processFrame(cpuOptions());
        }
        ASSERT_EQ(oOutput_.pixels(), filled(2.0f + static_cast<float>(round)));
    }
}

TEST_F(AsyncFramesTest, ACancelWithoutAFrameDoesNotSpoilTheNextOne) {
    compute();
    spProcessor_->cancelFrame();
    EXPECT_EQ(spProcessor_->frameStatus(), IProcessorBase::FRAME_COMPLETE);
    setParameter(*spAdd_, "value", 8.0f);
    compute();
    EXPECT_EQ(oOutput_.pixels(), filled(9.0f));
    spProcessor_->cancelFrame();
    spProcessor_->processFrame(cpuOptions());
    EXPECT_EQ(oOutput_.pixels(), filled(9.0f));
}

TEST_F(AsyncFramesTest, TheCallbackIsAlsoCalledForACancelledFrame) {
    CallbackRecord record;
    pRecord = &record;
    compute();
    spProcessor_->setCompletionCallback([](void*) {
        ++pRecord->nCalls;
        return true;
    });
    launchAndHold();
    spProcessor_->cancelFrame();
    SlowNode::openGate();
    EXPECT_EQ(wait(), IProcessorBase::FRAME_COMPLETE);
    EXPECT_EQ(record.nCalls, 1);
}

TEST_F(AsyncFramesTest, ASynchronousFrameIsCancelledFromAnotherThread) {
    compute();
    int const nBegun = SlowNode::slicesBegun();
    SlowNode::closeGate();
    std::thread canceller([&] {
        while (SlowNode::slicesBegun() == nBegun) {
            std::this_thread::yield();
        }
        spProcessor_->cancelFrame();
        SlowNode::openGate();
    });
    spProcessor_->processFrame(cpuOptions());
    canceller.join();
    setParameter(*spAdd_, "value", 3.0f);
    spProcessor_->processFrame(cpuOptions());
    EXPECT_EQ(oOutput_.pixels(), filled(4.0f));
}

TEST_F(AsyncFramesTest, ManyFramesCancelledAtRandomMoments) {
    std::minstd_rand random(1);
    for (int frame = 0; frame < 10000; ++frame) {
        bool const bChange = random() % 2 == 0;
        if (bChange) {
            setParameter(*spAdd_, "value", static_cast<float>(frame));
        }
        launch();
        auto const until = std::chrono::steady_clock::now() + std::chrono::microseconds(random() % 60);
        while (std::chrono::steady_clock::now() < until) {
        }
        spProcessor_->cancelFrame();
        if (random() % 3 == 0) {
            ASSERT_EQ(wait(), IProcessorBase::FRAME_COMPLETE);
        }
        if (frame % 50 == 0) {
            // Right after the cancel: the cancelled frame may still write into the host's image, so only a
            // value that no frame before had tells this frame's result.
            setParameter(*spAdd_, "value", static_cast<float>(frame) + 0.5f);
            launch();
            ASSERT_EQ(wait(), IProcessorBase::FRAME_COMPLETE);
            ASSERT_EQ(oOutput_.pixels(), filled(1.5f + static_cast<float>(frame))) << "after frame " << frame;
        }
    }
}

// ---- Dying early

/// A slow node that tells which controller runs it.
class TellingNode : public SlowNode {
public:
    void processSlice(std::size_t begin, std::size_t end) override {
        pRunning = controller();
        SlowNode::processSlice(begin, end);
    }

    static inline std::atomic<DataFlow::Controller*> pRunning{nullptr};
};

TEST_F(AsyncFramesTest, TheProcessorMayDieDuringAFrame) {
    FilterPtr const spTelling = makeFilter<TellingNode>("telling");
    DisconnectAll(spSlow_.get());
    Connect(spAdd_, spTelling);
    Connect(spTelling, spThrowing_);
    launchAndHold();
    // The gate opens when the frame was cancelled; until then the held slice keeps the controller alive.
    std::thread opener([] {
        while (TellingNode::pRunning.load()->controllerStatus() !=
               DataFlow::Controller::CONTROLLER_CANCELLED) {
            std::this_thread::yield();
        }
        SlowNode::openGate();
    });
    spProcessor_.reset();
    opener.join();
    EXPECT_NE(oOutput_.pixels(), filled(2.0f)) << "the frame was cancelled, not run to its end";
}

TEST_F(AsyncFramesTest, TheProcessorMayDieRightAfterALaunch) {
    for (int round = 0; round < 200; ++round) {
        spProcessor_ = createProcessor(spSink_, nullptr);
        launch();
    }
}

// ---- Failures

struct Failure {
    ThrowingNode::eMode eMode;
    char const* sText; // null: a foreign exception, whose text is lost on a worker
};

class FailingFramesTest : public AsyncFramesTest, public testing::WithParamInterface<Failure> {};

TEST_P(FailingFramesTest, AnAsynchronousFrameReportsItsFailureOnceAndTheNextFrameIsRight) {
    compute();
    for (bool const bPolls : {true, false}) {
        setParameter<int>(*spThrowing_, "mode", GetParam().eMode);
        launch();
        std::string sReported;
        try {
            while (bPolls && spProcessor_->frameStatus() == IProcessorBase::FRAME_RUNNING) {
            }
            wait();
        } catch (SharedException const& exception) {
            sReported = exception.what();
            std::exception const* pCarried = exception.exception().get();
            // A slice's failure is carried to the frame's thread, and from there to the host.
            while (auto const* const pShared = dynamic_cast<SharedException const*>(pCarried)) {
                pCarried = pShared->exception().get();
            }
            if (GetParam().sText) {
                auto const* const pInternal = dynamic_cast<InternalException const*>(pCarried);
                ASSERT_TRUE(pInternal);
                EXPECT_STREQ(pInternal->message(), GetParam().sText);
            } else {
                auto const* const pRuntime = dynamic_cast<CPURuntimeException const*>(pCarried);
                ASSERT_TRUE(pRuntime);
                EXPECT_EQ(pRuntime->condition(), CPURuntimeException::CONDITION_UNKNOWN);
            }
        }
        EXPECT_FALSE(sReported.empty());
        EXPECT_EQ(wait(), IProcessorBase::FRAME_COMPLETE) << "a failure is reported once";

        setParameter<int>(*spThrowing_, "mode", ThrowingNode::QUIET);
        compute();
        EXPECT_EQ(oOutput_.pixels(), filled(2.0f));
    }
}

TEST_P(FailingFramesTest, AFailureThatNobodyAskedForDoesNotComeOutOfTheNextFrame) {
    compute();
    for (bool const bSynchronous : {true, false}) {
        setParameter<int>(*spThrowing_, "mode", GetParam().eMode);
        launch();
        setParameter<int>(*spThrowing_, "mode", ThrowingNode::QUIET);
        setParameter(*spAdd_, "value", bSynchronous ? 5.0f : 6.0f);
        if (bSynchronous) {
            spProcessor_->processFrame(cpuOptions());
        } else {
            compute();
        }
        EXPECT_EQ(oOutput_.pixels(), filled(bSynchronous ? 6.0f : 7.0f));
    }
}

TEST_P(FailingFramesTest, ASynchronousFrameThrowsAndTheNextFrameIsRight) {
    for (int round = 0; round < 3; ++round) {
        setParameter<int>(*spThrowing_, "mode", GetParam().eMode);
        EXPECT_ANY_THROW(spProcessor_->processFrame(cpuOptions()));
        EXPECT_EQ(spProcessor_->frameStatus(), IProcessorBase::FRAME_RUNNING);
        setParameter<int>(*spThrowing_, "mode", ThrowingNode::QUIET);
        oOutput_.pixels().assign(oOutput_.pixels().size(), -1.0f);
        if (round == 1) {
            compute();
        } else {
            spProcessor_->processFrame(cpuOptions());
        }
        EXPECT_EQ(spProcessor_->frameStatus(), IProcessorBase::FRAME_COMPLETE);
        EXPECT_EQ(oOutput_.pixels(), filled(2.0f));
    }
}

/// A slow node of which one slice has failed when the others are still held, and fail in their turn.
class FailingTwiceNode : public SlowNode {
public:
    void processSlice(std::size_t begin, std::size_t end) override {
        controller()->saveException(new InternalException(__FILE__, __LINE__, "the first failure"));
        SlowNode::processSlice(begin, end);
        throw InternalException(__FILE__, __LINE__, "a later failure");
    }
};

TEST_F(AsyncFramesTest, AFailureIsReportedWhenNoSliceRunsAnyMore) {
    FilterPtr const spFailing = makeFilter<FailingTwiceNode>("failing");
    DisconnectAll(spSlow_.get());
    Connect(spAdd_, spFailing);
    Connect(spFailing, spThrowing_);
    launchAndHold();
    EXPECT_EQ(spProcessor_->frameStatus(), IProcessorBase::FRAME_RUNNING);
    SlowNode::openGate();
    EXPECT_THROW(wait(), SharedException);
    EXPECT_EQ(wait(), IProcessorBase::FRAME_COMPLETE) << "a failure is reported once";
}

INSTANTIATE_TEST_SUITE_P(AllKinds, FailingFramesTest,
                         testing::Values(Failure{ThrowingNode::IN_PROCESS, "thrown in process"},
                                         Failure{ThrowingNode::IN_SLICE, "thrown in slice"},
                                         Failure{ThrowingNode::FOREIGN_IN_SLICE, nullptr},
                                         Failure{ThrowingNode::FOREIGN_IN_PROCESS, nullptr}));

} // namespace
} // namespace ORVO::FilterGraph
