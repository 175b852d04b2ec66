// What nodes do with images in textures: clones, bound outputs, regions.

#include "tests/image_flow/support/GPURoads.h"

namespace ORVO {

namespace {

using Test::Chain;
using Test::feed;
using Test::HostImage;
using Test::ImageGPUPtr;
using Test::pixels;
using Test::textureImage;
using Test::TextureNode;
using Test::worldOf;

class ImageFilterGPUTest : public Test::GLFlowTest {};

TEST_F(ImageFilterGPUTest, aCloneIsAnOutputOfTexturesOfTheSameName) {
    TextureNode node;
    DataFlow::OutputConnector* const pClone = node.cloneImageOutput();
    ASSERT_NE(nullptr, pClone);
    EXPECT_EQ("out", pClone->name());
    EXPECT_TRUE(typeid(ImageGPU) == pClone->datatype());
    EXPECT_EQ(&node, pClone->node());
    EXPECT_EQ(1u, node.numberOfClonedImageOutputs());
    EXPECT_EQ(pClone, node.clonedImageOutput(0));
    EXPECT_FALSE(pClone->bound());
    node.outputTarget_ = ORVO_TARGET_UNSET;
    EXPECT_EQ(nullptr, node.cloneImageOutput());
    EXPECT_EQ(1u, node.numberOfClonedImageOutputs());
    ORVO_EXPECT_INTERNAL(node.postProcess(), "false");
    node.outputTarget_ = ORVO_TARGET_GL;
    TextureNode sink(1, false);
    ORVO_EXPECT_INTERNAL(sink.cloneImageOutput(), "Enforce pImageOutput_ != NULL");
}

TEST_F(ImageFilterGPUTest, clonesShareTheTextureOfTheTrueOutput) {
    TextureNode source(0, true, "source");
    TextureNode first(1, true, "first");
    TextureNode second(1, true, "second");
    TextureNode sink(2, false, "sink");
    feed(first, 0, source);
    feed(second, 0, source);
    feed(sink, 0, first);
    feed(sink, 1, second);
    ImageFlowController controller;
    for (ImageFilter* pNode : {&source, &first, &second, &sink})
        controller.addNode(pNode);
    controller.setImageSink(sink);
    controller.setContextGPU(context());
    controller.process();
    EXPECT_EQ(1, source.nRuns_);
    EXPECT_EQ(1, sink.nRuns_);
    EXPECT_NE(nullptr, first.pSeen_);
    EXPECT_EQ(first.pSeen_, second.pSeen_);
    EXPECT_FALSE(source.clonedImageOutput(0)->hasData()) << "both were taken";
}

TEST_F(ImageFilterGPUTest, bindsTexturesAlone) {
    TextureNode node(0);
    HostImage host(ImageCPU::PIXEL_FORMAT_RGBA8, pixels(0, 0, 2, 2));
    ImageGPUPtr const upImage = textureImage(pixels(0, 0, 2, 2), ImageGPU::PIXEL_FORMAT_RGBA8);
    ORVO_EXPECT_INTERNAL(node.setBoundOutputImage(&host.image()), "outputTarget_ == p->targetPlatform()");
    EXPECT_FALSE(node.out().bound());
    ImageCPUInput onCPU;
    ORVO_EXPECT_INTERNAL(onCPU.setBoundOutputImage(upImage.get()), "outputTarget_ == p->targetPlatform()");
    DataFlow::OutputConnector* const pClone = node.cloneImageOutput();
    node.setBoundOutputImage(upImage.get());
    EXPECT_EQ(upImage.get(), node.out().data());
    EXPECT_EQ(upImage.get(), pClone->data());
    EXPECT_TRUE(pClone->bound());
    DataFlow::OutputConnector* const pLater = node.cloneImageOutput();
    EXPECT_EQ(upImage.get(), pLater->data());
    EXPECT_TRUE(pLater->bound());
    node.setBoundOutputImage(nullptr);
    EXPECT_EQ(nullptr, node.out().data());
    EXPECT_EQ(nullptr, pClone->data());
}

TEST_F(ImageFilterGPUTest, aBoundTextureMustHoldTheRegion) {
    TextureNode node(0);
    EXPECT_EQ(nullptr, node.boundOutputImageGPU()) << "nothing is bound";
    ImageGPUPtr const upImage = textureImage(pixels(-2, 1, 5, 6), ImageGPU::PIXEL_FORMAT_RGBA8, false);
    node.setBoundOutputImage(upImage.get());
    struct Case {
        PositionExtentInPixelSpace oRegion;
        bool bInside;
    };
    Case const aCases[] = {{pixels(-2, 1, 5, 6), true},  {pixels(0, 3, 1, 1), true},
                           {pixels(-3, 1, 5, 6), false}, {pixels(-2, 0, 5, 6), false},
                           {pixels(-2, 1, 6, 6), false}, {pixels(-2, 1, 5, 7), false},
                           {pixels(90, 90, 0, 0), true}};
    for (Case const& one : aCases) {
        node.computeRegionParameter().setValue(worldOf(one.oRegion));
        if (one.bInside) {
            node.allocateOutputImage();
            EXPECT_EQ(upImage.get(), node.boundOutputImageGPU());
        } else {
            ORVO_EXPECT_INTERNAL(node.allocateOutputImage(),
                                 "Compute region lies outside the bound output image");
            ORVO_EXPECT_INTERNAL(node.boundOutputImageGPU(),
                                 "Compute region lies outside the bound output image");
        }
    }
    ImageGPU withoutTexture;
    node.setBoundOutputImage(&withoutTexture);
    node.computeRegionParameter().setValue(worldOf(pixels(0, 0, 1, 1)));
    ORVO_EXPECT_INTERNAL(node.allocateOutputImage(), "Compute region lies outside the bound output image");
    node.setBoundOutputImage(nullptr);
    ORVO_EXPECT_INTERNAL(node.allocateOutputImage(), "Enforce pBoundImage != NULL");
}

TEST_F(ImageFilterGPUTest, aFrameWritesIntoTheBoundTextureOfItsSink) {
    HostImage host(ImageCPU::PIXEL_FORMAT_LUMINANCE8, pixels(0, 0, 4, 4), 0, 9);
    ImageCPUInput source;
    CPU2GPU up;
    source.setImageCPUWithNoOwnership(&host.image());
    Chain chain(context(), {&source, &up});
    ImageGPUPtr const upImage = textureImage(pixels(0, 0, 4, 4), ImageGPU::PIXEL_FORMAT_LUMINANCE8);
    up.setBoundOutputImage(upImage.get());
    for (unsigned char const value : {9, 50, 51}) { // the same image, overwritten in place
        host.set(std::vector<unsigned char>(16, value));
        chain.run(worldOf(pixels(0, 0, 4, 4)));
        EXPECT_EQ(std::vector<unsigned char>(16, value), ORVO::Test::readTexels(*upImage));
    }
}

} // namespace

} // namespace ORVO
