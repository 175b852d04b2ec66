#include "orvo/colour_engine/internal/CubeFitting.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>

namespace {

using namespace ORVO::ColourEngine::Internal;
using Triple = std::array<double, 3>;

struct Errors {
    double largest = 0.0;
    double squares = 0.0;
};

Errors errorsOf(ColourCube const& cube, ColourFunction const& exact) {
    TableStages const aStages = stagesOf(cube, true);
    Errors errors;
    for (int i = 0; i < 1000; ++i) {
        Triple const colour = {i * 7 % 1000 / 999.0, i * 31 % 1000 / 999.0, i / 999.0};
        Triple const expected = exact(colour);
        Triple const actual = evaluateStages(aStages, aStages.size(), colour);
        for (std::size_t c = 0; c < 3; ++c) {
            double const error = std::abs(expected[c] - actual[c]);
            errors.largest = std::max(errors.largest, error);
            errors.squares += error * error;
        }
    }
    return errors;
}

ChannelCurve power(double exponent) {
    return ChannelCurve([exponent](double x) { return std::pow(x, exponent); });
}

TEST(CubeFitting, StraightTransformsHaveNodesAtEvenDistances) {
    ColourFunction const exact = [](Triple const& c) {
        return Triple{0.5 * c[0] + 0.5 * c[1], 1.0 - c[2], c[1]};
    };
    ColourCube const cube = fitCube(exact);
    EXPECT_FALSE(cube.oSpacing_.has_value());
    EXPECT_FALSE(cube.oOutputCurves_.has_value());
    ASSERT_EQ(3u * 33 * 33 * 33, cube.aValues_.size());
    EXPECT_LE(errorsOf(cube, exact).largest, 1e-6);
}

TEST(CubeFitting, NodesStandCloserWhereATransformBends) {
    // Steep at black; of the cube root a line over the first of 32 even steps misses 0.12.
    ColourFunction const exact = [](Triple const& c) {
        return Triple{std::cbrt(c[0]), std::cbrt(c[1]), std::cbrt(c[2])};
    };
    ColourCube const cube = fitCube(exact);
    ASSERT_TRUE(cube.oSpacing_.has_value());
    ChannelCurve const& spacing = *cube.oSpacing_;
    EXPECT_NEAR(0.0, spacing(0.0), 1e-12);
    EXPECT_NEAR(1.0, spacing(1.0), 1e-12);
    EXPECT_GT(spacing(1.0 / 32.0), 2.0 / 32.0) << "more than its share of nodes";
    for (int i = 0; i < 256; ++i) {
        EXPECT_LT(spacing(i / 256.0), spacing((i + 1) / 256.0));
    }
    EXPECT_LE(errorsOf(cube, exact).largest, 0.06);
}

TEST(CubeFitting, CurvesAndTheBorderOfTheGamutStayBehindTheCube) {
    // Light that leaves 0..1 on both sides, and a curve of infinite slope at black.
    TableStages const aStages = {
        CurveStage{{power(2.2), power(2.2), power(2.2)}},
        MatrixStage{{1.6, -0.5, -0.1, /**/ -0.2, 1.3, -0.1, /**/ 0.0, -0.1, 1.1}, {}},
        CurveStage{{power(1.0 / 2.2), power(1.0 / 2.2), power(1.0 / 2.2)}}};
    ColourFunction const exact = [&](Triple const& colour) {
        return evaluateStages(aStages, aStages.size(), colour);
    };
    ColourCube const cube = fitCube(aStages);
    ASSERT_TRUE(cube.oOutputCurves_.has_value());
    auto const [lowest, highest] = std::minmax_element(cube.aValues_.begin(), cube.aValues_.end());
    EXPECT_GE(*lowest, -0.5F);
    EXPECT_LT(*lowest, -0.1F) << "not clamped";
    EXPECT_GT(*highest, 1.05F);
    EXPECT_LE(*highest, 1.5F);
    // Results in the nodes, which bend there, make more of an error.
    EXPECT_LT(errorsOf(cube, exact).squares, errorsOf(fitCube(exact), exact).squares);
}

TEST(CubeFitting, NothingToDoIsACubeToo) {
    ColourCube const cube = fitCube(TableStages{});
    EXPECT_LE(errorsOf(cube, [](Triple const& colour) { return colour; }).largest, 1e-6);
}

} // namespace
