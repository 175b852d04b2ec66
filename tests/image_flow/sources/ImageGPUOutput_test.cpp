#include "orvo/image_flow/sources/ImageGPUOutput.h"

#include "tests/image_flow/support/GPURoads.h"

namespace ORVO {

namespace {

using Test::Chain;
using Test::ImageGPUPtr;
using Test::pixels;
using Test::textureImage;
using Test::TextureNode;
using Test::worldOf;

class ImageGPUOutputTest : public Test::GLFlowTest {};

TEST_F(ImageGPUOutputTest, isASinkOnTheGPU) {
    ImageGPUOutput sink;
    EXPECT_EQ("ImageGPUOutput", sink.name());
    EXPECT_EQ(ORVO_TARGET_GL, sink.getInputTargetPlatform());
    EXPECT_EQ(ORVO_TARGET_GL, sink.getOutputTargetPlatform());
    EXPECT_TRUE(sink.willRunInHardware());
    EXPECT_EQ(nullptr, sink.imageOutput());
    ASSERT_EQ(1u, sink.numberOfImageInputs());
    EXPECT_EQ("InputImage", sink.imageInput(0)->name());
    EXPECT_TRUE(typeid(ImageGPU) == sink.imageInput(0)->datatype());
    ImageGPUOutput other("node", "input");
    EXPECT_EQ("node", other.name());
    EXPECT_EQ("input", other.imageInput(0)->name());
    EXPECT_EQ(nullptr, sink.getImageGPU());
    EXPECT_EQ(nullptr, sink.releaseImageGPU());
}

/// A node that makes a texture, and the sink.
struct Road {
    explicit Road(OGL::Context const& context) : oNode_(0), oChain_(context, {&oNode_, &oSink_}) {}
    void run() { oChain_.run(worldOf(pixels(0, 0, 4, 4))); }
    TextureNode oNode_;
    ImageGPUOutput oSink_;
    Chain oChain_;
};

TEST_F(ImageGPUOutputTest, keepsTheResultUntilTheNextFrame) {
    Road road(context());
    road.run();
    ImageGPU const* const pFirst = road.oSink_.getImageGPU();
    ASSERT_NE(nullptr, pFirst);
    EXPECT_FALSE(road.oSink_.imageInput(0)->hasData()) << "it was taken out of the input";
    road.oChain_.oController_.flushGraph();
    EXPECT_EQ(pFirst, road.oSink_.getImageGPU()) << "a flush leaves it";
    road.run();
    EXPECT_EQ(2, road.oNode_.nRuns_);
    EXPECT_NE(nullptr, road.oSink_.getImageGPU());
}

TEST_F(ImageGPUOutputTest, handsTheResultToTheCaller) {
    Road road(context());
    road.run();
    ImageGPU const* const pImage = road.oSink_.getImageGPU();
    ImageGPUPtr const upImage(road.oSink_.releaseImageGPU());
    EXPECT_EQ(pImage, upImage.get());
    EXPECT_EQ(nullptr, road.oSink_.getImageGPU());
    EXPECT_EQ(nullptr, road.oSink_.releaseImageGPU());
    road.run();
    EXPECT_NE(upImage.get(), road.oSink_.getImageGPU());
    EXPECT_NE(0u, upImage->texture()->objectID());
}

TEST_F(ImageGPUOutputTest, takesNoImageThatOthersHold) {
    ImageGPUPtr const upImage = textureImage(pixels(0, 0, 4, 4), ImageGPU::PIXEL_FORMAT_RGBA8);
    ImageGPUInput source;
    ImageGPUOutput sink;
    source.setImageGPUWithNoOwnership(upImage.get());
    Chain chain(context(), {&source, &sink});
    ORVO_EXPECT_INTERNAL(chain.run(worldOf(pixels(0, 0, 4, 4))),
                         "Not implemented: no copying of ImageGPU allowed");
    EXPECT_EQ(nullptr, sink.getImageGPU());
    EXPECT_EQ(upImage.get(), source.getImageGPU());
}

TEST_F(ImageGPUOutputTest, takesNoImageThatIsNotTheGraphsToGiveAway) {
    ImageGPUPtr const upImage = textureImage(pixels(0, 0, 4, 4), ImageGPU::PIXEL_FORMAT_RGBA8);
    TextureNode node(0);
    ImageGPUOutput sink;
    Chain chain(context(), {&node, &sink});
    DataFlow::ConstDataPointer<ImageGPU> spImage;
    spImage.setDataWithNoOwnership(upImage.get());
    node.out().setData(spImage);
    spImage.reset();
    chain.oController_.computeRegions(worldOf(pixels(0, 0, 4, 4)));
    ORVO_EXPECT_INTERNAL(chain.oController_.process(), "Enforce deleter != NULL");
    EXPECT_EQ(nullptr, sink.getImageGPU());
    chain.oController_.flushGraph();
    EXPECT_NE(nullptr, upImage->texture());
}

TEST_F(ImageGPUOutputTest, theResultMayDieWithoutAContext) {
    {
        Road road(context());
        road.run();
        host().release();
    }
    // The texture has gone back by the end, which looks for what is left.
    EXPECT_NO_THROW(host().makeCurrent());
}

} // namespace

} // namespace ORVO
