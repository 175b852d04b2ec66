#include "orvo/colour_engine/internal/TableStages.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>

namespace {

using namespace ORVO::ColourEngine::Internal;
using Triple = std::array<double, 3>;

ChannelCurve squared() {
    return ChannelCurve([](double x) { return x * x; });
}

void expectTriple(Triple const& expected, Triple const& actual, double tolerance) {
    for (std::size_t i = 0; i < 3; ++i) {
        EXPECT_NEAR(expected[i], actual[i], tolerance) << i;
    }
}

Triple evaluated(TableStage const& stage, Triple const& colour) {
    // A second stage that changes nothing, so that the result of the first one is seen as it is.
    return evaluateStages({stage, MatrixStage{{1, 0, 0, 0, 1, 0, 0, 0, 1}, {}}}, 1, colour);
}

TEST(TableStages, CurvesClampBothEnds) {
    CurveStage const stage{{squared(), ChannelCurve([](double x) { return 2.0 * x; }),
                            ChannelCurve([](double x) { return x - 1.0; })}};
    expectTriple({0.25, 1.0, 0.0}, evaluated(stage, {0.5, 0.75, 0.5}), 1e-12);
    expectTriple({0.0, 1.0, 0.0}, evaluated(stage, {-0.5, 7.0, std::numeric_limits<double>::quiet_NaN()}),
                 0.0);
}

TEST(TableStages, AMatrixAddsItsOffsetAndClampsNothing) {
    MatrixStage const stage{{1.0, 2.0, 3.0, /**/ 0.0, 0.5, 0.0, /**/ -1.0, 0.0, 0.0}, {0.25, -1.0, 0.0}};
    // 0.5 + 0.5 + 0.3 + 0.25; 0.125 - 1; -0.5
    expectTriple({1.55, -0.875, -0.5}, evaluated(stage, {0.5, 0.25, 0.1}), 1e-12);
    // The last stage of a transform is clamped.
    expectTriple({1.0, 0.0, 0.0}, evaluateStages({stage}, 1, {0.5, 0.25, 0.1}), 0.0);
}

TEST(TableStages, NoStagesChangeNothingInsideTheCube) {
    expectTriple({0.25, 1.0, 0.0}, evaluateStages({}, 0, {0.25, 1.5, -1.0}), 0.0);
}

TEST(TableStages, GoesBetweenLabAndXYZ) {
    // L = 50, a = b = 0: Y = (66 / 116)^3, X and Z in the proportions of D50.
    double const y = 66.0 / 116.0 * (66.0 / 116.0) * (66.0 / 116.0);
    Triple const grey = {0.5, 128.0 / 255.0, 128.0 / 255.0};
    expectTriple({0.9642 * y, y, 0.8249 * y}, evaluated(ConnectionStage::LAB_TO_XYZ, grey), 1e-12);
    expectTriple(grey, evaluated(ConnectionStage::XYZ_TO_LAB, {0.9642 * y, y, 0.8249 * y}), 1e-12);
    // L = 4 lies on the straight part: Y = 4 * 27 / 24389.
    EXPECT_NEAR(4.0 * 27.0 / 24389.0,
                evaluated(ConnectionStage::LAB_TO_XYZ, {0.04, 128.0 / 255.0, 128.0 / 255.0})[1], 1e-6);
    // a = 60, b = -40 at L = 50: the cube roots are 66/116 + 60/500 and 66/116 + 40/200.
    double const x = 66.0 / 116.0 + 0.12;
    double const z = 66.0 / 116.0 + 0.2;
    Triple const violet = {0.5, 188.0 / 255.0, 88.0 / 255.0};
    Triple const xyz = {0.9642 * x * x * x, y, 0.8249 * z * z * z};
    expectTriple(xyz, evaluated(ConnectionStage::LAB_TO_XYZ, violet), 1e-12);
    expectTriple(violet, evaluated(ConnectionStage::XYZ_TO_LAB, xyz), 1e-12);
}

/// Two nodes along each axis: 1 in the upper corner alone; the first axis, the last axis.
GridStage corner(bool bTrilinear, bool bWords = false) {
    GridStage stage{{2, 2, 2}, bTrilinear, bWords, {}};
    for (int node = 0; node < 8; ++node) {
        stage.aNodes_.push_back(node == 7 ? 1.0F : 0.0F);
        stage.aNodes_.push_back(static_cast<float>(node & 1));
        stage.aNodes_.push_back(static_cast<float>(node >> 2));
    }
    return stage;
}

TEST(TableStages, TablesAreInterpolatedInCellsOrInTetrahedra) {
    // The weight of the upper corner: the product of the fractions, or the smallest of them.
    expectTriple({0.5 * 0.25 * 0.75, 0.5, 0.75}, evaluated(corner(true), {0.5, 0.25, 0.75}), 1e-12);
    expectTriple({0.25, 0.5, 0.75}, evaluated(corner(false), {0.5, 0.25, 0.75}), 1e-12);
    for (bool const bTrilinear : {false, true}) {
        expectTriple({1.0, 1.0, 1.0}, evaluated(corner(bTrilinear), {1.0, 1.5, 1.0}), 0.0);
        expectTriple({0.0, 0.0, 1.0}, evaluated(corner(bTrilinear), {-1.0, 0.0, 1.0}), 0.0);
    }
}

TEST(TableStages, EdgesMayDiffer) {
    GridStage stage{{2, 3, 5}, false, false, {}};
    for (int node = 0; node < 30; ++node) {
        stage.aNodes_.push_back(static_cast<float>(node % 2));
        stage.aNodes_.push_back(static_cast<float>(node / 2 % 3) / 2.0F);
        stage.aNodes_.push_back(static_cast<float>(node / 6) / 4.0F);
    }
    expectTriple({0.9, 0.6, 0.1}, evaluated(stage, {0.9, 0.6, 0.1}), 1e-7);
}

TEST(TableStages, TablesOfWordsRoundWhatComesOut) {
    for (bool const bTrilinear : {false, true}) {
        GridStage stage = corner(bTrilinear, true);
        // From 0 to 3 of 65535 along the first axis.
        for (std::size_t node = 0; node < 8; ++node) {
            stage.aNodes_[3 * node + 1] = (node & 1U) != 0 ? 3.0F / 65535.0F : 0.0F;
        }
        EXPECT_NEAR(1.0 / 65535.0, evaluated(stage, {0.4, 0.0, 0.0})[1], 1e-12); // 1.2
        EXPECT_NEAR(2.0 / 65535.0, evaluated(stage, {0.6, 0.0, 0.0})[1], 1e-12); // 1.8
        EXPECT_NEAR(3.0 / 65535.0, evaluated(stage, {1.0, 0.0, 0.0})[1], 1e-12);
    }
    // And what goes in: 0.25 of a 65535th is 0.
    EXPECT_DOUBLE_EQ(0.0, evaluated(corner(false, true), {0.25 / 65535.0, 0.0, 0.0})[1]);
    EXPECT_NEAR(1.0 / 65535.0, evaluated(corner(false, true), {0.75 / 65535.0, 0.0, 0.0})[1], 1e-12);
}

} // namespace
