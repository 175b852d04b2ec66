#include "orvo/image_flow/filters/FastBilateralFilterCPUNode.h"

#include "orvo/core/exceptions/SharedException.h"
#include "tests/image_flow/support/FastBilateralTesting.h"
#include "tests/image_flow/support/FilterRoad.h"
#include "tests/support/Expect.h"
#include "tests/support/ImageFlowLayers.h"

#include <gtest/gtest.h>

#include <limits>

namespace {

using namespace ORVO;
using namespace ORVO::Test;
using ORVO::Test::reference::Settings;
using Road = FilterRoad<FastBilateralFilterCPUNode>;

float const kNaN = std::numeric_limits<float>::quiet_NaN();
float const kInfinity = std::numeric_limits<float>::infinity();

class FastBilateralFilterCPUNodeTest : public testing::Test {
protected:
    ~FastBilateralFilterCPUNodeTest() override {
        DataFlow::Controller::setNumberOfThreads(nThreads_);
        DataFlow::Controller::setMinimumGrainSize(nGrain_);
    }

    ImageFlowLayers oLayers_;
    std::size_t nThreads_ = DataFlow::Controller::getNumberOfThreads();
    std::size_t nGrain_ = DataFlow::Controller::getMinimumGrainSize();
};

Settings set(FastBilateralFilterCPUNode& node, Settings const& s) {
    node.rangeSigma().setValue(float(s.rangeSigma));
    node.spatialSigma().setValue(float2(float(s.sigmaX), float(s.sigmaY)));
    node.colorize().setValue(s.colorize);
    return s;
}

Picture pictureOf(ImageCPU const& image) {
    Picture picture(image.position().x(), image.position().y(), image.extent().width(),
                    image.extent().height());
    ImageCPUReadAccessor const reader(image);
    for (int row = 0; row < picture.height; ++row) {
        for (int column = 0; column < picture.width; ++column) {
            picture.at(column, row) = reader.getRGBAFloat4PixelAt(picture.x + column, picture.y + row);
        }
    }
    return picture;
}

TEST_F(FastBilateralFilterCPUNodeTest, HasItsNameConnectorsAndTargets) {
    FastBilateralFilterCPUNode node;
    EXPECT_EQ("ORVO::FastBilateralFilterCPU", node.name());
    EXPECT_EQ(ORVO_TARGET_CPU, node.getInputTargetPlatform());
    EXPECT_EQ(ORVO_TARGET_CPU, node.getOutputTargetPlatform());
    ASSERT_EQ(1U, node.numberOfImageInputs());
    EXPECT_EQ("InputImage", node.imageInput(0)->name());
    ASSERT_NE(nullptr, node.imageOutput());
    EXPECT_EQ("OutputImage", node.imageOutput()->name());
    EXPECT_FALSE(node.isSIMD());
}

TEST_F(FastBilateralFilterCPUNodeTest, HasItsParameters) {
    FastBilateralFilterCPUNode node;
    EXPECT_EQ(&node.spatialSigma(), node.parameter("spatialSigma"));
    EXPECT_EQ(float2(10.0F, 10.0F), node.spatialSigma().value());
    EXPECT_EQ(float2(0.1F, 0.1F), node.spatialSigma().lowerBound());
    EXPECT_EQ(float2(100.0F, 100.0F), node.spatialSigma().upperBound());
    EXPECT_EQ(&node.rangeSigma(), node.parameter("rangeSigma"));
    EXPECT_EQ(0.15F, node.rangeSigma().value());
    EXPECT_EQ(0.01F, node.rangeSigma().lowerBound());
    EXPECT_EQ(1.0F, node.rangeSigma().upperBound());
    EXPECT_EQ(&node.colorize(), node.parameter("colorize"));
    EXPECT_FALSE(node.colorize().value());
    for (char const* name : {"spatialSigma", "rangeSigma", "colorize"}) {
        EXPECT_FALSE(node.parameter(name)->description().empty());
    }
}

TEST_F(FastBilateralFilterCPUNodeTest, RegionsGrowByTheReachOfTheSigmas) {
    FastBilateralFilterCPUNode node;
    // ceil(21.46) and ceil(6.438).
    node.spatialSigma().setValue(float2(10.0F, 3.0F));
    EXPECT_EQ(world(-22, -7, 144, 64), node.needed(world(0, 0, 100, 50), "InputImage", {}));
    EXPECT_EQ(world(-22, -7, 144, 64), node.changed(world(0, 0, 100, 50), "InputImage", {}));
    node.spatialSigma().setValue(float2(kNaN, kNaN));
    EXPECT_EQ(world(1, 2, 3, 4), node.needed(world(1, 2, 3, 4), "InputImage", {}));
    node.spatialSigma().setValue(float2(kInfinity, 1.0F));
    EXPECT_TRUE(node.changed(world(1, 2, 3, 4), "InputImage", {}).isInfinite());
    EXPECT_FALSE(node.needed(PositionExtentInWorldSpace(), "InputImage", {}).extent().isDefined());
}

TEST_F(FastBilateralFilterCPUNodeTest, FrameIsTheFilterOverTheRegion) {
    Picture const source = randomPicture(-4, 6, 71, 53, 21);
    FilterImage image(ImageCPU::PIXEL_FORMAT_RGBA32F, source, 80);
    for (bool colorize : {false, true}) {
        Road road;
        Settings const settings = set(road.filter(), {0.15, 6, 5, colorize});
        ImageCPU const* const pResult = road.run(image.image(), worldOf(source));
        ASSERT_NE(nullptr, pResult);
        EXPECT_EQ(ImageCPU::PIXEL_FORMAT_RGBA32F, pResult->pixelFormat());
        EXPECT_EQ(source.rectangle(), pResult->positionExtent());
        expectNear(pictureOf(*pResult), clamped(reference::gridFilter(source, source, settings)), 5e-5F);
    }
}

TEST_F(FastBilateralFilterCPUNodeTest, RegionMayReachBeyondTheInputOrCoverAPart) {
    Picture const source = randomPicture(0, 0, 40, 30, 22, 0.0F, 1.0F, true);
    FilterImage image(ImageCPU::PIXEL_FORMAT_RGBA32F, source, 40);
    for (Picture const& wanted : {Picture(-5, -3, 55, 40), Picture(8, 9, 11, 10), Picture(35, 25, 9, 9)}) {
        Road road;
        Settings const settings = set(road.filter(), {0.2, 6, 5, true});
        ImageCPU const* const pResult = road.run(image.image(), worldOf(wanted));
        ASSERT_NE(nullptr, pResult);
        Picture const result = pictureOf(*pResult);
        EXPECT_EQ(wanted.x, result.x);
        EXPECT_EQ(wanted.y, result.y);
        expectNear(result, clamped(reference::gridFilter(source, wanted, settings)), 5e-5F);
    }
}

TEST_F(FastBilateralFilterCPUNodeTest, BoundImageIsWrittenInTheRegionAlone) {
    Picture const source = randomPicture(0, 0, 40, 30, 23, 0.0F, 1.0F, true);
    FilterImage image(ImageCPU::PIXEL_FORMAT_RGBA32F, source, 40);
    Picture const before(-3, -2, 50, 40, float4(0.3F, 0.4F, 0.5F, 0.6F));
    FilterImage target(ImageCPU::PIXEL_FORMAT_RGBA32F, before, 57);
    Picture const wanted(5, 7, 20, 11);
    Road road;
    Settings const settings = set(road.filter(), {0.15, 6, 5, false});
    road.runInto(image.image(), target.image(), worldOf(wanted));
    Picture const inside = clamped(reference::gridFilter(source, wanted, settings));
    Picture expected = before;
    for (int row = 0; row < wanted.height; ++row) {
        for (int column = 0; column < wanted.width; ++column) {
            expected.at(wanted.x - before.x + column, wanted.y - before.y + row) = inside.at(column, row);
        }
    }
    expectNear(target.picture(), expected, 5e-5F);
    EXPECT_TRUE(target.paddingIsUntouched());
}

TEST_F(FastBilateralFilterCPUNodeTest, ResultIsTheSameForAnyThreadsAndGrain) {
    Picture const source = randomPicture(0, 0, 150, 140, 24);
    FilterImage image(ImageCPU::PIXEL_FORMAT_RGBA32F, source, 150);
    for (bool colorize : {false, true}) {
        Road single;
        single.controller().setSingleThreadMode(true);
        set(single.filter(), {0.15, 6, 5, colorize});
        Picture const expected = pictureOf(*single.run(image.image(), worldOf(source)));
        for (std::size_t nThreads : {1U, 2U, 8U}) {
            for (std::size_t nGrain : {1U, 5000U, 1000000U}) {
                DataFlow::Controller::setNumberOfThreads(nThreads);
                DataFlow::Controller::setMinimumGrainSize(nGrain);
                Road road;
                set(road.filter(), {0.15, 6, 5, colorize});
                EXPECT_TRUE(areIdentical(expected, pictureOf(*road.run(image.image(), worldOf(source)))));
            }
        }
    }
}

TEST_F(FastBilateralFilterCPUNodeTest, ByteImagesGiveByteImages) {
    Picture const source = randomPicture(0, 0, 40, 30, 25, 0.0F, 1.0F, true);
    FilterImage image(ImageCPU::PIXEL_FORMAT_BGR8, source, 41);
    Road road;
    road.filter().setImageDescInfoFromSource(true);
    Settings const settings = set(road.filter(), {0.15, 6, 5, true});
    ImageCPU const* const pResult = road.run(image.image(), worldOf(source));
    ASSERT_NE(nullptr, pResult);
    EXPECT_EQ(8U, channelSizeBits(pResult->pixelFormat()));
    expectNear(pictureOf(*pResult), clamped(reference::gridFilter(image.picture(), source, settings)),
               1.01F / 255.0F);
}

TEST_F(FastBilateralFilterCPUNodeTest, FormatsThatAccessorsDoNotServeFailTheFrame) {
    ImageCPU image(ImageCPU::PIXEL_FORMAT_LUMINANCE32F, pixels(0, 0, 8, 8),
                   PixelExtentInWorldSpace(1.0F, 1.0F), ExtentInPixelSpace());
    image.initializeToTransparentBlack();
    Road road;
    ORVO_EXPECT_INTERNAL(road.run(image, world(0, 0, 8, 8)), "Invalid input image type");
    // The graph serves again afterwards.
    FilterImage good(ImageCPU::PIXEL_FORMAT_RGBA32F, Picture(0, 0, 8, 8, float4(0.5F, 0.5F, 0.5F, 1.0F)), 8);
    ImageCPU const* const pResult = road.run(good.image(), world(0, 0, 8, 8));
    ASSERT_NE(nullptr, pResult);
    expectNear(pictureOf(*pResult), good.picture(), 1e-6F);
}

/// Makes what subclasses may reach public.
struct OpenNode : FastBilateralFilterCPUNode {
    using FastBilateralFilterCPUNode::internalProcess;
    using ImageFilter::bPreparedForRender_;
    using ImageFilter::nForcedChannels_;
    using ImageFilter::pImageOutput_;
    using ImageFilter::spOutputImage_;
};

TEST_F(FastBilateralFilterCPUNodeTest, SlicesOutsideAPhaseFailAsThoseOfAnyNodeWithout) {
    FastBilateralFilterCPUNode node;
    ORVO_EXPECT_INTERNAL(node.processSlice(0, 1), "0");
    EXPECT_EQ(0U, node.rangeToProcess().items);
}

TEST_F(FastBilateralFilterCPUNodeTest, MissingImageFails) {
    ImageFlowController controller;
    OpenNode node;
    controller.addNode(&node);
    node.nForcedChannels_ = 4;
    node.outputPrecisionHintParameter().setValue(ImageFilter::OUTPUT_PRECISION_32_BIT_FLOAT);
    node.computeRegionParameter().setValue(world(0, 0, 4, 4));
    ORVO_EXPECT_INTERNAL(node.internalProcess(), "Enforce spData_.get() != NULL");
    EXPECT_FALSE(node.bPreparedForRender_);
    EXPECT_EQ(nullptr, node.spOutputImage_.get());
}

TEST_F(FastBilateralFilterCPUNodeTest, MissingOutputFails) {
    OpenNode node;
    auto& input = dynamic_cast<DataFlow::ConstInput<ImageCPU>&>(*node.imageInput(0));
    input.setData(ORVO_NEW ImageCPU());
    node.pImageOutput_ = nullptr;
    ORVO_EXPECT_INTERNAL(node.internalProcess(), "Enforce pOutput != NULL");
}

TEST_F(FastBilateralFilterCPUNodeTest, EmptyRegionsGiveEmptyImages) {
    FilterImage image(ImageCPU::PIXEL_FORMAT_RGBA32F, Picture(0, 0, 4, 4), 4);
    Road road;
    ImageCPU const* const pResult = road.run(image.image(), world(1000, 1000, 5, 5));
    ASSERT_NE(nullptr, pResult);
    EXPECT_EQ(0U, pResult->numberOfPixels());
}

/// Cancels its controller after a number of slices.
struct CancellingNode : FastBilateralFilterCPUNode {
    void processSlice(std::size_t begin, std::size_t end) override {
        if (nBands_ < nAllowed_) {
            FastBilateralFilterCPUNode::processSlice(begin, end);
            nBands_ += end - begin;
        } else {
            imageFlowController()->cancelProcess();
        }
    }
    std::size_t nBands_ = 0;
    std::size_t nAllowed_ = 0;
};

TEST_F(FastBilateralFilterCPUNodeTest, ACancelledFrameHandsOnNothingAndTheNextOneIsRight) {
    Picture const source = randomPicture(0, 0, 90, 70, 26);
    FilterImage image(ImageCPU::PIXEL_FORMAT_RGBA32F, source, 90);
    for (std::size_t nAllowed = 0; nAllowed < 30; nAllowed += 3) {
        FilterRoad<CancellingNode> road;
        road.controller().setSingleThreadMode(true);
        set(road.filter(), {0.15, 6, 5, false});
        road.filter().nAllowed_ = nAllowed;
        ImageCPU const* pResult = road.run(image.image(), worldOf(source));
        bool const isWhole = road.filter().nBands_ == 5 + 21 + 6 + 5;
        EXPECT_EQ(isWhole, pResult != nullptr) << nAllowed;
        road.controller().wait(1.0, 0.001);
        road.filter().nAllowed_ = 1000;
        pResult = road.run(image.image(), worldOf(source));
        ASSERT_NE(nullptr, pResult);
        expectNear(pictureOf(*pResult), clamped(reference::gridFilter(source, source, {0.15, 6, 5, false})),
                   5e-5F);
    }
}

} // namespace
