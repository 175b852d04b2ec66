#include "orvo/core/spaces/Conversions.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <random>

#include "orvo/core/spaces/Spaces.h"

namespace {

using namespace ORVO;

constexpr float fInfinity = std::numeric_limits<float>::infinity();
constexpr int iLeast = std::numeric_limits<int>::min();
constexpr int iMost = std::numeric_limits<int>::max();

PositionExtentInWorldSpace world(float x, float y, float width, float height) {
    return PositionExtentInWorldSpace(PositionInWorldSpace(x, y), ExtentInWorldSpace(width, height));
}

PositionExtentInPixelSpace pixels(int x, int y, int width, int height) {
    return PositionExtentInPixelSpace(PositionInPixelSpace(x, y), ExtentInPixelSpace(width, height));
}

TEST(PixelToWorldSpace, MultipliesByThePixelExtent) {
    PixelExtentInWorldSpace const pixel(0.5f, 2.0f);
    EXPECT_EQ(PositionInWorldSpace(-1.5f, 8.0f), pixelToWorldSpace(PositionInPixelSpace(-3, 4), pixel));
    EXPECT_EQ(ExtentInWorldSpace(5.0f, 40.0f), pixelToWorldSpace(ExtentInPixelSpace(10, 20), pixel));
    EXPECT_EQ(world(-1.5f, 8.0f, 5.0f, 40.0f), pixelToWorldSpace(pixels(-3, 4, 10, 20), pixel));
}

TEST(PixelToWorldSpace, KeepsAnUndefinedExtentUndefined) {
    PixelExtentInWorldSpace const pixel(2.0f, 2.0f);
    EXPECT_FALSE(pixelToWorldSpace(ExtentInPixelSpace(), pixel).isDefined());
    PositionExtentInWorldSpace const result = pixelToWorldSpace(
        PositionExtentInPixelSpace(PositionInPixelSpace(1, 2), ExtentInPixelSpace()), pixel);
    EXPECT_EQ(PositionInWorldSpace(2.0f, 4.0f), result.position());
    EXPECT_FALSE(result.extent().isDefined());
}

TEST(PixelToWorldSpace, RoundsOnceForLargeCoordinates) {
    // 2^24 + 1 is no float; times 3 it is 50331651, nearest float 50331652.
    EXPECT_EQ(50331652.0f, pixelToWorldSpace(PositionInPixelSpace(16777217, 0), {3.0f, 1.0f}).x());
}

TEST(WorldToPixelSpace, FloorsTheTopLeftAndCeilsTheBottomRight) {
    struct Row {
        char const* pName_;
        PositionExtentInWorldSpace oWorld_;
        PixelExtentInWorldSpace oPixel_;
        PositionExtentInPixelSpace oPixels_;
    };
    PixelExtentInWorldSpace const unit;
    Row const rows[] = {
        {"whole", world(1, 2, 3, 4), unit, pixels(1, 2, 3, 4)},
        {"fractions", world(0.5f, 0.25f, 1.0f, 1.0f), unit, pixels(0, 0, 2, 2)},
        {"negative", world(-0.5f, -1.25f, 1.0f, 1.0f), unit, pixels(-1, -2, 2, 2)},
        {"inside one pixel", world(0.25f, 0.25f, 0.5f, 0.5f), unit, pixels(0, 0, 1, 1)},
        {"small pixels", world(1, 1, 1, 1), {0.25f, 0.5f}, pixels(4, 2, 4, 2)},
        {"large pixels", world(3, 3, 10, 10), {4.0f, 8.0f}, pixels(0, 0, 4, 2)},
        {"no float pixel", world(0.3f, 0.6f, 0.3f, 0.9f), {0.1f, 0.1f}, pixels(3, 6, 3, 9)},
        {"noise below", world(2.9999998f, 0, 3.0000002f, 1), unit, pixels(3, 0, 3, 1)},
        {"noise above", world(3.0000002f, 0, 2.9999998f, 1), unit, pixels(3, 0, 3, 1)},
        {"a real fraction", world(2.99f, 0, 3.0f, 1), unit, pixels(2, 0, 4, 1)},
        {"a real fraction far out", world(524287.5f, 0, 10.0f, 1), unit, pixels(524287, 0, 11, 1)},
        {"empty", world(5.5f, 6.5f, 0, 0), unit, pixels(5, 6, 0, 0)},
        {"negative extent", world(5, 6, -2, -3), unit, pixels(5, 6, 0, 0)},
    };
    for (Row const& row : rows)
        EXPECT_EQ(row.oPixels_, worldToPixelSpace(row.oWorld_, row.oPixel_)) << row.pName_;
}

TEST(WorldToPixelSpace, KeepsAnUndefinedExtentUndefined) {
    PositionExtentInPixelSpace const result = worldToPixelSpace(
        PositionExtentInWorldSpace(PositionInWorldSpace(2.5f, -2.5f), ExtentInWorldSpace()), {});
    EXPECT_EQ(PositionInPixelSpace(2, -3), result.position());
    EXPECT_FALSE(result.extent().isDefined());
}

TEST(WorldToPixelSpace, SaturatesWhatNoIntegerHolds) {
    float const nan = std::numeric_limits<float>::quiet_NaN();
    PixelExtentInWorldSpace const unit;
    EXPECT_EQ(pixels(0, 0, iMost, iMost),
              worldToPixelSpace(PositionExtentInWorldSpace(ExtentInWorldSpace::infinite()), unit));
    EXPECT_EQ(PositionInPixelSpace(iLeast, iMost),
              worldToPixelSpace(world(-1e30f, 1e30f, 1, 1), unit).position());
    EXPECT_EQ(iMost, worldToPixelSpace(world(0, 0, 1e30f, 1), unit).extent().width());
    EXPECT_EQ(pixels(0, 0, 0, 0), worldToPixelSpace(world(nan, nan, nan, nan), unit));
    EXPECT_EQ(PositionInPixelSpace(iLeast, 0),
              worldToPixelSpace(world(-fInfinity, 0, 1, 1), unit).position());
    // A pixel extent of 0 or NaN gives no number: nothing undefined happens.
    EXPECT_EQ(pixels(0, iMost, iMost, iMost), worldToPixelSpace(world(0, 1, 1, 1), {0.0f, 0.0f}));
    EXPECT_EQ(pixels(0, 0, 0, 0), worldToPixelSpace(world(1, 1, 1, 1), {nan, nan}));
    EXPECT_EQ(pixels(-1, -1, 0, 0), worldToPixelSpace(world(1, 1, 1, 1), {-1.0f, -1.0f}));
}

void expectRoundTrip(PositionExtentInPixelSpace const& rectangle, PixelExtentInWorldSpace const& pixel) {
    ASSERT_EQ(rectangle, worldToPixelSpace(pixelToWorldSpace(rectangle, pixel), pixel)) << "pixel " << pixel;
}

TEST(WorldToPixelSpace, TakesEveryIntegerRectangleBack) {
    constexpr int bound = 1 << 20;
    std::mt19937 random(7100);
    std::uniform_int_distribution<int> coordinate(-bound, bound);
    std::uniform_int_distribution<int> small(0, 64);
    std::uniform_real_distribution<double> exponent(-3.0, 3.0);
    for (int i = 0; i < 300000; ++i) {
        int const x0 = coordinate(random), x1 = coordinate(random);
        int const y0 = coordinate(random);
        int const height = std::min(small(random), bound - y0);
        PixelExtentInWorldSpace const pixel(static_cast<float>(std::pow(10.0, exponent(random))),
                                            static_cast<float>(std::pow(10.0, exponent(random))));
        expectRoundTrip(pixels(std::min(x0, x1), y0, std::abs(x1 - x0), height), pixel);
        if (HasFatalFailure())
            return;
    }
}

TEST(WorldToPixelSpace, TakesRectanglesAtTheBoundsBack) {
    constexpr int bound = 1 << 20;
    int const edges[] = {-bound, -bound + 1, -3, -1, 0, 1, 2, 7, bound - 1, bound};
    float const extents[] = {1e-3f, 3e-3f, 0.1f, 1.0f / 3.0f, 0.7f, 1.0f, 1.1f, 3.0f, 7.77f, 999.9f, 1e3f};
    for (int left : edges) {
        for (int right : edges) {
            for (float extent : extents) {
                if (right < left)
                    continue;
                expectRoundTrip(pixels(left, left, right - left, right - left), {extent, extent});
                if (HasFatalFailure())
                    return;
            }
        }
    }
}

TEST(WorldToPixelSpace, CoversTheWorldRectangleUpToNoise) {
    std::mt19937 random(7101);
    std::uniform_real_distribution<float> position(-4096.0f, 4096.0f);
    std::uniform_real_distribution<float> extent(0.01f, 4096.0f);
    std::uniform_real_distribution<float> pixelExtent(0.1f, 10.0f);
    for (int i = 0; i < 100000; ++i) {
        PositionExtentInWorldSpace const rectangle =
            world(position(random), position(random), extent(random), extent(random));
        PixelExtentInWorldSpace const pixel(pixelExtent(random), pixelExtent(random));
        PositionExtentInPixelSpace const covered = worldToPixelSpace(rectangle, pixel);
        // In pixels; coordinates are below 2^17, so that noise is below 2^17 * 2^-23 * 2.
        double const noise = 1.0 / 32;
        double const left = double(rectangle.position().x()) / pixel.width();
        double const right = left + double(rectangle.extent().width()) / pixel.width();
        ASSERT_LE(covered.position().x(), left + noise);
        ASSERT_GT(covered.position().x(), left - 1.0 - noise);
        ASSERT_GE(covered.position().x() + covered.extent().width(), right - noise);
        ASSERT_LT(covered.position().x() + covered.extent().width(), right + 1.0 + noise);
    }
}

} // namespace
