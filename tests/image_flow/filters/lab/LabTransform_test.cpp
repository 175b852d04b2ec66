#include "orvo/image_flow/filters/lab/LabTransform.h"

#include "tests/image_flow/support/BilateralReference.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>

namespace {

using namespace ORVO;
using namespace ORVO::Test;
using namespace ORVO::ImageFlow::lab;

void expectPixel(float4 const& actual, DoublePixel const& expected, double tolerance) {
    for (std::size_t c = 0; c < 4; ++c) {
        EXPECT_NEAR(actual[c], expected[c], tolerance) << "channel " << c;
    }
}

TEST(LabTransform, LinearPartOfTheEncodingDividesBy1292) {
    // 0.04 / 12.92 = 0.00309597523; the rows of the matrix add up to 0.9505, 1 and 1.089.
    double const linear = 0.04 / 12.92;
    expectPixel(sRGBToXYZ(float4(0.04F, 0.04F, 0.04F, 0.5F)), {0.9505 * linear, linear, 1.089 * linear, 0.5},
                1e-9);
}

TEST(LabTransform, ThresholdOfTheEncodingBelongsToTheLinearPart) {
    float const threshold = 0.04045F;
    float const above = std::nextafter(threshold, 1.0F);
    EXPECT_EQ(0.2126F * (threshold / 12.92F) + 0.7152F * (threshold / 12.92F) +
                  0.0722F * (threshold / 12.92F),
              sRGBToXYZ(float4(threshold, threshold, threshold, 1.0F)).y);
    double const curve = std::pow((above + 0.055) / 1.055, 2.4);
    EXPECT_NEAR(curve, sRGBToXYZ(float4(above, above, above, 1.0F)).y, 1e-9);
}

TEST(LabTransform, WhiteHasLightnessOneAndNearlyNoColour) {
    // X = 0.9505 against a white of 0.95047, Z = 1.089 against 1.08883.
    float4 const lab = sRGBToLab(float4(1.0F, 1.0F, 1.0F, 1.0F));
    EXPECT_NEAR(1.0, lab.x, 1e-6);
    EXPECT_NEAR((std::cbrt(0.9505 / 0.95047) - 1) * 5, lab.y, 2e-6);
    EXPECT_NEAR((1 - std::cbrt(1.089 / 1.08883)) * 2, lab.z, 2e-6);
}

TEST(LabTransform, BlackIsTheOrigin) {
    // 1.16 * 0.13793103 - 0.16 = 0 up to 5e-9; the other two cancel.
    expectPixel(sRGBToLab(float4(0.0F, 0.0F, 0.0F, 0.0F)), {0, 0, 0, 0}, 2e-8);
    expectPixel(LabTosRGB(float4(0.0F, 0.0F, 0.0F, 0.0F)), {0, 0, 0, 0}, 1e-6);
}

TEST(LabTransform, MiddleGreyIsWorkedOutByHand) {
    // 0.5: ((0.555) / 1.055)^2.4 = 0.21404114; its cube root 0.59815..: L = 1.16 * 0.598164 - 0.16 =
    // 0.533890.
    double const y = std::pow(0.555 / 1.055, 2.4);
    EXPECT_NEAR(0.2140411, y, 1e-7);
    EXPECT_NEAR(1.16 * std::cbrt(y) - 0.16, sRGBToLab(float4(0.5F, 0.5F, 0.5F, 1.0F)).x, 1e-6);
}

TEST(LabTransform, NegativeComponentsKeepTheirSign) {
    float4 const xyz = sRGBToXYZ(float4(-0.5F, 0.0F, 0.0F, 1.0F));
    double const y = std::pow(0.555 / 1.055, 2.4);
    expectPixel(xyz, {-0.4124 * y, -0.2126 * y, -0.0193 * y, 1.0}, 1e-7);
    // Where Y is negative the constant is added.
    float4 const lab = XYZToLab(float4(-0.2F, -0.2F, -0.2F, 1.0F));
    EXPECT_NEAR(-1.16 * std::cbrt(0.2) + 0.16, lab.x, 1e-6);
    EXPECT_NEAR((-std::cbrt(0.2 / 0.95047) + std::cbrt(0.2)) * 5, lab.y, 3e-6);
}

TEST(LabTransform, RoundTripOfANegativeValueEndsNearIt) {
    float4 const back = LabTosRGB(sRGBToLab(float4(-0.5F, 0.0F, 0.0F, 1.0F)));
    expectPixel(back, {-0.5, 0, 0, 1}, 2e-3);
}

TEST(LabTransform, RoundTripOfColoursEndsNearThem) {
    Numbers numbers(5);
    for (int i = 0; i < 2000; ++i) {
        float4 const rgb(numbers.next(), numbers.next(), numbers.next(), numbers.next());
        float4 const back = LabTosRGB(sRGBToLab(rgb));
        // The two matrices are rounded to four places and invert each other to about 3e-4 only.
        expectPixel(back, {rgb.x, rgb.y, rgb.z, rgb.w}, 2e-3);
    }
}

TEST(LabTransform, LabConstantDependsOnTheSignOfL) {
    // L = 0 is not above 0: fy = -0.16 / 1.16 = -0.137931, whose line is (0.137931 - 0.13793103) / 7.787 = 0.
    EXPECT_NEAR(0.0, LabToXYZ(float4(0.0F, 0.0F, 0.0F, 1.0F)).y, 1e-8);
    // L = 0.5: fy = 0.66 / 1.16, cubed. L = -0.5 the same, negative.
    double const y = std::pow(0.66 / 1.16, 3);
    EXPECT_NEAR(y, LabToXYZ(float4(0.5F, 0.0F, 0.0F, 1.0F)).y, 1e-7);
    EXPECT_NEAR(-y, LabToXYZ(float4(-0.5F, 0.0F, 0.0F, 1.0F)).y, 1e-7);
}

TEST(LabTransform, ThresholdOfTheInverseIsComparedInDoublePrecision) {
    // This L gives an fy whose cube is the float 0.008856F, which lies above the double 0.008856: the cube
    // stays. The line would give 0.00885604.
    float const fy = 0.206893042F;
    ASSERT_EQ(0.008856F, fy * fy * fy);
    ASSERT_EQ(fy, (0.0799959302F + 0.16F) / 1.16F);
    EXPECT_EQ(0.008856F, LabToXYZ(float4(0.0799959302F, 0.0F, 0.0F, 1.0F)).y);
}

TEST(LabTransform, LineOfTheInverseMayTurnNegative) {
    // fy = 0.16001 / 1.16 is just above 0.13793103, and fz = fy - 0.05 below it: (|fz| - 0.13793103) / 7.787
    // < 0.
    float4 const xyz = LabToXYZ(float4(0.00001F, 0.0F, 0.1F, 1.0F));
    double const fz = 0.16001 / 1.16 - 0.05;
    EXPECT_NEAR((fz - 0.13793103) / 7.787 * 1.08883, xyz.z, 1e-8);
}

TEST(LabTransform, AlphaPassesAllSteps) {
    float4 const p(0.2F, 0.3F, 0.4F, 7.5F);
    EXPECT_EQ(7.5F, sRGBToXYZ(p).w);
    EXPECT_EQ(7.5F, XYZToLab(p).w);
    EXPECT_EQ(7.5F, LabToXYZ(p).w);
    EXPECT_EQ(7.5F, XYZTosRGB(p).w);
}

TEST(LabTransform, AgreesWithDoublePrecision) {
    Numbers numbers(17);
    for (int i = 0; i < 20000; ++i) {
        auto const next = [&] { return numbers.next() * 3.0F - 1.0F; };
        float4 const p(next(), next(), next(), 1.0F);
        DoublePixel const exact = {p.x, p.y, p.z, p.w};
        expectPixel(sRGBToLab(p), reference::labFromRGB(exact), 1e-5);
        expectPixel(LabTosRGB(p), reference::rgbFromLab(exact), 2e-5);
        if (HasFailure()) {
            FAIL() << "at (" << p.x << ", " << p.y << ", " << p.z << ")";
        }
    }
}

TEST(LabTransform, NaNStaysNaN) {
    float const nan = std::numeric_limits<float>::quiet_NaN();
    float4 const lab = sRGBToLab(float4(nan, 0.5F, 0.5F, 1.0F));
    EXPECT_TRUE(std::isnan(lab.x) && std::isnan(lab.y) && std::isnan(lab.z));
    EXPECT_EQ(1.0F, lab.w);
}

} // namespace
