// How many threads work on a frame, and what they are given.
#include <chrono>
#include <mutex>
#include <set>
#include <thread>

#include "orvo/data_flow/controllers/Controller.h"
#include "orvo/filter_graph/impl/FilterGraphLibrary.h"
#include "tests/support/FrameTest.h"

namespace ORVO::FilterGraph {
namespace {

using namespace ORVO::Test;

/// Writes down the slices and the threads that they run on.
class RecordingNode : public GainNode {
public:
    void processSlice(std::size_t begin, std::size_t end) override {
        {
            std::lock_guard<std::mutex> const lock(oLock);
            oThreads.insert(std::this_thread::get_id());
            nSlices += 1;
            nRows += end - begin;
        }
        std::this_thread::sleep_for(std::chrono::microseconds(300));
        GainNode::processSlice(begin, end);
    }

    static void reset() {
        oThreads.clear();
        nSlices = 0;
        nRows = 0;
    }

    static inline std::mutex oLock;
    static inline std::set<std::thread::id> oThreads;
    static inline std::size_t nSlices = 0;
    static inline std::size_t nRows = 0;
};

class ThreadsTest : public FrameTest {
protected:
    ThreadsTest() {
        Connect(spSource_, spNode_);
        Connect(spNode_, spSink_);
        RecordingNode::reset();
    }

    ~ThreadsTest() override {
        setNumberOfThreads(nThreads_);
        DataFlow::Controller::setMinimumGrainSize(nGrain_);
    }

    std::size_t nThreads_ = DataFlow::Controller::getNumberOfThreads();
    std::size_t nGrain_ = DataFlow::Controller::getMinimumGrainSize();
    FloatImage oInput_{0, 0, 4, 64, 1, 2.0f};
    FloatImage oOutput_{4, 64};
    SourcePtr spSource_ = makeSource(oInput_);
    FilterPtr spNode_ = makeFilter<RecordingNode>();
    SinkPtr spSink_ = makeSink(oOutput_);
    std::shared_ptr<IProcessor> spProcessor_ = createProcessor(spSink_, nullptr);
};

TEST_F(ThreadsTest, NoMoreThreadsThanTheHostAllowsWorkOnAFrame) {
    for (std::size_t const nThreads : {1u, 2u, 8u}) {
        setNumberOfThreads(nThreads);
        RecordingNode::reset();
        spProcessor_->processFrame(cpuOptions());
        EXPECT_EQ(RecordingNode::nRows, 64u);
        EXPECT_GE(RecordingNode::oThreads.size(), 1u);
        EXPECT_LE(RecordingNode::oThreads.size(), nThreads);
        EXPECT_EQ(oOutput_.pixels(), std::vector<float>(256, 2.0f));
    }
}

TEST_F(ThreadsTest, OneThreadIsTheCallersOwn) {
    setNumberOfThreads(1);
    spProcessor_->processFrame(cpuOptions());
    EXPECT_EQ(RecordingNode::oThreads, std::set<std::thread::id>{std::this_thread::get_id()});
}

TEST_F(ThreadsTest, SingleThreadModeRunsAllRowsInOneCallOfTheCaller) {
    OptimizationOptions options = cpuOptions();
    options.setDebuggingMode(OptimizationOptions::DEBUGGING_SINGLE_THREAD);
    spProcessor_->processFrame(options);
    EXPECT_EQ(RecordingNode::nSlices, 1u);
    EXPECT_EQ(RecordingNode::nRows, 64u);
    EXPECT_EQ(RecordingNode::oThreads, std::set<std::thread::id>{std::this_thread::get_id()});
}

TEST_F(ThreadsTest, AnUnknownDebuggingModeIsTheThreadedRun) {
    OptimizationOptions options = cpuOptions();
    options.setDebuggingMode(static_cast<OptimizationOptions::eDebuggingMode>(2));
    spProcessor_->processFrame(options);
    EXPECT_GT(RecordingNode::nSlices, 1u);
}

TEST_F(ThreadsTest, TheGrainIsCountedInPixels) {
    DataFlow::Controller::setMinimumGrainSize(4 * 32); // half of the rows
    spProcessor_->processFrame(cpuOptions());
    EXPECT_LE(RecordingNode::nSlices, 4u);
    EXPECT_EQ(RecordingNode::nRows, 64u);
}

TEST_F(ThreadsTest, AnAsynchronousFrameRunsOnAnotherThread) {
    setNumberOfThreads(1);
    spProcessor_->asyncProcessFrame(cpuOptions());
    spProcessor_->waitForFrame(60.0, 0.001);
    ASSERT_EQ(RecordingNode::oThreads.size(), 1u);
    EXPECT_NE(*RecordingNode::oThreads.begin(), std::this_thread::get_id());
}

} // namespace
} // namespace ORVO::FilterGraph
