// The order of calls of an embedded processor, and the regions that its host sets and learns.
#include "tests/support/Expect.h"
#include "tests/support/FrameTest.h"

namespace ORVO::FilterGraph {
namespace {

using namespace ORVO::Test;

PositionExtentInWorldSpace world(float x, float y, float width, float height) {
    return {PositionInWorldSpace(x, y), ExtentInWorldSpace(width, height)};
}

/// source -> blur of radius 1 -> sink on 8 by 8 pixels, with the regions that the host sets.
class EmbeddedProcessorTest : public FrameTest {
protected:
    EmbeddedProcessorTest() {
        oInput_.pixels().assign(64, 9.0f);
        spSource_->setDomainOfDefinition(world(0.0f, 0.0f, 8.0f, 8.0f));
        spSink_->setRegionOfInterest(world(2.0f, 2.0f, 4.0f, 3.0f));
        Connect(spSource_, spBlur_);
        Connect(spBlur_, spSink_);
    }

    FloatImage oInput_{8, 8};
    FloatImage oOutput_{8, 8};
    SourcePtr spSource_ = makeSource(oInput_, IAdapter::REGION_SYNC_EXPLICIT);
    FilterPtr spBlur_ = makeFilter<BlurNode>("blur");
    SinkPtr spSink_ = makeSink(oOutput_, IAdapter::REGION_SYNC_EXPLICIT);
    std::shared_ptr<IEmbeddedProcessor> spProcessor_ = createEmbeddedProcessor(spSink_, nullptr);
};

TEST_F(EmbeddedProcessorTest, LearnsRegionsWithoutRunningAnything) {
    spProcessor_->prepareForProcessing(cpuOptions());
    spProcessor_->propagateDomainsOfDefinition();
    EXPECT_EQ(spSink_->getDomainOfDefinition(), world(-1.0f, -1.0f, 10.0f, 10.0f));
    spProcessor_->propagateRegionOfInterest();
    EXPECT_EQ(spSource_->getRegionOfInterest(), world(1.0f, 1.0f, 6.0f, 5.0f));
    EXPECT_EQ(oOutput_.pixels(), std::vector<float>(64, 0.0f));
    EXPECT_EQ(spProcessor_->frameStatus(), IProcessorBase::FRAME_NONE);
}

TEST_F(EmbeddedProcessorTest, WritesTheRegionOfInterestAlone) {
    oOutput_.pixels().assign(64, -1.0f);
    spProcessor_->processFrameEmbedded(cpuOptions());
    EXPECT_EQ(spProcessor_->frameStatus(), IProcessorBase::FRAME_COMPLETE);
    for (int y = 0; y < 8; ++y) {
        for (int x = 0; x < 8; ++x) {
            bool const bInside = x >= 2 && x < 6 && y >= 2 && y < 5;
            EXPECT_EQ(oOutput_.at(x, y), bInside ? 9.0f : -1.0f) << x << ", " << y;
        }
    }
}

TEST_F(EmbeddedProcessorTest, RegionsMayChangeFromFrameToFrame) {
    spProcessor_->processFrameEmbedded(cpuOptions());
    spSink_->setRegionOfInterest(world(0.0f, 0.0f, 8.0f, 8.0f));
    spProcessor_->processFrameEmbedded(cpuOptions());
    EXPECT_EQ(oOutput_.at(0, 0), 4.0f); // four of nine pixels
    EXPECT_EQ(oOutput_.at(7, 3), 6.0f);
    // A smaller domain: what lies outside is not read.
    spSource_->setDomainOfDefinition(world(0.0f, 0.0f, 8.0f, 4.0f));
    oOutput_.pixels().assign(64, -1.0f);
    spProcessor_->processFrameEmbedded(cpuOptions());
    EXPECT_EQ(spSink_->getDomainOfDefinition(), world(-1.0f, -1.0f, 10.0f, 6.0f));
    EXPECT_EQ(oOutput_.at(3, 5), -1.0f);
    EXPECT_EQ(oOutput_.at(3, 2), 9.0f);
}

TEST_F(EmbeddedProcessorTest, CompilesAndPropagatesBeforeThereArePixels) {
    FilterGraph::ImageCPU noInput(
        ImageDescriptorCPU({1, ImageDescriptor::CHANNEL_TYPE_FLOAT32}, PixelExtentInWorldSpace()));
    FilterGraph::ImageCPU noOutput(
        ImageDescriptorCPU({1, ImageDescriptor::CHANNEL_TYPE_FLOAT32}, PixelExtentInWorldSpace()));
    spSource_->setImage(&noInput);
    spSink_->setImage(&noOutput);
    spProcessor_->prepareForProcessing(cpuOptions());
    spProcessor_->propagateDomainsOfDefinition();
    spProcessor_->propagateRegionOfInterest();
    EXPECT_EQ(spSource_->getRegionOfInterest(), world(1.0f, 1.0f, 6.0f, 5.0f));

    char const* const kNoPixels =
        "Enforce ImageAccessor::getImpl<ORVO::ImageBase>(adapterOriginal->getImage()) != NULL";
    ORVO_EXPECT_INTERNAL(spProcessor_->processFrameEmbedded(cpuOptions()), kNoPixels);
    ORVO_EXPECT_INTERNAL(spProcessor_->asyncProcessFrameEmbedded(cpuOptions()), kNoPixels);
    EXPECT_EQ(spProcessor_->frameStatus(), IProcessorBase::FRAME_NONE);

    spSource_->setImage(oInput_.handle());
    ORVO_EXPECT_INTERNAL(spProcessor_->processFrameEmbedded(cpuOptions()), kNoPixels);
    spSink_->setImage(oOutput_.handle());
    spProcessor_->processFrameEmbedded(cpuOptions());
    EXPECT_EQ(oOutput_.at(3, 3), 9.0f);
}

TEST_F(EmbeddedProcessorTest, AnInputWithoutAnImageIsAnError) {
    spSource_->setImage(nullptr);
    ORVO_EXPECT_INTERNAL(spProcessor_->prepareForProcessing(cpuOptions()), "Enforce image_ != NULL");
    spSource_->setImage(oInput_.handle());
    spSink_->setImage(nullptr);
    ORVO_EXPECT_INTERNAL(spProcessor_->prepareForProcessing(cpuOptions()), "Enforce image_ != NULL");
    ORVO_EXPECT_INTERNAL(spProcessor_->asyncProcessFrameEmbedded(cpuOptions()),
                         "pOriginalGraph_ && pOriginalGraph_->getImage()");
}

TEST_F(EmbeddedProcessorTest, ParametersAreThoseOfTheDomainPropagation) {
    spProcessor_->prepareForProcessing(cpuOptions());
    setParameter(*spBlur_, "radius", 2);
    spProcessor_->propagateDomainsOfDefinition();
    EXPECT_EQ(spSink_->getDomainOfDefinition(), world(-2.0f, -2.0f, 12.0f, 12.0f));
    // A value that is set after that waits for the next propagation of domains.
    setParameter(*spBlur_, "radius", 0);
    spProcessor_->propagateRegionOfInterest();
    EXPECT_EQ(spSource_->getRegionOfInterest(), world(0.0f, 0.0f, 8.0f, 7.0f));
}

TEST_F(EmbeddedProcessorTest, RunsAsynchronouslyToo) {
    void* const pHandle = spProcessor_->asyncProcessFrameEmbedded(cpuOptions());
    EXPECT_TRUE(pHandle);
    EXPECT_EQ(spProcessor_->waitForFrame(60.0, 0.001), IProcessorBase::FRAME_COMPLETE);
    EXPECT_EQ(oOutput_.at(2, 2), 9.0f);
}

TEST_F(EmbeddedProcessorTest, APropagationWaitsForTheFrameThatRuns) {
    FilterPtr const spSlow = makeFilter<SlowNode>();
    setParameter(*spSlow, "microseconds", 2000);
    Connect(spBlur_, spSlow);
    Connect(spSlow, spSink_);
    spProcessor_->asyncProcessFrameEmbedded(cpuOptions());
    setParameter(*spBlur_, "radius", 3);
    spProcessor_->propagateDomainsOfDefinition();
    // The frame was complete before its nodes were given other regions.
    EXPECT_EQ(oOutput_.at(2, 2), 9.0f);
    EXPECT_EQ(oOutput_.at(5, 4), 9.0f);
    EXPECT_EQ(spSink_->getDomainOfDefinition(), world(-3.0f, -3.0f, 14.0f, 14.0f));
    EXPECT_EQ(spProcessor_->frameStatus(), IProcessorBase::FRAME_COMPLETE);
}

TEST_F(EmbeddedProcessorTest, AnEmptyRegionOfInterestComputesNothing) {
    oOutput_.pixels().assign(64, -1.0f);
    spSink_->setRegionOfInterest(world(100.0f, 100.0f, 4.0f, 4.0f));
    spProcessor_->processFrameEmbedded(cpuOptions());
    EXPECT_EQ(oOutput_.pixels(), std::vector<float>(64, -1.0f));
    EXPECT_EQ(spProcessor_->frameStatus(), IProcessorBase::FRAME_COMPLETE);
}

TEST_F(EmbeddedProcessorTest, ARegionBeyondTheBoundImageIsRefused) {
    oOutput_.pixels().assign(64, -1.0f);
    spSink_->setRegionOfInterest(world(-1.0f, -1.0f, 10.0f, 10.0f));
    ORVO_EXPECT_INTERNAL(spProcessor_->processFrameEmbedded(cpuOptions()),
                         "Compute region lies outside the bound output image");
    EXPECT_EQ(oOutput_.pixels(), std::vector<float>(64, -1.0f));
    spSink_->setRegionOfInterest(world(0.0f, 0.0f, 8.0f, 8.0f));
    spProcessor_->processFrameEmbedded(cpuOptions());
    EXPECT_EQ(oOutput_.at(3, 3), 9.0f);
}

TEST_F(EmbeddedProcessorTest, PixelsOfHalfTheSizeCoverHalfTheWorld) {
    FloatImage fineInput(0, 0, 16, 16, 1, 6.0f, PixelExtentInWorldSpace(0.5f, 0.5f));
    FloatImage fineOutput(4, 4, 8, 6, 1, -1.0f, PixelExtentInWorldSpace(0.5f, 0.5f));
    spSource_->setImage(fineInput.handle());
    spSink_->setImage(fineOutput.handle());
    spProcessor_->processFrameEmbedded(cpuOptions());
    EXPECT_EQ(spSink_->getDomainOfDefinition(), world(-0.5f, -0.5f, 9.0f, 9.0f));
    EXPECT_EQ(spSource_->getRegionOfInterest(), world(1.5f, 1.5f, 5.0f, 4.0f));
    EXPECT_EQ(fineOutput.pixels(), std::vector<float>(48, 6.0f));
}

} // namespace
} // namespace ORVO::FilterGraph
