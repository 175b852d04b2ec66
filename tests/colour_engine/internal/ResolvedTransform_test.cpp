#include "orvo/colour_engine/internal/ResolvedTransform.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>

namespace {

using namespace ORVO::ColourEngine::Internal;

ChannelCurve power(double exponent) {
    return ChannelCurve([exponent](double x) { return std::pow(x, exponent); });
}

TEST(ResolvedTransform, AppliesCurvesMatrixClampAndCurves) {
    ResolvedTransform const transform(MatrixShaper{{power(2.0), power(2.0), power(1.0)},
                                                   {0.5, 0.25, 0.0, /**/ 2.0, 0.0, 0.0, /**/ 0.0, -1.0, 1.0},
                                                   {power(0.5), power(1.0), power(1.0)}});
    ASSERT_NE(nullptr, transform.matrixShaper());
    EXPECT_EQ(nullptr, transform.colourCube());
    // Linear input: (0.64, 0.25, 0.5); after the matrix: (0.3825, 1.28 -> 1, 0.25).
    auto const result = transform.evaluate({0.8, 0.5, 0.5});
    EXPECT_NEAR(std::sqrt(0.3825), result[0], 1e-12);
    EXPECT_DOUBLE_EQ(1.0, result[1]);
    EXPECT_NEAR(0.25, result[2], 1e-12);
    // A negative linear value is clamped before the output curve: 0 - 0.25 + 0.
    EXPECT_DOUBLE_EQ(0.0, transform.evaluate({0.8, 0.5, 0.0})[2]);
}

TEST(ResolvedTransform, InterpolatesACubeWithRedFastest) {
    ColourCube cube;
    for (std::size_t b = 0; b < ColourCube::nEdge_; ++b) {
        for (std::size_t g = 0; g < ColourCube::nEdge_; ++g) {
            for (std::size_t r = 0; r < ColourCube::nEdge_; ++r) {
                // Linear in each input: interpolation is exact. The outputs are (b, r, (r + g) / 2).
                cube.aValues_.push_back(static_cast<float>(b) / 32.0F);
                cube.aValues_.push_back(static_cast<float>(r) / 32.0F);
                cube.aValues_.push_back(static_cast<float>(r + g) / 64.0F);
            }
        }
    }
    ResolvedTransform const transform(cube);
    EXPECT_EQ(nullptr, transform.matrixShaper());
    ASSERT_NE(nullptr, transform.colourCube());
    auto const result = transform.evaluate({0.3, 0.71, 0.987});
    EXPECT_NEAR(0.987, result[0], 1e-7);
    EXPECT_NEAR(0.3, result[1], 1e-7);
    EXPECT_NEAR(0.505, result[2], 1e-7);
    auto const outside = transform.evaluate({2.0, -1.0, std::numeric_limits<double>::quiet_NaN()});
    EXPECT_DOUBLE_EQ(0.0, outside[0]);
    EXPECT_DOUBLE_EQ(1.0, outside[1]);
    EXPECT_DOUBLE_EQ(0.5, outside[2]);
}

TEST(ChannelCurve, SamplesOverTheValueAndOverItsRoot) {
    ChannelCurve const curve([](double x) { return 2.0 * x - 0.25; });
    EXPECT_DOUBLE_EQ(-0.25, curve(0.0));
    EXPECT_EQ((std::vector<float>{0.0F, 0.25F, 0.75F, 1.0F, 1.0F}), curve.sample(5));
    EXPECT_EQ((std::vector<float>{0.0F, 0.0F, 0.25F, 0.875F, 1.0F}), curve.sampleOverRoot(5));
}

} // namespace
