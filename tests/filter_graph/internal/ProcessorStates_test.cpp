// The states of a processor between frames: a build that failed, a graph that was dropped, and a frame that
// several threads look at.
#include <atomic>
#include <thread>

#include "orvo/filter_graph/internal/ImageFlowFilter.h"
#include "orvo/filter_graph/internal/InputAdapter.h"
#include "tests/filter_graph/support/PlainFilter.h"
#include "tests/support/Expect.h"
#include "tests/support/ExpectFilterGraph.h"
#include "tests/support/FrameTest.h"

namespace ORVO::FilterGraph {
namespace {

using namespace ORVO::Test;

/// A gain that counts its clones, and refuses to be built as often as the test says.
class StubbornFilter : public Internal::ImageFlowFilter<GainNode> {
public:
    StubbornFilter() : ImageFlowFilter(IFilter::Identifier("stubborn", "test", "ORVO", 1), ORVO_TARGET_CPU) {}

    std::shared_ptr<Filter> clone() override {
        ++nClones;
        return std::shared_ptr<Filter>(new StubbornFilter(*this));
    }

    std::shared_ptr<Internal::IFilterExecutable>
    buildFilterExecutable(TargetPlatform target, Internal::GraphExecutable& graphExecutable) override {
        if (nRefusals > 0) {
            --nRefusals;
            return nullptr;
        }
        return ImageFlowFilter::buildFilterExecutable(target, graphExecutable);
    }

    static inline int nClones = 0;
    static inline int nRefusals = 0;

protected:
    StubbornFilter(StubbornFilter const&) = default;
};

class ProcessorStatesTest : public FrameTest {
protected:
    void run() { spProcessor_->processFrame(cpuOptions()); }

    FloatImage oInput_{0, 0, 2, 2, 1, 5.0f};
    FloatImage oOutput_{2, 2};
    SourcePtr spSource_ = makeSource(oInput_);
    SinkPtr spSink_ = makeSink(oOutput_);
    std::shared_ptr<IProcessor> spProcessor_ = createProcessor(spSink_, nullptr);
};

TEST_F(ProcessorStatesTest, AFailedBuildKeepsTheClonesAndIsTriedAgain) {
    auto const spStubborn = std::make_shared<StubbornFilter>();
    spStubborn->initialize();
    Connect(spSource_, std::shared_ptr<IFilter>(spStubborn));
    Connect(spStubborn, spSink_);
    StubbornFilter::nClones = 0;
    StubbornFilter::nRefusals = 2;
    for (int attempt = 0; attempt < 2; ++attempt) {
        ORVO_EXPECT_INTERNAL(run(), "filterExecutable.get()");
        EXPECT_EQ(spProcessor_->frameStatus(), IProcessorBase::FRAME_NONE);
        ORVO_EXPECT_INTERNAL(spProcessor_->sleep(0.0), "Enforce spGraphExecutable_ != NULL");
    }
    EXPECT_EQ(StubbornFilter::nRefusals, 0);
    run();
    EXPECT_EQ(oOutput_.pixels(), std::vector<float>(4, 5.0f));
    EXPECT_EQ(StubbornFilter::nClones, 1) << "the client graph was cloned for the first attempt alone";
}

TEST_F(ProcessorStatesTest, AFrameWhoseGraphIsGoneHasNoState) {
    FilterPtr const spThrowing = makeFilter<ThrowingNode>("throwing");
    Connect(spSource_, spThrowing);
    Connect(spThrowing, spSink_);
    setParameter<int>(*spThrowing, "mode", ThrowingNode::IN_PROCESS);
    EXPECT_ANY_THROW(run());
    EXPECT_EQ(spProcessor_->frameStatus(), IProcessorBase::FRAME_RUNNING);

    Disconnect(spThrowing->input("input"));
    ORVO_EXPECT_FILTERGRAPH(run(), "throwing::input is not connected");
    ORVO_EXPECT_INTERNAL(spProcessor_->frameStatus(), "Enforce spGraphExecutable_ != NULL");

    Connect(spSource_, spThrowing);
    setParameter<int>(*spThrowing, "mode", ThrowingNode::QUIET);
    run();
    EXPECT_EQ(spProcessor_->frameStatus(), IProcessorBase::FRAME_COMPLETE);
    EXPECT_EQ(oOutput_.pixels(), std::vector<float>(4, 5.0f));
}

TEST_F(ProcessorStatesTest, TheCloneOfAnAdapterIsAnAdapter) {
    /// A copy of any filter that is no adapter.
    class Copy : public PlainFilter {
    public:
        explicit Copy(Filter const& other) { assign(other); }
    };
    class OddSource : public Internal::InputAdapter {
    public:
        OddSource() : InputAdapter(REGION_SYNC_FROM_IMAGE) {}
        std::shared_ptr<Filter> clone() override { return std::make_shared<Copy>(*this); }
    };
    auto const spOdd = std::make_shared<OddSource>();
    spOdd->setImage(oInput_.handle());
    Connect(std::shared_ptr<IInputAdapter>(spOdd), spSink_);
    ORVO_EXPECT_INTERNAL(run(), "Enforce adapterClone != NULL");
}

TEST_F(ProcessorStatesTest, SeveralThreadsMayPollAndCancelAFrame) {
    FilterPtr const spSlow = makeFilter<SlowNode>("slow");
    Connect(spSource_, spSlow);
    Connect(spSlow, spSink_);
    setParameter(*spSlow, "microseconds", 200);
    for (int frame = 0; frame < 10; ++frame) {
        spProcessor_->asyncProcessFrame(cpuOptions());
        std::atomic<int> nComplete{0};
        auto const poll = [&](bool bCancels) {
            if (bCancels) {
                spProcessor_->cancelFrame();
            }
            while (spProcessor_->frameStatus() != IProcessorBase::FRAME_COMPLETE) {
                std::this_thread::yield();
            }
            ++nComplete;
        };
        std::thread one(poll, false);
        std::thread two(poll, frame % 2 == 1);
        one.join();
        two.join();
        EXPECT_EQ(nComplete, 2);
        EXPECT_EQ(spProcessor_->waitForFrame(60.0, 0.0005), IProcessorBase::FRAME_COMPLETE);
    }
}

} // namespace
} // namespace ORVO::FilterGraph
