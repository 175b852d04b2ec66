#include "orvo/image_flow/filters/LABToRGBCPU.h"
#include "orvo/image_flow/filters/RGBToLABCPU.h"

#include "orvo/core/exceptions/SharedException.h"
#include "tests/image_flow/support/FastBilateralTesting.h"
#include "tests/image_flow/support/FilterRoad.h"
#include "tests/support/Expect.h"
#include "tests/support/ImageFlowLayers.h"

#include <gtest/gtest.h>

#include <type_traits>

namespace {

using namespace ORVO;
using namespace ORVO::Test;

/// Both nodes, with what they do and their name.
template <typename Node>
class LabNodes : public testing::Test {
protected:
    static constexpr bool kToLab = std::is_same_v<Node, RGBToLABCPU>;

    static DoublePixel transform(float4 const& p) {
        DoublePixel const pixel = {p.x, p.y, p.z, p.w};
        return kToLab ? reference::labFromRGB(pixel) : reference::rgbFromLab(pixel);
    }

    /// What the node makes of a picture at the places of another; transparent black where there is nothing.
    static Picture expected(Picture const& source, Picture result) {
        for (int row = 0; row < result.height; ++row) {
            for (int column = 0; column < result.width; ++column) {
                int const x = result.x + column - source.x;
                int const y = result.y + row - source.y;
                bool const inside = x >= 0 && x < source.width && y >= 0 && y < source.height;
                DoublePixel const p = transform(inside ? source.at(x, y) : float4(0.0F));
                result.at(column, row) = float4(float(p[0]), float(p[1]), float(p[2]), float(p[3]));
            }
        }
        return clamped(result);
    }

