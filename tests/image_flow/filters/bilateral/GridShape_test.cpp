#include "orvo/image_flow/filters/bilateral/GridShape.h"

#include <gtest/gtest.h>

#include <limits>

namespace {

using namespace ORVO::ImageFlow::bilateral;

float const kNaN = std::numeric_limits<float>::quiet_NaN();
float const kInfinity = std::numeric_limits<float>::infinity();
float const kLargest = std::numeric_limits<float>::max();

TEST(GridShape, AxisOfOrdinaryImagesIsTheUnitRange) {
    ValueRange const range = valueRange(0.25F, 0.5F);
    EXPECT_EQ(0.0F, range.fMin);
    EXPECT_EQ(1.0F, range.fExtent);
    EXPECT_EQ(1.0F, valueRange(0.0F, 1.0F).fExtent);
}

TEST(GridShape, AxisIsFittedWhereAValueLiesOutside) {
    EXPECT_EQ(0.5F, valueRange(0.5F, 1.5F).fMin);
    EXPECT_EQ(1.0F, valueRange(0.5F, 1.5F).fExtent);
    EXPECT_EQ(-0.25F, valueRange(-0.25F, 0.5F).fMin);
    EXPECT_EQ(0.75F, valueRange(-0.25F, 0.5F).fExtent);
    EXPECT_EQ(0.0F, valueRange(2.0F, 2.0F).fExtent);
}

TEST(GridShape, AxisOfAnImageOfNaNIsTheUnitRange) {
    // Nothing was lower than the start of the search, nor higher.
    ValueRange const range = valueRange(kLargest, -kLargest);
    EXPECT_EQ(0.0F, range.fMin);
    EXPECT_EQ(1.0F, range.fExtent);
}

TEST(GridShape, CellsAreCountedFromTheLastPixelAndPadded) {
    EXPECT_EQ(8U, cellsAlong(1, 10.0F, 4.0F, 0.0F));
    EXPECT_EQ(8U, cellsAlong(10, 10.0F, 4.0F, 0.0F));
    EXPECT_EQ(9U, cellsAlong(11, 10.0F, 4.0F, 0.0F));
    EXPECT_EQ(199U, cellsAlong(1920, 10.0F, 4.0F, 0.0F));
    EXPECT_EQ(115U, cellsAlong(1080, 10.0F, 4.0F, 0.0F));
    EXPECT_EQ(10U, cellsAlong(21, 10.0F, 4.0F, 0.5F));
}

TEST(GridShape, CellsOfSenselessSigmasDoNotOverflow) {
    EXPECT_EQ(8U, cellsAlong(100, kInfinity, 4.0F, 0.0F));
    EXPECT_EQ(8U, cellsAlong(100, kNaN, 4.0F, 0.0F));
    EXPECT_EQ(8U, cellsAlong(100, -3.0F, 4.0F, 0.0F));
    EXPECT_LT(std::size_t(1) << 32U, cellsAlong(100, 0.0F, 4.0F, 0.0F));
    EXPECT_LT(std::size_t(1) << 32U, cellsAlong(100, 1e-40F, 4.0F, 0.0F));
}

TEST(GridShape, DepthIsOneCellARangeSigma) {
    EXPECT_EQ(14U, cellsInDepth(0.15F, 1.0F, 4.0F, 0.0F));
    EXPECT_EQ(12U, cellsInDepth(0.25F, 1.0F, 4.0F, 0.0F));
    EXPECT_EQ(28U, cellsInDepth(0.25F, 5.0F, 4.0F, 0.0F));
    EXPECT_EQ(8U, cellsInDepth(3.0F, 1.0F, 4.0F, 0.0F));
    EXPECT_EQ(8U, cellsInDepth(0.25F, 0.0F, 4.0F, 0.0F));
    EXPECT_EQ(8U, cellsInDepth(kNaN, 1.0F, 4.0F, 0.0F));
    EXPECT_LT(std::size_t(1) << 32U, cellsInDepth(0.25F, kInfinity, 4.0F, 0.0F));
}

TEST(GridShape, EachLimitSelectsTheDirectFilter) {
    EXPECT_TRUE(gridServesFor(1024, 8192, 8, 0.15F, 10.0F, 10.0F));
    EXPECT_FALSE(gridServesFor(1025, 8192, 8, 0.15F, 10.0F, 10.0F));
    EXPECT_FALSE(gridServesFor(1024, 8192, 9, 0.15F, 10.0F, 10.0F));
    EXPECT_FALSE(gridServesFor(1024, 8193, 8, 0.15F, 10.0F, 10.0F));
    EXPECT_FALSE(gridServesFor(100, 100, 8, 0.05F, 10.0F, 10.0F));
    EXPECT_FALSE(gridServesFor(100, 100, 8, 0.15F, 0.05F, 10.0F));
    EXPECT_FALSE(gridServesFor(100, 100, 8, 0.15F, 10.0F, 0.05F));
    EXPECT_TRUE(gridServesFor(100, 100, 8, 0.0501F, 0.0501F, 0.0501F));
    EXPECT_FALSE(gridServesFor(100, 100, 8, kNaN, 10.0F, 10.0F));
    EXPECT_FALSE(gridServesFor(100, 100, 8, 0.15F, kNaN, 10.0F));
    EXPECT_FALSE(gridServesFor(std::size_t(1) << 40U, 8, std::size_t(1) << 40U, 0.15F, 1.0F, 1.0F));
}

TEST(GridShape, CellsAreClampedToTheGrid) {
    EXPECT_EQ(3U, clampedCell(3.9F, 8));
    EXPECT_EQ(0U, clampedCell(-1.0F, 8));
    EXPECT_EQ(7U, clampedCell(8.0F, 8));
    EXPECT_EQ(7U, clampedCell(kInfinity, 8));
    EXPECT_EQ(0U, clampedCell(-kInfinity, 8));
    EXPECT_EQ(0U, clampedCell(kNaN, 8));
}

TEST(GridShape, PixelsFallIntoTheNearestCell) {
    EXPECT_EQ(4U, cellAlong(0, 10.0F, 4.0F, 0.0F, 12));
    EXPECT_EQ(4U, cellAlong(4, 10.0F, 4.0F, 0.0F, 12));
    EXPECT_EQ(5U, cellAlong(5, 10.0F, 4.0F, 0.0F, 12));
    EXPECT_EQ(5U, cellAlong(14, 10.0F, 4.0F, 0.0F, 12));
    EXPECT_EQ(6U, cellAlong(15, 10.0F, 4.0F, 0.0F, 12));
    EXPECT_EQ(4U, cellAlong(1000, kInfinity, 4.0F, 0.0F, 8));
}

TEST(GridShape, PlacesHaveAWholePartAndAFraction) {
    EXPECT_EQ(4.0F, placeAlong(0, 10.0F, 4.0F, 0.0F).fWhole);
    EXPECT_EQ(0.0F, placeAlong(0, 10.0F, 4.0F, 0.0F).fFraction);
    EXPECT_EQ(7.0F, placeAlong(37, 10.0F, 4.0F, 0.0F).fWhole);
    EXPECT_EQ(0.7F, placeAlong(37, 10.0F, 4.0F, 0.0F).fFraction);
    EXPECT_EQ(5.0F, placeAlong(3, 4.0F, 4.0F, 0.5F).fWhole); // 0.75 + 4.5
    EXPECT_EQ(0.25F, placeAlong(3, 4.0F, 4.0F, 0.5F).fFraction);
    EXPECT_EQ(4.0F, placeAlong(1000, kInfinity, 4.0F, 0.0F).fWhole);
}

TEST(GridShape, PixelsWholeSigmasApartStandAlike) {
    for (float const sigma : {10.0F, 2.5F, 33.0F, 99.5F}) {
        // So many pixels are a whole number of these sigmas.
        std::size_t const period = sigma == 2.5F ? 5 : sigma == 99.5F ? 199 : std::size_t(sigma);
        float const cells = static_cast<float>(period) / sigma;
        for (std::size_t pixel = 0; pixel < 100; ++pixel) {
            GridPlace const near = placeAlong(pixel, sigma, 4.0F, 0.0F);
            GridPlace const far = placeAlong(pixel + 250 * period, sigma, 4.0F, 0.0F);
            ASSERT_EQ(near.fFraction, far.fFraction) << pixel << ' ' << sigma;
            ASSERT_EQ(near.fWhole + 250.0F * cells, far.fWhole) << pixel << ' ' << sigma;
            ASSERT_EQ(static_cast<float>(cellAlong(pixel, sigma, 4.0F, 0.0F, 100000)) + 250.0F * cells,
                      static_cast<float>(cellAlong(pixel + 250 * period, sigma, 4.0F, 0.0F, 100000)));
        }
    }
}

TEST(GridShape, RadiusOfTheDirectFilterIsBounded) {
    EXPECT_EQ(22, radiusOf(10.0F));
    EXPECT_EQ(1, radiusOf(0.4659F));
    EXPECT_EQ(2, radiusOf(0.4661F));
    EXPECT_EQ(0, radiusOf(0.0F));
    EXPECT_EQ(0, radiusOf(-5.0F));
    EXPECT_EQ(0, radiusOf(kNaN));
    EXPECT_EQ(kMaximalRadius, radiusOf(kInfinity));
    EXPECT_EQ(kMaximalRadius, radiusOf(1e30F));
}

TEST(GridShape, SmallSigmasMakeTheDirectFilterAnIdentity) {
    EXPECT_FALSE(directFilterIsIdentity(0.051F, 0.5F, 0.5F));
    EXPECT_TRUE(directFilterIsIdentity(0.05F, 10.0F, 10.0F));
    EXPECT_TRUE(directFilterIsIdentity(0.0F, 10.0F, 10.0F));
    EXPECT_TRUE(directFilterIsIdentity(-1.0F, 10.0F, 10.0F));
    EXPECT_TRUE(directFilterIsIdentity(kNaN, 10.0F, 10.0F));
    EXPECT_TRUE(directFilterIsIdentity(0.15F, 0.4F, 10.0F));
    EXPECT_TRUE(directFilterIsIdentity(0.15F, 10.0F, 0.4F));
    EXPECT_TRUE(directFilterIsIdentity(0.15F, kNaN, 10.0F));
}

} // namespace
