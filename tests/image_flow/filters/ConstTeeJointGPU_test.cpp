#include "orvo/image_flow/filters/ConstTeeJointGPU.h"

#include "orvo/core/memory/AllocationFailure.h"
#include "orvo/core/memory/MemoryStatistics.h"
#include "tests/image_flow/support/ShaderRoad.h"

namespace {

using namespace ORVO;
using namespace ORVO::Test;

class OpenTee : public ConstTeeJointGPU {
public:
    ~OpenTee() override { disconnect(); }
    using ConstTeeJointGPU::internalProcess;
};

class ConstTeeJointGPUTest : public ShaderFlowTest {};

TEST_F(ConstTeeJointGPUTest, HasOneInputAndTwoOutputsOfOneName) {
    OpenTee tee;
    EXPECT_EQ("TeeJointGPU", tee.name());
    EXPECT_EQ("InputImage", tee.imageInput(0)->name());
    EXPECT_EQ(2U, tee.numberOfOutputs());
    EXPECT_EQ("OutputImageA", tee.imageOutput()->name());
    ASSERT_EQ(1U, tee.numberOfClonedImageOutputs());
    EXPECT_EQ("OutputImageA", tee.clonedImageOutput(0)->name());
    EXPECT_EQ(ORVO_TARGET_GL, tee.getInputTargetPlatform());
    EXPECT_EQ(ORVO_TARGET_GL, tee.getOutputTargetPlatform());
    EXPECT_EQ(ImageFilter::OUTPUT_PRECISION_DEFAULT, tee.outputPrecisionHintParameter().value());
    EXPECT_TRUE(tee.willRunInHardware());
    for (auto const& region : {world(1, 2, 3, 4), PositionExtentInWorldSpace(), infiniteWorld()}) {
        EXPECT_EQ(region, tee.needed(region, "InputImage", {}));
        EXPECT_EQ(region, tee.changed(region, "InputImage", {}));
    }
    ORVO_EXPECT_INTERNAL(tee.internalProcess(), "Enforce pImage != NULL");
}

TEST_F(ConstTeeJointGPUTest, BothConsumersShareTheTexture) {
    OpenTee tee;
    TextureNode left;
    TextureNode right;
    TextureNode end(2, false);
    std::vector<ImageGPUPtr> aupImages;
    for (int i = 0; i < 12; ++i)
        aupImages.push_back(textureImage(pixels(0, 0, 1 + i % 4, 1 + i % 3), ImageGPU::PIXEL_FORMAT_RGBA8));
    DataFlow::Connect(*left.imageInput(0), *tee.imageOutput());
    DataFlow::Connect(*right.imageInput(0), *tee.clonedImageOutput(0));
    feed(end, 0, left);
    feed(end, 1, right);
    ImageGPUInput source;
    feed(tee, 0, source);
    NodeScope const scope(tee);
    ImageFlowController controller;
    plant(controller, {&source, &tee, &left, &right, &end}, end);
    controller.setContextGPU(frameContext());
    auto const nTextures = GLHooks::calls("glGenTextures");
    std::size_t nBytes = 0;
    for (std::size_t i = 0; i < 1000 && !HasFailure(); ++i) {
        ImageGPU& image = *aupImages[i % aupImages.size()];
        source.setImageGPUWithNoOwnership(&image);
        source.emit();
        controller.computeRegions(pixelToWorldSpace(image.positionExtent(), PixelExtentInWorldSpace()));
        controller.process();
        EXPECT_EQ(&image, left.pSeen_);
        EXPECT_EQ(&image, right.pSeen_);
        EXPECT_FALSE(tee.imageInput(0)->hasData());
        nBytes = i == 11 ? Core::MemoryStatistics::bytes(MEMORY_TYPE_OBJECT) : nBytes;
    }
    EXPECT_EQ(nBytes, Core::MemoryStatistics::bytes(MEMORY_TYPE_OBJECT));
    EXPECT_EQ(1000, end.nRuns_);
    EXPECT_LE(GLHooks::calls("glGenTextures"), nTextures + 2); // of the two nodes, which the pool reuses
    end.disconnect();
}

TEST_F(ConstTeeJointGPUTest, AnUnconnectedOutputFailsTheRegions) {
    OpenTee tee;
    TextureNode left(1, false);
    ImageGPUInput source;
    feed(tee, 0, source);
    DataFlow::Connect(*left.imageInput(0), *tee.imageOutput());
    NodeScope const scope(tee);
    ImageFlowController controller;
    plant(controller, {&source, &tee, &left}, left);
    ORVO_EXPECT_INTERNAL(controller.computeRegions(world(0, 0, 4, 3)),
                         "aParentROIs_.size() == totalNumberOfAllImageOutputs()");
}

TEST_F(ConstTeeJointGPUTest, AConsumerThatWantsAnImageOfItsOwnFails) {
    OpenTee tee;
    TextureNode right;
    ImageGPUOutput sink;
    TextureNode end(1, false);
    ImageGPUPtr const upImage = textureImage(pixels(0, 0, 4, 3), ImageGPU::PIXEL_FORMAT_RGBA8);
    ImageGPUInput source;
    feed(tee, 0, source);
    source.setImageGPUWithNoOwnership(upImage.get());
    DataFlow::Connect(*sink.imageInput(0), *tee.imageOutput());
    DataFlow::Connect(*right.imageInput(0), *tee.clonedImageOutput(0));
    feed(end, 0, right);
    NodeScope const scope(tee);
    ImageFlowController controller;
    plant(controller, {&source, &tee, &sink, &right, &end}, sink);
    controller.setContextGPU(frameContext());
    source.emit();
    ORVO_EXPECT_INTERNAL(controller.process(), "Not implemented: no copying of ImageGPU allowed");
    controller.flushGraph();
    right.disconnect();
}

TEST_F(ConstTeeJointGPUTest, CopiesIntoABoundTexture) {
    ImageGPUPtr const upInput = textureOf(randomTexels(pixels(-2, 1, 7, 5), 3), ImageGPU::PIXEL_FORMAT_RGBA8);
    ImageGPUPtr const upTarget =
        textureOf(randomTexels(pixels(-3, 0, 9, 9), 4), ImageGPU::PIXEL_FORMAT_RGBA16F);
    Texels const input(*upInput);
    Texels const before(*upTarget);
    Texels const region(pixels(-1, 2, 4, 3));
    OpenTee tee;
    ShaderRoad road(frameContext(), tee);
    road.setInput(0, *upInput);
    road.runInto(*upTarget, world(-1, 2, 4, 3));
    Texels const expected = Texels(upTarget->positionExtent()).fill([&](int x, int y) {
        return region.contains(x, y) ? input.at(x, y) : before.at(x, y);
    });
    expectTexels(Texels(*upTarget), expected, Precision::of(ImageGPU::PIXEL_FORMAT_RGBA16F));
    EXPECT_EQ(upTarget.get(), tee.imageOutput()->data());
    EXPECT_EQ(upTarget.get(), tee.clonedImageOutput(0)->data());
}

TEST_F(ConstTeeJointGPUTest, EveryFailureOnTheWayToABoundTextureLeavesTheNextFrameRight) {
    ImageGPUPtr const upInput = textureOf(randomTexels(pixels(0, 0, 5, 4), 3), ImageGPU::PIXEL_FORMAT_RGBA8);
    ImageGPUPtr const upTarget = textureImage(pixels(0, 0, 5, 4), ImageGPU::PIXEL_FORMAT_RGBA8);
    Texels const input(*upInput);
    OpenTee tee;
    ShaderRoad road(frameContext(), tee);
    road.setInput(0, *upInput);
    auto const expectRight = [&] {
        writeTexels(*upTarget, std::vector<unsigned char>(4 * 5 * 4, 7));
        road.runInto(*upTarget, world(0, 0, 5, 4));
        EXPECT_EQ("", differences(Texels(*upTarget), input, Precision::of(ImageGPU::PIXEL_FORMAT_RGBA8)));
        EXPECT_EQ(upTarget.get(), tee.clonedImageOutput(0)->data());
    };
    expectRight();
    std::set<std::string> const aFailed = failEveryCall([&] { road.runInto(*upTarget, world(0, 0, 5, 4)); },
                                                        [&] {
                                                            // None is current where the driver did not give
                                                            // it back.
                                                            host().makeCurrent();
                                                            EXPECT_EQ(0U, drainErrors());
                                                            expectRight();
                                                        },
                                                        {"eglMakeCurrent"});
    EXPECT_EQ(1U, aFailed.count("glCheckFramebufferStatus"));
    std::size_t const nBlocks = Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT);
    bool bMore = true;
    for (std::uint64_t n = 1; bMore; ++n) {
        ASSERT_LT(n, 100U);
        {
            Core::AllocationFailure const failure(n);
            try {
                road.runInto(*upTarget, world(0, 0, 5, 4));
            } catch (std::bad_alloc const&) {
                EXPECT_TRUE(failure.hasFired());
            }
            bMore = failure.hasFired();
        }
        expectRight();
        EXPECT_EQ(nBlocks, Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT));
    }
}

TEST_F(ConstTeeJointGPUTest, EveryAllocationOfItsConstructionMayFail) {
    std::uint64_t n = 1;
    for (bool bMore = true; bMore && n < 50; ++n) {
        std::size_t const nBlocks = Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT);
        Core::AllocationFailure const failure(n);
        try {
            OpenTee const tee;
        } catch (std::bad_alloc const&) {
            EXPECT_TRUE(failure.hasFired());
        }
        bMore = failure.hasFired();
        EXPECT_EQ(nBlocks, Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT));
    }
    EXPECT_GT(n, 2U); // the clone at least
}

} // namespace
