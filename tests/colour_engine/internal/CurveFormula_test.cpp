#include "orvo/colour_engine/internal/CurveFormula.h"

#include <gtest/gtest.h>

#include <cmath>
#include <vector>

namespace ORVO::ColourEngine::Internal {
namespace {

double valueAt(CurveFormula const& formula, double x) {
    return x < formula.dBreak_ ? formula.dSlope_ * x + formula.dIntercept_
                               : formula.dResultScale_ * std::pow(formula.base(x), formula.dExponent_) +
                                     formula.dResultOffset_;
}

struct FormulaRow {
    int type_;
    std::vector<double> aParameters_;
    double below_; ///< x below the break; the break or above it: 0.75
    double yBelow_;
    double yAbove_;
};

// Squares of halves: (0.5 * 0.75 + 0.125)^2 = 0.25.
FormulaRow const aRows[] = {
    {1, {2.0}, 0.0, 0.0, 0.5625},
    {2, {2.0, 0.5, -0.125}, 0.125, 0.0, 0.0625},           // from 0.25 on: (0.375 - 0.125)^2
    {3, {2.0, 0.5, -0.125, 0.25}, 0.125, 0.25, 0.3125},    // the same and a quarter
    {4, {2.0, 0.5, 0.125, 0.25, 0.5}, 0.25, 0.0625, 0.25}, // x / 4 below 0.5
    {5, {2.0, 0.5, 0.125, 0.25, 0.5, 0.125, 0.0625}, 0.25, 0.125, 0.375},
};

TEST(CurveFormula, HasTheParametricCurvesOfProfiles) {
    for (FormulaRow const& row : aRows) {
        auto const formula = curveFormula(row.type_, row.aParameters_.data());
        ASSERT_TRUE(formula.has_value()) << row.type_;
        EXPECT_DOUBLE_EQ(row.yBelow_, valueAt(*formula, row.below_)) << row.type_;
        EXPECT_DOUBLE_EQ(row.yAbove_, valueAt(*formula, 0.75)) << row.type_;
    }
}

TEST(CurveFormula, HasTheirInverses) {
    for (FormulaRow const& row : aRows) {
        auto const formula = curveFormula(-row.type_, row.aParameters_.data());
        ASSERT_TRUE(formula.has_value()) << row.type_;
        EXPECT_DOUBLE_EQ(0.75, valueAt(*formula, row.yAbove_)) << row.type_;
    }
    // y = x / 4 below (0.25 + 0.125)^2, and y = x / 4 + 1/16 below 1/8 more.
    auto const line = curveFormula(-4, aRows[3].aParameters_.data());
    EXPECT_DOUBLE_EQ(0.140625, line->dBreak_);
    EXPECT_DOUBLE_EQ(0.25, valueAt(*line, 0.0625));
    auto const raised = curveFormula(-5, aRows[4].aParameters_.data());
    EXPECT_DOUBLE_EQ(0.265625, raised->dBreak_);
    EXPECT_DOUBLE_EQ(0.25, valueAt(*raised, 0.125));
    // Where the curve is level, the inverse is where the level ends.
    auto const level = curveFormula(-3, aRows[2].aParameters_.data());
    EXPECT_DOUBLE_EQ(0.25, level->dBreak_);
    EXPECT_DOUBLE_EQ(0.25, valueAt(*level, 0.2));
}

TEST(CurveFormula, KnowsItsSlopeAndWhenItDoesNothing) {
    auto const square = curveFormula(1, std::vector<double>{2.0}.data());
    EXPECT_DOUBLE_EQ(1.5, square->slope(0.75));
    EXPECT_FALSE(square->isIdentity());
    auto const line = curveFormula(4, aRows[3].aParameters_.data());
    EXPECT_DOUBLE_EQ(0.25, line->slope(0.25));
    EXPECT_DOUBLE_EQ(0.5, line->slope(0.75)); // 2 * 0.5 * (0.375 + 0.125)
    double const one = 1.0;
    EXPECT_TRUE(curveFormula(1, &one)->isIdentity());
    EXPECT_TRUE(curveFormula(-1, &one)->isIdentity());
    EXPECT_FALSE(curveFormula(2, std::vector<double>{1.0, 0.5, 0.0}.data())->isIdentity());
    EXPECT_FALSE(curveFormula(2, std::vector<double>{1.0, 1.0, 0.25}.data())->isIdentity());
    EXPECT_FALSE(curveFormula(4, std::vector<double>{1.0, 1.0, 0.0, 0.5, 0.5}.data())->isIdentity());
}

TEST(CurveFormula, KnowsNoOtherTypes) {
    double const aParameters[10]{};
    for (int const type : {0, 6, -6, 8, 108, -109})
        EXPECT_FALSE(curveFormula(type, aParameters).has_value()) << type;
}

} // namespace
} // namespace ORVO::ColourEngine::Internal
