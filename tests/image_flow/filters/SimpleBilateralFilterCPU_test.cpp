#include "orvo/image_flow/filters/SimpleBilateralFilterCPU.h"

#include "orvo/core/exceptions/SharedException.h"
#include "tests/image_flow/support/FastBilateralTesting.h"
#include "tests/image_flow/support/FilterRoad.h"
#include "tests/support/Expect.h"
#include "tests/support/ImageFlowLayers.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <utility>

namespace {

using namespace ORVO;
using namespace ORVO::Test;

float const kNaN = std::numeric_limits<float>::quiet_NaN();

/// Every test runs with each instruction set, the plain version among them.
class SimpleBilateralFilterCPUOf : public testing::TestWithParam<ImageRuntime::InstructionSet> {
protected:
    ImageFlowLayers oLayers_;
    ScopedInstructionSet oActive_{GetParam()};
};

/// Lets the node run on images and a region of the test's choice.
struct OpenNode : SimpleBilateralFilterCPU {
    using ImageFilter::oOutputRegionInPixels_;
    using ImageFilter::spOutputImage_;
};

/// The filter's slices on a picture, at the places of another, both with padding.
Picture applied(Picture const& source, Picture const& destination, float spatialSigma, float rangeSigma,
                bool colorize, int padding = 0) {
    FilterImage input(ImageCPU::PIXEL_FORMAT_RGBA32F, source, source.width + padding);
    FilterImage output(ImageCPU::PIXEL_FORMAT_RGBA32F, destination, destination.width + 2 * padding);
    OpenNode node;
    node.spatialSigma().setValue(spatialSigma);
    node.rangeSigma().setValue(rangeSigma);
    node.colorize().setValue(colorize);
    dynamic_cast<DataFlow::ConstInput<ImageCPU>&>(*node.imageInput(0)).setData(&input.image());
    auto& connector = dynamic_cast<DataFlow::ConstInput<ImageCPU>&>(*node.imageInput(0));
    node.spOutputImage_.setDataWithNoOwnership(&output.image());
    node.oOutputRegionInPixels_ = destination.rectangle();
    for (int row = 0; row < destination.height; row += 3) {
        node.processSlice(std::size_t(row), std::size_t(std::min(row + 3, destination.height)));
    }
    connector.releaseData();
    EXPECT_TRUE(output.paddingIsUntouched());
    return output.picture();
}

/// The formulas in double precision, for an image at the origin without padding.
Picture expected(Picture const& source, double spatialSigma, double rangeSigma, bool colorize) {
    Picture result(0, 0, source.width, source.height);
    int const half = int(std::ceil(spatialSigma * 2.146)) / 2;
    long const count = long(source.pixels.size());
    auto const grey = [](double const* p) { return 0.39 * p[0] + 0.5 * p[1] + 0.11 * p[2]; };
    for (int y = 0; y < source.height; ++y) {
        for (int x = 0; x < source.width; ++x) {
            double sum[3] = {0, 0, 0};
            double total = 0;
            for (int i = -half; i <= half; ++i) {
                for (int j = -half; j <= half; ++j) {
                    unsigned const nx = std::min(unsigned(x + i), unsigned(source.width));
                    unsigned const ny = std::min(unsigned(y + j), unsigned(source.height));
                    long const index = std::min(long(ny) * source.width + long(nx), count - 1);
                    float4 const& n = source.pixels[std::size_t(index)];
                    float4 const& c = source.at(x, y);
                    double sample[3] = {n.x, n.y, n.z};
                    double const diff[3] = {std::abs(double(n.x) - c.x), std::abs(double(n.y) - c.y),
                                            std::abs(double(n.z) - c.z)};
                    double d = grey(diff);
                    if (colorize) {
                        d = diff[0] * diff[0] + diff[1] * diff[1] + diff[2] * diff[2];
                    } else {
                        sample[0] = sample[1] = sample[2] = grey(sample);
                    }
                    double const w = std::exp(-(i * i + j * j) / (2 * spatialSigma * spatialSigma)) *
                                     std::exp(-d * d / (2 * rangeSigma * rangeSigma));
                    for (int k = 0; k < 3; ++k) {
                        sum[k] += w * sample[k];
                    }
                    total += w;
                }
            }
            result.at(x, y) =
                float4(float(sum[0] / total), float(sum[1] / total), float(sum[2] / total), 0.0F);
        }
    }
    return clamped(result);
}

TEST_P(SimpleBilateralFilterCPUOf, HasItsNameConnectorsAndParameters) {
    SimpleBilateralFilterCPU node;
    EXPECT_EQ("ORVO::SimpleBilateralFilterCPU", node.name());
    EXPECT_EQ(ORVO_TARGET_CPU, node.getInputTargetPlatform());
    EXPECT_EQ(ORVO_TARGET_CPU, node.getOutputTargetPlatform());
    EXPECT_EQ("InputImage", node.imageInput(0)->name());
    EXPECT_EQ("OutputImage", node.imageOutput()->name());
    EXPECT_EQ(&node.spatialSigma(), node.parameter("spatialSigma"));
    EXPECT_EQ(0.1F, node.spatialSigma().value());
    EXPECT_EQ(0.0F, node.spatialSigma().lowerBound());
    EXPECT_EQ(100.0F, node.spatialSigma().upperBound());
    EXPECT_EQ(&node.rangeSigma(), node.parameter("rangeSigma"));
    EXPECT_EQ(0.1F, node.rangeSigma().value());
    EXPECT_EQ(0.0F, node.rangeSigma().lowerBound());
    EXPECT_EQ(1.0F, node.rangeSigma().upperBound());
    EXPECT_EQ(&node.colorize(), node.parameter("colorize"));
    EXPECT_FALSE(node.colorize().value());
}

TEST_P(SimpleBilateralFilterCPUOf, RegionsGrowByThePlainSigma) {
    SimpleBilateralFilterCPU node;
    node.spatialSigma().setValue(2.5F);
    EXPECT_EQ(world(-2.5F, -2.5F, 15, 25), node.needed(world(0, 0, 10, 20), "InputImage", {}));
    EXPECT_EQ(world(-2.5F, -2.5F, 15, 25), node.changed(world(0, 0, 10, 20), "InputImage", {}));
    node.spatialSigma().setValue(kNaN);
    EXPECT_EQ(world(0, 0, 10, 20), node.needed(world(0, 0, 10, 20), "InputImage", {}));
}

TEST_P(SimpleBilateralFilterCPUOf, WindowOfOnePixelGivesThePixelItself) {
    Picture const source = randomPicture(0, 0, 7, 5, 41);
    // ceil(0.1 * 2.146) = 1, halved 0; the same for NaN and below 0.
    for (float sigma : {0.1F, 0.46F, kNaN, -3.0F}) {
        Picture const colour = applied(source, source, sigma, 0.1F, true);
        Picture const grey = applied(source, source, sigma, 0.1F, false);
        if (std::isnan(sigma)) {
            // The weight of the pixel is exp(0 / NaN).
            EXPECT_TRUE(std::isnan(colour.at(0, 0).x));
            continue;
        }
        for (int row = 0; row < 5; ++row) {
            for (int column = 0; column < 7; ++column) {
                float4 const& s = source.at(column, row);
                EXPECT_EQ(float4(s.x, s.y, s.z, 0.0F), colour.at(column, row));
                float const g = 0.39F * s.x + 0.5F * s.y + 0.11F * s.z;
                EXPECT_NEAR(g, grey.at(column, row).x, 1e-6);
                EXPECT_EQ(grey.at(column, row).x, grey.at(column, row).y);
                EXPECT_EQ(grey.at(column, row).x, grey.at(column, row).z);
                EXPECT_EQ(0.0F, grey.at(column, row).w);
            }
        }
    }
}

TEST_P(SimpleBilateralFilterCPUOf, SigmaOfZeroGivesWhatTheFloatsGive) {
    // exp(-0 / 0) is NaN, at the only pixel of the window.
    Picture const source = randomPicture(0, 0, 3, 3, 42);
    for (bool colorize : {false, true}) {
        EXPECT_TRUE(std::isnan(applied(source, source, 0.0F, 0.1F, colorize).at(1, 1).x));
        EXPECT_TRUE(std::isnan(applied(source, source, 1.0F, 0.0F, colorize).at(1, 1).x));
    }
}

TEST_P(SimpleBilateralFilterCPUOf, TwoByTwoPixelsAreWorkedOutByHand) {
    // Sigma 0.9: ceil(1.9314) = 2, halved 1: a window of 3 by 3. At (0, 0), with a = exp(-1 / 1.62), b =
    // exp(-2 / 1.62): positions left and above count as column 2 and row 2, which are the last pixel (row 2)
    // or the first of the next row (column 2 of row 0 is pixel 2, of row 1 pixel 4, beyond the last).
    Picture source(0, 0, 2, 2, float4(0.0F, 0.0F, 0.0F, 1.0F));
    source.at(1, 1) = float4(0.5F, 0.5F, 0.5F, 1.0F);
    source.at(0, 1) = float4(0.25F, 0.25F, 0.25F, 1.0F);
    double const a = std::exp(-1 / 1.62);
    double const b = std::exp(-2 / 1.62);
    double const far = std::exp(-0.25 / 2);
    double const near = std::exp(-0.0625 / 2);
    // i = -1: j = -1 and j = 1 the last pixel, j = 0 pixel (0, 1). i = 0: j = -1 the last, j = 0 itself, j =
    // 1 (0, 1). i = 1: j = -1 the last, j = 0 pixel (1, 0), j = 1 the last.
    double const sum =
        2 * b * far * 0.5 + a * near * 0.25 + a * far * 0.5 + a * near * 0.25 + 2 * b * far * 0.5;
    double const total = 2 * b * far + a * near + a * far + 1 + a * near + 2 * b * far + a;
    Picture const result = applied(source, source, 0.9F, 1.0F, false);
    EXPECT_NEAR(sum / total, result.at(0, 0).x, 1e-6);
}

TEST_P(SimpleBilateralFilterCPUOf, AgreesWithDoublePrecision) {
    Picture const source = randomPicture(0, 0, 23, 17, 43);
    for (float sigma : {0.1F, 0.9F, 1.4F, 2.0F, 3.5F}) {
        for (float range : {0.1F, 0.5F}) {
            for (bool colorize : {false, true}) {
                expectNear(applied(source, source, sigma, range, colorize),
                           expected(source, sigma, range, colorize), 2e-5F);
            }
        }
    }
}

TEST_P(SimpleBilateralFilterCPUOf, PaddingAndPositionChangeNothing) {
    Picture const source = randomPicture(0, 0, 19, 14, 44);
    Picture const plain = applied(source, source, 2.0F, 0.3F, true);
    EXPECT_TRUE(areIdentical(plain, applied(source, source, 2.0F, 0.3F, true, 5)));
    Picture moved = source;
    moved.x = -7;
    moved.y = 12;
    EXPECT_TRUE(areIdentical(plain, applied(moved, moved, 2.0F, 0.3F, true, 3)));
    // A part of the output is a part of the result.
    Picture const part = applied(moved, Picture(-2, 15, 6, 7), 2.0F, 0.3F, true);
    for (int row = 0; row < 7; ++row) {
        for (int column = 0; column < 6; ++column) {
            EXPECT_EQ(plain.at(column + 5, row + 3), part.at(column, row));
        }
    }
}

TEST_P(SimpleBilateralFilterCPUOf, OutputBeyondTheInputHasATransparentCentre) {
    Picture const source(0, 0, 4, 3, float4(0.5F, 0.5F, 0.5F, 1.0F));
    // A window of one: all neighbours of a pixel outside are pixels of the image, at a distance of 0.5 from
    // black; their weights cancel.
    Picture const result = applied(source, Picture(-3, -2, 10, 8), 0.1F, 0.3F, false);
    expectNear(result, Picture(-3, -2, 10, 8, float4(0.5F, 0.5F, 0.5F, 0.0F)), 1e-6F);
}

TEST_P(SimpleBilateralFilterCPUOf, InputWithoutPixelsIsTransparentBlack) {
    Picture const result = applied(Picture(0, 0, 0, 0), Picture(0, 0, 3, 2, float4(0.7F)), 1.0F, 0.3F, true);
    expectNear(result, Picture(0, 0, 3, 2), 0.0F);
}

/// The result of a region that is computed from no more than its surroundings of so many pixels.
Picture appliedToPart(Picture const& source, Picture const& place, int margin, float sigma, bool colorize) {
    int const left = std::max(place.x - margin, source.x);
    int const top = std::max(place.y - margin, source.y);
    Picture part(left, top, std::min(place.x + place.width + margin, source.x + source.width) - left,
                 std::min(place.y + place.height + margin, source.y + source.height) - top);
    for (int row = 0; row < part.height; ++row) {
        for (int column = 0; column < part.width; ++column) {
            part.at(column, row) = source.at(left - source.x + column, top - source.y + row);
        }
    }
    return applied(part, place, sigma, 0.4F, colorize);
}

/// How many pixels that lie at least `inset` pixels inside the picture differ between the picture as a whole
/// and its tiles of 9 by 8 pixels.
std::size_t differingInTiles(Picture const& source, Picture const& whole, int margin, float sigma,
                             bool colorize, int inset) {
    std::size_t nDiffering = 0;
    for (int top = 0; top < source.height; top += 8) {
        for (int left = 0; left < source.width; left += 9) {
            Picture const place(source.x + left, source.y + top, std::min(9, source.width - left),
                                std::min(8, source.height - top));
            Picture const tile = appliedToPart(source, place, margin, sigma, colorize);
            for (int row = 0; row < tile.height; ++row) {
                for (int column = 0; column < tile.width; ++column) {
                    int const x = left + column;
                    int const y = top + row;
                    bool const bInside =
                        x >= inset && y >= inset && x + inset < source.width && y + inset < source.height;
                    nDiffering += bInside && !(tile.at(column, row) == whole.at(x, y)) ? 1 : 0;
                }
            }
        }
    }
    return nDiffering;
}

TEST_P(SimpleBilateralFilterCPUOf, TilesAreTheWholePictureButForItsOutermostHalfWindow) {
    Picture const source = randomPicture(-3, 5, 40, 37, 48);
    for (bool colorize : {false, true}) {
        // Half windows of trunc(7 / 2) and trunc(13 / 2) pixels: no more than the sigma that tiles ask for.
        for (auto const& [sigma, half] : {std::pair(3.0F, 3), std::pair(6.0F, 6)}) {
            Picture const whole = applied(source, source, sigma, 0.4F, colorize);
            int const margin = int(std::ceil(sigma));
            EXPECT_EQ(0U, differingInTiles(source, whole, margin, sigma, colorize, half)) << sigma;
            // At the edges a tap beyond the picture finds another pixel in a tile than in the whole, and with
            // less of a margin so do taps at the seams.
            EXPECT_LT(0U, differingInTiles(source, whole, margin, sigma, colorize, 0)) << sigma;
            EXPECT_LT(0U, differingInTiles(source, whole, half - 1, sigma, colorize, half)) << sigma;
        }
    }
}

TEST_P(SimpleBilateralFilterCPUOf, TilesOfALargeSigmaNeedMoreThanTheSigma) {
    // ceil(2.146 * 7) = 16, whose half is 8.
    Picture const source = randomPicture(0, 0, 31, 29, 49);
    Picture const whole = applied(source, source, 7.0F, 0.4F, true);
    EXPECT_LT(0U, differingInTiles(source, whole, 7, 7.0F, true, 8));
    EXPECT_EQ(0U, differingInTiles(source, whole, 8, 7.0F, true, 8));
}

TEST_P(SimpleBilateralFilterCPUOf, SigmaBeyondTheImageIsServed) {
    Picture const source = randomPicture(0, 0, 3, 2, 45);
    expectNear(applied(source, source, 20.0F, 0.5F, false), expected(source, 20.0F, 0.5F, false), 2e-5F);
}

TEST_P(SimpleBilateralFilterCPUOf, FramesRunOnThreadsAndGiveTheSame) {
    Picture const source = randomPicture(3, -2, 60, 50, 46);
    Picture const exact = applied(source, source, 1.5F, 0.3F, true);
    FilterImage image(ImageCPU::PIXEL_FORMAT_RGBA32F, source, 61);
    FilterImage target(ImageCPU::PIXEL_FORMAT_RGBA32F, Picture(3, -2, 60, 50), 64);
    FilterRoad<SimpleBilateralFilterCPU> road;
    road.filter().spatialSigma().setValue(1.5F);
    road.filter().rangeSigma().setValue(0.3F);
    road.filter().colorize().setValue(true);
    road.runInto(image.image(), target.image(), worldOf(source));
    EXPECT_TRUE(areIdentical(exact, target.picture()));
}

TEST_P(SimpleBilateralFilterCPUOf, EveryServedFormatGoesInAndOut) {
    Picture const source = randomPicture(0, 0, 16, 12, 47);
    for (auto format :
         {ImageCPU::PIXEL_FORMAT_BGR8, ImageCPU::PIXEL_FORMAT_BGRA8, ImageCPU::PIXEL_FORMAT_RGB8,
          ImageCPU::PIXEL_FORMAT_RGBA8, ImageCPU::PIXEL_FORMAT_RGB32F, ImageCPU::PIXEL_FORMAT_RGBA32F,
          ImageCPU::PIXEL_FORMAT_RGB16F, ImageCPU::PIXEL_FORMAT_RGBA16F}) {
        SCOPED_TRACE(testing::Message() << format);
        FilterImage input(format, source, 17);
        FilterImage output(format, Picture(0, 0, 16, 12), 18);
        OpenNode node;
        node.spatialSigma().setValue(1.0F);
        node.colorize().setValue(true);
        dynamic_cast<DataFlow::ConstInput<ImageCPU>&>(*node.imageInput(0))
            .setData(ORVO_NEW ImageCPU(input.image()));
        node.spOutputImage_.setDataWithNoOwnership(&output.image());
        node.oOutputRegionInPixels_ = source.rectangle();
        node.processSlice(0, 12);
        Picture exact = expected(input.picture(), 1.0, 0.1, true);
        Picture actual = output.picture();
        for (std::size_t i = 0; i < actual.pixels.size() && nChannelsOf(format) == 3; ++i) {
            EXPECT_EQ(1.0F, actual.pixels[i].w);
            actual.pixels[i].w = 0.0F;
        }
        expectNear(actual, exact, channelBytesOf(format) == 1 ? 1.01F / 255.0F : 1e-3F);
    }
}

TEST_P(SimpleBilateralFilterCPUOf, OtherFormatsAreRefused) {
    FilterImage good(ImageCPU::PIXEL_FORMAT_RGBA32F, Picture(0, 0, 4, 4), 4);
    for (auto format :
         {ImageCPU::PIXEL_FORMAT_RGB16, ImageCPU::PIXEL_FORMAT_RGBA16, ImageCPU::PIXEL_FORMAT_LUMINANCE8,
          ImageCPU::PIXEL_FORMAT_LUMINANCE16, ImageCPU::PIXEL_FORMAT_LUMINANCE32F,
          ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA16,
          ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F}) {
        ImageCPU wrong(format, pixels(0, 0, 4, 4), PixelExtentInWorldSpace(1.0F, 1.0F), ExtentInPixelSpace());
        wrong.initializeToTransparentBlack();
        for (bool wrongInput : {true, false}) {
            FilterRoad<SimpleBilateralFilterCPU> road;
            road.controller().setSingleThreadMode(true);
            ORVO_EXPECT_INTERNAL(road.runInto(wrongInput ? wrong : good.image(),
                                              wrongInput ? good.image() : wrong, world(0, 0, 4, 4)),
                                 "Invalid input image type");
        }
    }
}

TEST_P(SimpleBilateralFilterCPUOf, MissingImagesFail) {
    OpenNode node;
    node.oOutputRegionInPixels_ = pixels(0, 0, 2, 2);
    ORVO_EXPECT_INTERNAL(node.processSlice(0, 1), "Enforce spData_.get() != NULL");
    FilterImage image(ImageCPU::PIXEL_FORMAT_RGBA32F, Picture(0, 0, 2, 2), 2);
    node.spOutputImage_.setDataWithNoOwnership(&image.image());
    ORVO_EXPECT_INTERNAL(node.processSlice(0, 1), "Enforce spData_.get() != NULL");
}

INSTANTIATE_TEST_SUITE_P(All, SimpleBilateralFilterCPUOf, testing::ValuesIn(instructionSets()));

} // namespace
