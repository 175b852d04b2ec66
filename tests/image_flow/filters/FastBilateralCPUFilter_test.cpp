#include "orvo/image_flow/filters/FastBilateralCPUFilter.h"

#include "orvo/image_runtime/images/ImageCPU.h"
#include "orvo/image_runtime/images/ImageCPUReadAccessor.h"
#include "orvo/image_runtime/images/ImageCPUWriteAccessor.h"
#include "tests/image_flow/support/BilateralReference.h"
#include "tests/image_flow/support/FastBilateralTesting.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <vector>

namespace {

using namespace ORVO;
using namespace ORVO::Test;
using ImageRuntime::InstructionSet;
using ORVO::Test::reference::Settings;

float const kNaN = std::numeric_limits<float>::quiet_NaN();
float const kInfinity = std::numeric_limits<float>::infinity();

/// Every test runs with each instruction set, the plain version among them.
class FastBilateralCPUFilterOf : public testing::TestWithParam<InstructionSet> {
protected:
    ScopedInstructionSet oActive_{GetParam()};
};

TEST_P(FastBilateralCPUFilterOf, OnePixelComesBackUnchanged) {
    Picture const source(0, 0, 1, 1, float4(0.25F, 0.5F, 0.75F, 1.0F));
    // 0.39 * 0.25 + 0.5 * 0.5 + 0.11 * 0.75 = 0.43.
    expectNear(applied(source, source, {0.15, 10, 10, false}),
               Picture(0, 0, 1, 1, float4(0.43F, 0.43F, 0.43F, 1.0F)), 1e-6F);
    expectNear(applied(source, source, {0.15, 10, 10, true}), source, 2e-3F);
}

TEST_P(FastBilateralCPUFilterOf, ConstantImageKeepsItsValue) {
    for (float v : {0.0F, 0.2F, 0.5F, 0.77F, 1.0F}) {
        Picture const source(0, 0, 50, 37, float4(v, v, v, 1.0F));
        expectNear(applied(source, source, {0.15, 4, 6, false}), source, 2e-6F);
    }
}

TEST_P(FastBilateralCPUFilterOf, StepIsKept) {
    Picture source(0, 0, 60, 40, float4(0.0F, 0.0F, 0.0F, 1.0F));
    for (int row = 0; row < 40; ++row) {
        for (int column = 30; column < 60; ++column) {
            source.at(column, row) = float4(1.0F, 1.0F, 1.0F, 1.0F);
        }
    }
    // At 0.1 black and white are 10 cells apart and the blur reaches 3: neither side sees the other.
    expectNear(applied(source, source, {0.1, 5, 5, false}), source, 1e-6F);
    // At 1 they are neighbours, and the step is smoothed.
    Picture const smooth = applied(source, source, {1, 5, 5, false});
    EXPECT_GT(smooth.at(29, 20).x, 0.1F);
    EXPECT_LT(smooth.at(30, 20).x, 0.9F);
}

TEST_P(FastBilateralCPUFilterOf, TwoPixelsAreWorkedOutByHand) {
    // Sigma 1: the pixels stand in the columns 4 and 5. Range sigma 0.5: the values 0 and 0.5 stand in the
    // levels 4 and
    // 5. With e = 0.60653067 the cell of the first pixel has the value e * e * 0.5 and the weight 1 + e * e:
    // pixels are one cell apart in x and in z.
    Picture source(0, 0, 2, 1);
    source.at(0, 0) = float4(0.0F, 0.0F, 0.0F, 1.0F);
    source.at(1, 0) = float4(0.5F, 0.5F, 0.5F, 1.0F);
    double const e2 = 0.60653067 * 0.60653067;
    Picture expected(0, 0, 2, 1);
    float const first = float(0.5 * e2 / (1 + e2));
    float const second = float(0.5 / (1 + e2));
    expected.at(0, 0) = float4(first, first, first, 1.0F);
    expected.at(1, 0) = float4(second, second, second, 1.0F);
    expectNear(applied(source, source, {0.5, 1, 1, false}), expected, 1e-6F);
}

TEST_P(FastBilateralCPUFilterOf, PixelBetweenCellsIsInterpolated) {
    // Sigma 2: pixel 0 stands in column 4, pixel 1 in column 5 (0.5 is rounded up) and is read half way
    // between. Both have the value 0.5 at a range sigma of 1: level 4.5 rounds up to 5, is read half way
    // between 4 and 5. All cells around hold the same value, so the result is 0.5.
    Picture const source(0, 0, 2, 1, float4(0.5F, 0.5F, 0.5F, 1.0F));
    expectNear(applied(source, source, {1, 2, 2, false}), source, 1e-6F);
}

struct Case {
    Settings settings;
    int width;
    int height;
    float low;
    float high;
};

TEST_P(FastBilateralCPUFilterOf, GridRoadAgreesWithDoublePrecision) {
    std::uint32_t seed = 1;
    for (Case const& c :
         {Case{{0.15, 10, 10, false}, 97, 61, 0, 1}, Case{{0.15, 10, 10, true}, 97, 61, 0, 1},
          Case{{0.07, 3.7, 5.3, false}, 64, 40, 0, 1}, Case{{0.3, 2.3, 1.7, true}, 33, 29, 0, 1},
          Case{{0.06, 6.1, 6.1, false}, 70, 30, 0, 1}, Case{{0.06, 6.1, 6.1, true}, 70, 30, 0, 1},
          Case{{0.9, 0.7, 0.6, false}, 23, 17, 0, 1}, Case{{0.11, 40, 33, false}, 100, 90, 0, 1},
          Case{{0.2, 9.3, 8.1, false}, 83, 55, -2, 3}, Case{{0.06, 30.3, 25, false}, 61, 50, 0, 20},
          Case{{0.2, 1e9, 1e9, false}, 40, 30, 0, 1}, Case{{0.15, 4.1, 7.7, true}, 41, 38, 0, 3}}) {
        Picture const source = randomPicture(0, 0, c.width, c.height, ++seed, c.low, c.high);
        Picture const expected = reference::gridFilter(source, source, c.settings);
        SCOPED_TRACE(testing::Message()
                     << "range sigma " << c.settings.rangeSigma << " colorize " << c.settings.colorize);
        expectNear(applied(source, source, c.settings), expected, 5e-5F * std::max(1.0F, c.high));
    }
}

TEST_P(FastBilateralCPUFilterOf, DirectRoadAgreesWithDoublePrecision) {
    std::uint32_t seed = 50;
    // The intensities spread so far that the grid would be too deep.
    for (Case const& c :
         {Case{{0.1, 1.5, 2.5, false}, 37, 23, 0, 1000}, Case{{2.0, 1.9, 1.2, true}, 33, 21, -40, 30000},
          Case{{300, 3, 3, false}, 5, 9, -1e6F, 4e6F}, Case{{0.5, 0.6, 0.7, false}, 40, 2, 0, 3000}}) {
        Picture const source = randomPicture(0, 0, c.width, c.height, ++seed, c.low, c.high, true);
        Picture const expected = reference::directFilter(source, source, c.settings);
        SCOPED_TRACE(testing::Message()
                     << "range sigma " << c.settings.rangeSigma << " colorize " << c.settings.colorize);
        expectNear(applied(source, source, c.settings), expected, 2e-5F * std::max(-c.low, c.high));
    }
}

TEST_P(FastBilateralCPUFilterOf, DirectRoadSmoothsWhatIsNear) {
    for (bool colorize : {false, true}) {
        // One pixel far off makes the grid too deep.
        Picture source = randomPicture(0, 0, 45, 31, 60, 0.0F, 1.0F, true);
        source.at(44, 30) = float4(1e5F, 1e5F, 1e5F, 1.0F);
        Settings const settings = {0.15, 2, 3, colorize};
        Picture expected = reference::directFilter(source, source, settings);
        Picture result = applied(source, source, settings);
        EXPECT_NEAR(expected.at(44, 30).x, result.at(44, 30).x, 5.0);
        result.at(44, 30) = expected.at(44, 30);
        expectNear(result, expected, 5e-5F);
        // The noise is a quarter of the range.
        EXPECT_GT(std::abs(result.at(3, 3).x - source.at(3, 3).x), 0.001F);
    }
}

TEST_P(FastBilateralCPUFilterOf, TapsPastAnEdgeReadTheNeighbouringRow) {
    // The pixel at the end of the first row is 1 as all around it but the first one of the second row, which
    // follows it in memory. With a radius of 2 it is reached as a neighbour: dx = 1 weighs exp(-2), its own
    // place (dx = -2, dy = 1) only exp(-10), and a difference of 2 at a sigma of 2 weighs exp(-1/2).
    Picture source(0, 0, 3, 4, float4(1.0F, 1.0F, 1.0F, 1.0F));
    source.at(0, 1) = float4(3.0F, 3.0F, 3.0F, 1.0F);
    source.at(1, 3) = float4(1e6F, 1e6F, 1e6F, 1.0F);
    Settings const settings = {2, 0.5, 0.5, false};
    Picture const expected = reference::directFilter(source, source, settings);
    Picture const result = applied(source, source, settings);
    EXPECT_NEAR(expected.at(2, 0).x, result.at(2, 0).x, 1e-5);
    EXPECT_GT(result.at(2, 0).x, 1.05F);
}

TEST_P(FastBilateralCPUFilterOf, SmallRangeSigmaPassesTheImageUnsmoothed) {
    Picture const source = randomPicture(0, 0, 21, 13, 7);
    for (double sigma : {0.05, 0.01, 0.0, -1.0, double(kNaN), -double(kInfinity)}) {
        for (bool colorize : {false, true}) {
            expectNear(applied(source, source, {sigma, 10, 10, colorize}),
                       reference::unsmoothed(source, source, colorize), 3e-5F);
        }
    }
}

TEST_P(FastBilateralCPUFilterOf, SenselessSpatialSigmasPassTheImageUnsmoothed) {
    Picture const source = randomPicture(0, 0, 21, 13, 8);
    for (double sigma : {0.0, -3.0, 0.05, double(kNaN), -double(kInfinity)}) {
        expectNear(applied(source, source, {0.15, sigma, 10, false}),
                   reference::unsmoothed(source, source, false), 3e-6F);
        expectNear(applied(source, source, {0.15, 10, sigma, true}),
                   reference::unsmoothed(source, source, true), 3e-5F);
    }
}

TEST_P(FastBilateralCPUFilterOf, SmallSigmaWithARefusedGridPassesTheImageUnsmoothed) {
    // 1500 columns at a sigma of 0.4 make 3755 cells, times 14 levels more than 8192; the radius is 1.
    Picture const source = randomPicture(0, 0, 1500, 3, 9);
    for (bool colorize : {false, true}) {
        expectNear(applied(source, source, {0.15, 0.4, 0.4, colorize}),
                   reference::unsmoothed(source, source, colorize), colorize ? 3e-5F : 3e-6F);
    }
}

TEST_P(FastBilateralCPUFilterOf, HugeSigmasAverageAsFarAsTheLevelsLet) {
    Picture const source = randomPicture(0, 0, 31, 17, 10);
    for (double sigma : {1e30, double(kInfinity)}) {
        // One cell in x and y holds all pixels: as a sigma far beyond the image.
        expectNear(applied(source, source, {0.15, sigma, sigma, false}),
                   reference::gridFilter(source, source, {0.15, 1e12, 1e12, false}), 5e-6F);
    }
    // One level: the plain mean of the premultiplied luminance.
    double sum = 0;
    for (auto const& p : reference::workingPicture(source, source, false)) {
        sum += p[0];
    }
    Picture const flat = applied(source, source, {1e30, 1e30, 1e30, false});
    double const mean = sum / (31.0 * 17.0);
    EXPECT_NEAR(mean / source.at(5, 5).w, flat.at(5, 5).x, 1e-5);
}

TEST_P(FastBilateralCPUFilterOf, EqualValuesOutsideTheUnitRangePassUnchanged) {
    for (float v : {1.5F, -0.25F, 3e4F}) {
        Picture const source(0, 0, 9, 7, float4(v, v, v, 1.0F));
        expectNear(applied(source, source, {0.15, 3, 3, false}), source, 1e-6F * std::abs(v));
        expectNear(applied(source, source, {0.15, 3, 3, true}), reference::unsmoothed(source, source, true),
                   2e-5F * std::max(1.0F, std::abs(v)));
    }
}

TEST_P(FastBilateralCPUFilterOf, TransparentPixelsKeepTheirPremultipliedValue) {
    Picture source(0, 0, 20, 20, float4(0.5F, 0.5F, 0.5F, 0.5F));
    source.at(7, 7) = float4(0.9F, 0.9F, 0.9F, 0.0F);
    Picture const result = applied(source, source, {0.15, 3, 3, false});
    // Premultiplied it is 0, alone in its level but for the blur over the levels, which its own pixel
    // dominates little.
    Picture const expected = reference::gridFilter(source, source, {0.15, 3, 3, false});
    expectNear(result, expected, 2e-6F);
    EXPECT_EQ(0.0F, result.at(7, 7).w);
    expectNear(applied(source, source, {0.15, 3, 3, true}),
               reference::gridFilter(source, source, {0.15, 3, 3, true}), 3e-5F);
}

TEST_P(FastBilateralCPUFilterOf, NaNStaysWhereItIs) {
    Picture source = randomPicture(0, 0, 40, 30, 11, 0.0F, 1.0F, true);
    Picture without = source;
    source.at(17, 11) = float4(kNaN, 0.5F, 0.5F, 1.0F);
    Picture const result = applied(source, source, {0.15, 4, 4, false});
    for (int row = 0; row < 30; ++row) {
        for (int column = 0; column < 40; ++column) {
            bool const isSpecial = column == 17 && row == 11;
            EXPECT_EQ(isSpecial, std::isnan(result.at(column, row).x)) << column << ", " << row;
        }
    }
    // The others are what they would be if the pixel were not there: nearly what they were with it.
    Picture const smooth = applied(without, without, {0.15, 4, 4, false});
    EXPECT_NEAR(smooth.at(39, 29).x, result.at(39, 29).x, 1e-6);
    EXPECT_NEAR(smooth.at(18, 12).x, result.at(18, 12).x, 0.05);
}

TEST_P(FastBilateralCPUFilterOf, AnImageOfNaNStaysOne) {
    Picture const source(0, 0, 19, 11, float4(kNaN, kNaN, kNaN, 1.0F));
    for (bool colorize : {false, true}) {
        Picture const result = applied(source, source, {0.15, 4, 4, colorize});
        EXPECT_TRUE(std::all_of(result.pixels.begin(), result.pixels.end(),
                                [](float4 const& p) { return std::isnan(p.x) && p.w == 1.0F; }));
    }
}

TEST_P(FastBilateralCPUFilterOf, InfinityEndsInDefinedPixels) {
    for (float special : {kInfinity, -kInfinity}) {
        Picture source = randomPicture(0, 0, 12, 9, 12, 0.0F, 1.0F, true);
        source.at(5, 5) = float4(special, 0.5F, 0.5F, 1.0F);
        for (bool colorize : {false, true}) {
            Picture const result = applied(source, source, {0.15, 1, 1, colorize});
            EXPECT_EQ(1.0F, result.at(0, 0).w);
            // A pixel out of reach of the special one keeps a finite value.
            EXPECT_TRUE(std::isfinite(result.at(0, 0).x));
        }
    }
}

TEST_P(FastBilateralCPUFilterOf, DestinationBeyondTheSourceIsTransparentBlack) {
    Picture const source = randomPicture(-3, 5, 20, 15, 13, 0.0F, 1.0F);
    for (bool colorize : {false, true}) {
        for (Picture const& destination :
             {Picture(-8, 0, 33, 27), Picture(0, 8, 6, 5), Picture(10, 12, 20, 20), Picture(-3, 5, 20, 15)}) {
            Settings const settings = {0.2, 3.3, 2.7, colorize};
            expectNear(applied(source, destination, settings),
                       reference::gridFilter(source, destination, settings), 5e-5F);
        }
        Picture const far = applied(source, Picture(100, 100, 4, 3), {0.2, 3, 3, colorize});
        expectNear(far, Picture(100, 100, 4, 3), 1e-6F);
    }
}

TEST_P(FastBilateralCPUFilterOf, EmptyDestinationsAreFilledAtOnce) {
    Picture const source = randomPicture(0, 0, 5, 5, 14);
    for (Picture const& destination : {Picture(0, 0, 0, 5), Picture(0, 0, 5, 0), Picture(0, 0, 0, 0)}) {
        EXPECT_TRUE(applied(source, destination, {0.15, 3, 3, false}).pixels.empty());
    }
    ImageCPU const none;
    ImageCPUReadAccessor read(none);
    ImageCPU target;
    ImageCPUWriteAccessor write(target);
    EXPECT_TRUE(FastBilateralCPUFilter().applyFilter(&read, &write, 0.15F, 3.0F, 3.0F, false));
}

TEST_P(FastBilateralCPUFilterOf, EmptySourceGivesTransparentBlack) {
    Picture const source(0, 0, 0, 0);
    expectNear(applied(source, Picture(0, 0, 7, 5, float4(9.0F)), {0.15, 3, 3, true}), Picture(0, 0, 7, 5),
               1e-6F);
}

TEST_P(FastBilateralCPUFilterOf, ResultGreyIsTheSameInAllChannels) {
    Picture const source = randomPicture(0, 0, 31, 22, 15);
    for (float4 const& p : applied(source, source, {0.15, 5, 5, false}).pixels) {
        EXPECT_EQ(p.x, p.y);
        EXPECT_EQ(p.x, p.z);
    }
}

TEST_P(FastBilateralCPUFilterOf, SourceAndDestinationMayBeOne) {
    Picture picture = randomPicture(0, 0, 31, 22, 16);
    Picture const expected = applied(picture, picture, {0.15, 5, 5, true});
    PictureReader reader(picture);
    PictureWriter writer(picture);
    EXPECT_TRUE(FastBilateralCPUFilter().applyFilter(&reader, &writer, 0.15F, 5.0F, 5.0F, true));
    expectNear(picture, expected, 0.0F);
}

TEST_P(FastBilateralCPUFilterOf, LibraryImagesAndForeignAccessorsGiveTheSame) {
    Picture const source = randomPicture(-7, 2, 45, 33, 17);
    for (bool colorize : {false, true}) {
        Settings const settings = {0.15, 4, 4, colorize};
        Picture const expected = clamped(applied(source, source, settings));
        FilterImage input(ImageCPU::PIXEL_FORMAT_RGBA32F, source, 51);
        FilterImage output(ImageCPU::PIXEL_FORMAT_RGBA32F, Picture(-7, 2, 45, 33), 48);
        EXPECT_TRUE(applyTo(input.image(), output.image(), settings));
        EXPECT_TRUE(areIdentical(expected, output.picture()));
        EXPECT_TRUE(output.paddingIsUntouched());
    }
}

TEST_P(FastBilateralCPUFilterOf, EveryServedFormatGoesInAndOut) {
    Picture const source = randomPicture(0, 0, 26, 19, 18);
    Settings const settings = {0.15, 4, 4, true};
    for (auto format :
         {ImageCPU::PIXEL_FORMAT_BGR8, ImageCPU::PIXEL_FORMAT_BGRA8, ImageCPU::PIXEL_FORMAT_RGB8,
          ImageCPU::PIXEL_FORMAT_RGBA8, ImageCPU::PIXEL_FORMAT_RGB32F, ImageCPU::PIXEL_FORMAT_RGBA32F,
          ImageCPU::PIXEL_FORMAT_RGB16F, ImageCPU::PIXEL_FORMAT_RGBA16F}) {
        SCOPED_TRACE(testing::Message() << format);
        FilterImage input(format, source, 29);
        FilterImage output(format, Picture(0, 0, 26, 19), 30);
        ASSERT_TRUE(applyTo(input.image(), output.image(), settings));
        Picture const expected = clamped(reference::gridFilter(input.picture(), source, settings));
        Picture actual = output.picture();
        for (std::size_t i = 0; i < actual.pixels.size(); ++i) {
            if (nChannelsOf(format) == 3) {
                actual.pixels[i].w = expected.pixels[i].w;
            }
        }
        expectNear(actual, expected, channelBytesOf(format) == 1 ? 1.01F / 255.0F : 1e-3F);
    }
}

TEST_P(FastBilateralCPUFilterOf, OtherFormatsAreRefusedAndNothingIsWritten) {
    Picture const picture(0, 0, 4, 3, float4(0.5F));
    for (auto format :
         {ImageCPU::PIXEL_FORMAT_RGB16, ImageCPU::PIXEL_FORMAT_RGBA16, ImageCPU::PIXEL_FORMAT_LUMINANCE8,
          ImageCPU::PIXEL_FORMAT_LUMINANCE16, ImageCPU::PIXEL_FORMAT_LUMINANCE32F,
          ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA16,
          ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F}) {
        ImageCPU wrong(format, picture.rectangle(), PixelExtentInWorldSpace(1.0F, 1.0F),
                       ExtentInPixelSpace());
        wrong.initializeToTransparentBlack();
        FilterImage good(ImageCPU::PIXEL_FORMAT_RGBA32F, picture, 4);
        ORVO_EXPECT_INTERNAL(applyTo(wrong, good.image(), {0.15, 3, 3, false}), "Invalid input image type");
        ORVO_EXPECT_INTERNAL(applyTo(good.image(), wrong, {0.15, 3, 3, false}), "Invalid input image type");
        EXPECT_TRUE(areIdentical(picture, good.picture()));
    }
}

TEST_P(FastBilateralCPUFilterOf, MissingAccessorsAreRefused) {
    Picture picture(0, 0, 2, 2);
    PictureReader reader(picture);
    PictureWriter writer(picture);
    FastBilateralCPUFilter filter;
    ORVO_EXPECT_INTERNAL(filter.applyFilter(nullptr, &writer, 0.15F, 3.0F, 3.0F, false),
                         "Enforce source != NULL");
    ORVO_EXPECT_INTERNAL(filter.applyFilter(&reader, nullptr, 0.15F, 3.0F, 3.0F, false),
                         "Enforce destination != NULL");
}

INSTANTIATE_TEST_SUITE_P(All, FastBilateralCPUFilterOf, testing::ValuesIn(instructionSets()));

} // namespace
