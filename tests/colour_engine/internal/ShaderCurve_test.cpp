#include "orvo/colour_engine/internal/ShaderCurve.h"

#include "orvo/colour_engine/internal/ResolvedTransform.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <limits>
#include <string>
#include <vector>

namespace ORVO::ColourEngine::Internal {
namespace {

/// A curve from samples to light, and the way back, each with its formula.
struct CurveRow {
    char const* pName_;
    int type_;
    std::vector<double> aParameters_;
};

CurveRow const aCurveRows[] = {
    {"gamma 1.8", 1, {1.8}},
    {"gamma 2", 1, {2.0}},
    {"gamma 2.2", 1, {2.2}},
    {"gamma 563/256", 1, {563.0 / 256.0}},
    {"gamma 2.4", 1, {2.4}},
    {"gamma 2.6", 1, {2.6}},
    {"sRGB", 4, {2.4, 1.0 / 1.055, 0.055 / 1.055, 1.0 / 12.92, 0.04045}},
    {"BT.2020", 4, {1.0 / 0.45, 1.0 / 1.0993, 0.0993 / 1.0993, 1.0 / 4.5, 0.08145}},
    {"L*", 4, {3.0, 1.0 / 1.16, 0.16 / 1.16, 2700.0 / 24389.0, 0.08}},
    {"with a level", 2, {2.2, 1.0 / 0.9, -0.1 / 0.9}},
};

/// y = (a x + b) ^ g from the break on, c x below, in double precision; from 0 to 1.
double lightOf(CurveRow const& row, double x) {
    double const a = row.type_ == 1 ? 1.0 : row.aParameters_[1];
    double const b = row.type_ == 1 ? 0.0 : row.aParameters_[2];
    bool const bLine = row.type_ == 4 ? x < row.aParameters_[4] : a * x + b < 0.0;
    double const line = row.type_ == 4 ? row.aParameters_[3] * x : 0.0;
    return bLine ? line : std::pow(a * x + b, row.aParameters_[0]);
}

double sampleOf(CurveRow const& row, double light) {
    double const a = row.type_ == 1 ? 1.0 : row.aParameters_[1];
    double const b = row.type_ == 1 ? 0.0 : row.aParameters_[2];
    double const sample = (std::pow(light, 1.0 / row.aParameters_[0]) - b) / a;
    bool const bLine = row.type_ == 4 && sample < row.aParameters_[4];
    return bLine ? light / row.aParameters_[3] : sample;
}

ChannelCurve inputCurve(CurveRow const& row) {
    return ChannelCurve([&row](double x) { return lightOf(row, x); },
                        curveFormula(row.type_, row.aParameters_.data()));
}

ChannelCurve outputCurve(CurveRow const& row) {
    return ChannelCurve([&row](double y) { return sampleOf(row, y); },
                        curveFormula(-row.type_, row.aParameters_.data()));
}

/// From 0 to 1, closer near 0, and none of those that curves are checked at themselves but the ends.
std::vector<float> values() {
    std::vector<float> aValues;
    for (int i = 0; i <= 9973; ++i) {
        double const position = i / 9973.0;
        aValues.push_back(static_cast<float>(position));
        aValues.push_back(static_cast<float>(position * position * position));
    }
    return aValues;
}

TEST(ShaderCurve, KeepsLightWithinItsBound) {
    for (CurveRow const& row : aCurveRows) {
        auto const curve = ShaderCurve::ofInput(inputCurve(row));
        ASSERT_TRUE(curve.has_value()) << row.pName_;
        double dLargest = 0.0;
        double dLargestSample = 0.0;
        for (float const x : values()) {
            double const actual = (*curve)(x);
            dLargest = std::max(dLargest, std::abs(actual - lightOf(row, x)));
            // Either the sample is right, or the light is as good as the right one.
            if (row.type_ != 2 && std::abs(actual - lightOf(row, x)) > ShaderCurve::dBlackBound_)
                dLargestSample = std::max(dLargestSample, std::abs(sampleOf(row, actual) - double(x)));
        }
        EXPECT_LE(dLargest, 6e-7) << row.pName_;
        EXPECT_LE(dLargestSample, 2.5e-4) << row.pName_;
        EXPECT_NEAR(0.0, (*curve)(0.0F), 1e-12) << row.pName_;
        EXPECT_NEAR(1.0, (*curve)(1.0F), 3e-7) << row.pName_;
    }
}

TEST(ShaderCurve, KeepsSamplesWithinTheirBound) {
    for (CurveRow const& row : aCurveRows) {
        auto const curve = ShaderCurve::ofOutput(outputCurve(row));
        ASSERT_TRUE(curve.has_value()) << row.pName_;
        double dLargest = 0.0;
        for (float const y : values())
            dLargest = std::max(dLargest, std::abs((*curve)(y)-sampleOf(row, y)));
        EXPECT_LE(dLargest, 2.2e-5) << row.pName_;
        EXPECT_NEAR(sampleOf(row, 0.0), (*curve)(0.0F), 1e-7) << row.pName_;
        EXPECT_NEAR(1.0, (*curve)(1.0F), 1e-6) << row.pName_;
    }
}

TEST(ShaderCurve, HasNoPowerInItsText) {
    for (CurveRow const& row : aCurveRows) {
        std::string const sInput = ShaderCurve::ofInput(inputCurve(row))->body();
        std::string const sOutput = ShaderCurve::ofOutput(outputCurve(row))->body();
        for (std::string const& sBody : {sInput, sOutput}) {
            EXPECT_EQ(std::string::npos, sBody.find("pow(")) << row.pName_;
            EXPECT_NE(std::string::npos, sBody.find("sqrt(t)")) << row.pName_;
            EXPECT_LT(sBody.size(), 600U) << row.pName_;
        }
        // A line stands for itself, below its break.
        EXPECT_EQ(row.type_ != 1, sInput.find("    return x < ") != std::string::npos) << row.pName_;
        EXPECT_EQ(row.type_ == 4, sOutput.find("    return x < ") != std::string::npos) << row.pName_;
    }
    // A base that is negative below the break never reaches a root.
    EXPECT_EQ(0U, ShaderCurve::ofInput(inputCurve(aCurveRows[9]))->body().find("    float t = max("));
    EXPECT_NE(std::string::npos,
              ShaderCurve::ofInput(inputCurve(aCurveRows[9]))->body().find(" ? 0.0 : power;"));
}

TEST(ShaderCurve, ComputesStraightLinesWithoutRoots) {
    CurveRow const one{"gamma 1", 1, {1.0}};
    EXPECT_TRUE(ShaderCurve::ofInput(inputCurve(one))->isIdentity());
    EXPECT_TRUE(ShaderCurve::ofOutput(outputCurve(one))->isIdentity());
    ChannelCurve const half([](double x) { return 0.5 * x + 0.25; },
                            curveFormula(3, std::vector<double>{1.0, 0.5, 0.0, 0.25}.data()));
    auto const curve = ShaderCurve::ofInput(half);
    ASSERT_TRUE(curve.has_value());
    EXPECT_FALSE(curve->isIdentity());
    EXPECT_EQ("    float t = 0.5 * x;\n    float power = t;\n    return power + 0.25;\n", curve->body());
    EXPECT_EQ(0.5F, (*curve)(0.5F));
}

TEST(ShaderCurve, IsNotThereWithoutAFormula) {
    ChannelCurve const square([](double x) { return x * x; });
    EXPECT_FALSE(ShaderCurve::ofInput(square).has_value());
    EXPECT_FALSE(ShaderCurve::ofOutput(square).has_value());
}

TEST(ShaderCurve, IsNotThereWhereTheFormulaIsNotTheCurve) {
    double const gamma = 2.2;
    // A curve that is off, by little, in one place; one whose line does not meet its power; one that leaves
    // 0..1, where it is cut off.
    ChannelCurve const dented([](double x) { return std::pow(x, 2.2) - (x > 0.4 && x < 0.41 ? 1e-4 : 0.0); },
                              curveFormula(1, &gamma));
    EXPECT_FALSE(ShaderCurve::ofInput(dented).has_value());
    EXPECT_FALSE(ShaderCurve::ofOutput(dented).has_value());
    ChannelCurve const broken([](double x) { return x < 0.5 ? 0.5 * x : x * x; },
                              curveFormula(4, std::vector<double>{2.0, 1.0, 0.0, 0.25, 0.5}.data()));
    EXPECT_FALSE(ShaderCurve::ofInput(broken).has_value());
    ChannelCurve const high([](double x) { return 1.2 * x; },
                            curveFormula(2, std::vector<double>{1.0, 1.2, 0.0}.data()));
    EXPECT_FALSE(ShaderCurve::ofInput(high).has_value());
}

TEST(ShaderCurve, IsNotThereForParametersWithoutSense) {
    double const nan = std::numeric_limits<double>::quiet_NaN();
    double const infinity = std::numeric_limits<double>::infinity();
    for (auto const& aParameters : std::vector<std::vector<double>>{{nan, 1.0, 0.0},
                                                                    {infinity, 1.0, 0.0},
                                                                    {2.2, 0.0, 0.0},
                                                                    {1.0, 0.0, -1.0},
                                                                    {2.2, nan, 0.0},
                                                                    {0.0, 1.0, 0.0},
                                                                    {-1.0, 1.0, 0.0},
                                                                    {2.2, -1.0, 0.5},
                                                                    {30.0, 1.0, 0.0}}) {
        for (int const type : {2, -2}) {
            // As the colour library evaluates them: what is no number counts as 0.
            auto const formula = curveFormula(type, aParameters.data());
            ChannelCurve const curve(
                [=](double x) {
                    double const y =
                        formula->dResultScale_ * std::pow(formula->base(x), formula->dExponent_) +
                        formula->dResultOffset_;
                    return std::isfinite(y) ? y : 0.0;
                },
                formula);
            auto const input = ShaderCurve::ofInput(curve);
            auto const output = ShaderCurve::ofOutput(curve);
            // Or it keeps its bound all the same.
            for (auto const& [computed, bound] : {std::pair(input, 6e-7), {output, 2.2e-5}}) {
                if (!computed.has_value())
                    continue;
                for (float const x : values())
                    ASSERT_NEAR(curve.clamped(x), (*computed)(x), bound) << type << " " << x;
                EXPECT_EQ(std::string::npos, computed->body().find("inf")) << computed->body();
                EXPECT_EQ(std::string::npos, computed->body().find("nan")) << computed->body();
            }
        }
    }
}

// (a x + b)^g from -b/a on, 0 below: rounded, a (-b/a) + b may be less than 0, which has no power and no
// root.
TEST(ShaderCurve, IsThereWhereTheBreakIsARoundedQuotient) {
    int nBelow = 0;
    for (int const n : {923, 1000, 1012, 1053, 1283, 2816}) {
        double const b = -n / 65536.0;
        double const a = 1.0 - b;
        nBelow += a * (-b / a) + b < 0.0 ? 1 : 0;
        std::array<double, 3> const aParameters{2.0, a, b};
        ChannelCurve const curve([=](double x) { return std::pow(std::max(a * x + b, 0.0), 2.0); },
                                 curveFormula(2, aParameters.data()));
        EXPECT_TRUE(ShaderCurve::ofInput(curve).has_value()) << n;
        ChannelCurve const back([=](double y) { return (std::sqrt(y) - b) / a; },
                                curveFormula(-2, aParameters.data()));
        EXPECT_TRUE(ShaderCurve::ofOutput(back).has_value()) << n;
    }
    EXPECT_EQ(5, nBelow);
}

} // namespace
} // namespace ORVO::ColourEngine::Internal