    ImageFlowLayers oLayers_;
};

using Nodes = testing::Types<RGBToLABCPU, LABToRGBCPU>;
TYPED_TEST_SUITE(LabNodes, Nodes);

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

TYPED_TEST(LabNodes, HaveNamesConnectorsAndTargets) {
    TypeParam node;
    EXPECT_EQ(this->kToLab ? "ORVO::RGBToLABCPU" : "ORVO::LABToRGBCPU", node.name());
    EXPECT_EQ(ORVO_TARGET_CPU, node.getInputTargetPlatform());
    EXPECT_EQ(ORVO_TARGET_CPU, node.getOutputTargetPlatform());
    ASSERT_EQ(1U, node.numberOfImageInputs());
    EXPECT_EQ("InputImage", node.imageInput(0)->name());
    EXPECT_EQ("OutputImage", node.imageOutput()->name());
    // Only those of every image node.
    EXPECT_EQ(2U, node.numberOfParameters());
    EXPECT_EQ(world(1, 2, 3, 4), node.needed(world(1, 2, 3, 4), "InputImage", {}));
}

TYPED_TEST(LabNodes, EveryInstructionSetConvertsAllPixels) {
    for (auto set : instructionSets()) {
        ScopedInstructionSet const active(set);
        // Padded, positioned and reaching beyond 0..1.
        Picture const source = randomPicture(-9, 4, 37, 21, 31, -0.5F, 1.5F);
        FilterImage image(ImageCPU::PIXEL_FORMAT_RGBA32F, source, 43);
        FilterRoad<TypeParam> road;
        ImageCPU const* const pResult = road.run(image.image(), worldOf(source));
        ASSERT_NE(nullptr, pResult);
        expectNear(pictureOf(*pResult), this->expected(source, source), 3e-5F);
    }
}

TYPED_TEST(LabNodes, FormatsOfBytesAreTruncated) {
    for (auto format : {ImageCPU::PIXEL_FORMAT_BGR8, ImageCPU::PIXEL_FORMAT_BGRA8,
                        ImageCPU::PIXEL_FORMAT_RGB8, ImageCPU::PIXEL_FORMAT_RGBA8}) {
        SCOPED_TRACE(testing::Message() << format);
        Picture const source = randomPicture(0, 0, 30, 20, 32);
        FilterImage image(format, source, 31);
        FilterImage target(format, Picture(0, 0, 30, 20), 32);
        FilterRoad<TypeParam> road;
        road.runInto(image.image(), target.image(), world(0, 0, 30, 20));
        Picture const exact = this->expected(image.picture(), source);
        Picture const actual = target.picture();
        for (std::size_t i = 0; i < exact.pixels.size(); ++i) {
            for (std::size_t c = 0; c < nChannelsOf(format); ++c) {
                // Just below the exact value; where it is a whole number of steps the float may fall short of
                // it.
                float const difference = exact.pixels[i][c] * 255.0F - actual.pixels[i][c] * 255.0F;
                ASSERT_GT(difference, -0.01F) << i << " " << c;
                ASSERT_LT(difference, 1.01F) << i << " " << c;
            }
        }
        EXPECT_TRUE(target.paddingIsUntouched());
    }
}

TYPED_TEST(LabNodes, HalvesAndThreeChannelFloatsAreServed) {
    for (auto format :
         {ImageCPU::PIXEL_FORMAT_RGB32F, ImageCPU::PIXEL_FORMAT_RGB16F, ImageCPU::PIXEL_FORMAT_RGBA16F}) {
        SCOPED_TRACE(testing::Message() << format);
        Picture const source = randomPicture(0, 0, 30, 20, 33);
        FilterImage image(ImageCPU::PIXEL_FORMAT_RGB32F, source, 31);
        FilterImage target(format, Picture(0, 0, 30, 20), 32);
        FilterRoad<TypeParam> road;
        road.runInto(image.image(), target.image(), world(0, 0, 30, 20));
        // Formats without alpha read it as 1.
        expectNear(target.picture(), this->expected(image.picture(), source), 1e-3F);
    }
}

TYPED_TEST(LabNodes, BoundImageIsWrittenInTheRegionAlone) {
    Picture const source = randomPicture(2, 3, 20, 20, 34);
    FilterImage image(ImageCPU::PIXEL_FORMAT_RGBA32F, source, 20);
    Picture const before(0, 0, 30, 30, float4(0.1F, 0.2F, 0.3F, 0.4F));
    FilterImage target(ImageCPU::PIXEL_FORMAT_RGBA32F, before, 33);
    FilterRoad<TypeParam> road;
    road.runInto(image.image(), target.image(), world(5, 6, 7, 8));
    Picture const inside = this->expected(source, Picture(5, 6, 7, 8));
    Picture expected = before;
    for (int row = 0; row < 8; ++row) {
        for (int column = 0; column < 7; ++column) {
            expected.at(5 + column, 6 + row) = inside.at(column, row);
        }
    }
    expectNear(target.picture(), expected, 3e-5F);
}

/// Lets the node run on a region of the test's choice.
template <typename Node>
struct OpenNode : Node {
    using Node::internalProcess;
    using Node::nForcedChannels_;
    using Node::oOutputRegionInPixels_;
    using Node::spOutputImage_;
};

TYPED_TEST(LabNodes, PixelsOutsideTheInputAreTransparentBlack) {
    Picture const source = randomPicture(0, 0, 6, 5, 35);
    FilterImage image(ImageCPU::PIXEL_FORMAT_RGBA32F, source, 6);
    FilterImage target(ImageCPU::PIXEL_FORMAT_RGBA32F, Picture(-2, -3, 11, 12, float4(0.9F)), 11);
    OpenNode<TypeParam> node;
    dynamic_cast<DataFlow::ConstInput<ImageCPU>&>(*node.imageInput(0))
        .setData(ORVO_NEW ImageCPU(image.image()));
    node.spOutputImage_.setDataWithNoOwnership(&target.image());
    node.oOutputRegionInPixels_ = pixels(-2, -3, 11, 12);
    node.processSlice(0, 12);
    expectNear(target.picture(), this->expected(source, Picture(-2, -3, 11, 12)), 3e-5F);
}

TYPED_TEST(LabNodes, MissingImagesFail) {
    OpenNode<TypeParam> node;
    node.oOutputRegionInPixels_ = pixels(0, 0, 2, 2);
    ORVO_EXPECT_INTERNAL(node.processSlice(0, 1), "Enforce spData_.get() != NULL");
    FilterImage image(ImageCPU::PIXEL_FORMAT_RGBA32F, Picture(0, 0, 2, 2), 2);
    dynamic_cast<DataFlow::ConstInput<ImageCPU>&>(*node.imageInput(0))
        .setData(ORVO_NEW ImageCPU(image.image()));
    ORVO_EXPECT_INTERNAL(node.processSlice(0, 1), "Enforce spData_.get() != NULL");
}

TYPED_TEST(LabNodes, OtherFormatsAreRefused) {
    FilterImage good(ImageCPU::PIXEL_FORMAT_RGBA32F, Picture(0, 0, 4, 4), 4);
    for (auto format :
         {ImageCPU::PIXEL_FORMAT_RGB16, ImageCPU::PIXEL_FORMAT_RGBA16, ImageCPU::PIXEL_FORMAT_LUMINANCE8,
          ImageCPU::PIXEL_FORMAT_LUMINANCE16, ImageCPU::PIXEL_FORMAT_LUMINANCE32F,
          ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA16,
          ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F}) {
        ImageCPU wrong(format, pixels(0, 0, 4, 4), PixelExtentInWorldSpace(1.0F, 1.0F), ExtentInPixelSpace());
        wrong.initializeToTransparentBlack();
        FilterRoad<TypeParam> in;
        in.controller().setSingleThreadMode(true);
        ORVO_EXPECT_INTERNAL(in.runInto(wrong, good.image(), world(0, 0, 4, 4)), "Invalid input image type");
        FilterRoad<TypeParam> out;
        out.controller().setSingleThreadMode(true);
        ORVO_EXPECT_INTERNAL(out.runInto(good.image(), wrong, world(0, 0, 4, 4)), "Invalid input image type");
        // On a worker the failure is wrapped.
        FilterRoad<TypeParam> threaded;
        try {
            threaded.runInto(wrong, good.image(), world(0, 0, 4, 4));
            ADD_FAILURE() << "nothing thrown";
        } catch (SharedException const& exception) {
            auto const* const pInner = dynamic_cast<InternalException const*>(exception.exception().get());
            ASSERT_NE(nullptr, pInner);
            EXPECT_EQ("Invalid input image type", std::string(pInner->message()));
        }
    }
}

TEST(RGBToLABCPU, LosesNegativeColoursAndLightnessAboveOne) {
    ImageFlowLayers const layers;
    Picture source(0, 0, 2, 1);
    // A blue has a negative b; 2 is lighter than white.
    source.at(0, 0) = float4(0.0F, 0.0F, 1.0F, 0.5F);
    source.at(1, 0) = float4(2.0F, 2.0F, 2.0F, 2.0F);
    DoublePixel const blue = reference::labFromRGB({0, 0, 1, 1});
    ASSERT_LT(blue[2], 0);
    ASSERT_GT(reference::labFromRGB({2, 2, 2, 1})[0], 1);
    FilterImage image(ImageCPU::PIXEL_FORMAT_RGBA32F, source, 2);
    FilterRoad<RGBToLABCPU> road;
    ImageCPU const* const pResult = road.run(image.image(), world(0, 0, 2, 1));
    ASSERT_NE(nullptr, pResult);
    Picture const result = pictureOf(*pResult);
    EXPECT_NEAR(blue[0], result.at(0, 0).x, 1e-5);
    EXPECT_NEAR(blue[1], result.at(0, 0).y, 1e-5);
    EXPECT_EQ(0.0F, result.at(0, 0).z);
    EXPECT_EQ(0.5F, result.at(0, 0).w);
    EXPECT_EQ(1.0F, result.at(1, 0).x);
    EXPECT_EQ(1.0F, result.at(1, 0).w);
}

} // namespace
