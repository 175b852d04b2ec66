// When the output images of a frame's nodes are allocated, and by whom.
#include <algorithm>
#include <mutex>
#include <thread>

#include "orvo/filter_graph/impl/FilterGraphLibrary.h"
#include "tests/support/FrameTest.h"

namespace ORVO::FilterGraph {
namespace {

using namespace ORVO::Test;

/// Writes down what the nodes do: the number "id", and whether it is an allocation or a slice.
class LoggingNode : public GainNode {
public:
    struct Event {
        int id;
        bool isAllocation;
        std::thread::id oThread;
    };

    void allocateOutputImage() override {
        log(true);
        GainNode::allocateOutputImage();
    }

    void processSlice(std::size_t begin, std::size_t end) override {
        log(false);
        GainNode::processSlice(begin, end);
    }

    static inline std::mutex oLock;
    static inline std::vector<Event> aEvents;

private:
    void log(bool isAllocation) {
        std::lock_guard<std::mutex> const lock(oLock);
        aEvents.push_back({oId_.value(), isAllocation, std::this_thread::get_id()});
    }
};

/// source -> 1 -> 2 -> sink
class AllocationModeTest : public testing::TestWithParam<Library::eAllocationMode> {
protected:
    AllocationModeTest() {
        setParameter(*spFirst_, "id", 1);
        setParameter(*spSecond_, "id", 2);
        Connect(spSource_, spFirst_);
        Connect(spFirst_, spSecond_);
        Connect(spSecond_, spSink_);
        LoggingNode::aEvents.clear();
    }

    /// The place of the first event of this kind.
    static std::ptrdiff_t first(int id, bool isAllocation) {
        auto const& aEvents = LoggingNode::aEvents;
        return std::find_if(aEvents.begin(), aEvents.end(),
                            [&](LoggingNode::Event const& event) {
                                return event.id == id && event.isAllocation == isAllocation;
                            }) -
               aEvents.begin();
    }

    /// Whether node 2 had its image before node 1 computed anything.
    static bool allocatedBeforeAnythingRan() { return first(2, true) < first(1, false); }

    void expectOutput() { EXPECT_EQ(oOutput_.pixels(), std::vector<float>(6, 3.0f)); }

    ImageFlowLayers oLayers_;
    AutoInitializer oFilterGraph_{Library::InitializationOptions(GetParam())};
    FloatImage oInput_{0, 0, 3, 2, 1, 3.0f};
    FloatImage oOutput_{3, 2};
    SourcePtr spSource_ = makeSource(oInput_);
    FilterPtr spFirst_ = makeFilter<LoggingNode>();
    FilterPtr spSecond_ = makeFilter<LoggingNode>();
    SinkPtr spSink_ = makeSink(oOutput_);
    std::shared_ptr<IProcessor> spProcessor_ = createProcessor(spSink_, nullptr);
};

TEST_P(AllocationModeTest, HasNoEffectOnASynchronousFrame) {
    spProcessor_->processFrame(cpuOptions());
    expectOutput();
    EXPECT_FALSE(allocatedBeforeAnythingRan());
}

TEST_P(AllocationModeTest, DecidesWhichThreadAllocatesForAnAsynchronousFrame) {
    spProcessor_->asyncProcessFrame(cpuOptions());
    EXPECT_EQ(spProcessor_->waitForFrame(60.0, 0.0005), IProcessorBase::FRAME_COMPLETE);
    expectOutput();
    bool const bBeforeLaunch = GetParam() == Library::ALLOCATE_BEFORE_LAUNCH;
    EXPECT_EQ(allocatedBeforeAnythingRan(), bBeforeLaunch);
    for (int const id : {1, 2}) {
        LoggingNode::Event const& event = LoggingNode::aEvents.at(static_cast<std::size_t>(first(id, true)));
        EXPECT_EQ(event.oThread == std::this_thread::get_id(), bBeforeLaunch) << id;
    }
}

INSTANTIATE_TEST_SUITE_P(BothModes, AllocationModeTest,
                         testing::Values(Library::ALLOCATE_ON_DEMAND, Library::ALLOCATE_BEFORE_LAUNCH));

} // namespace
} // namespace ORVO::FilterGraph
