#include "orvo/core/math/Half.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <limits>
#include <sstream>
#include <type_traits>

namespace {

using ORVO::half;

constexpr float fInfinity = std::numeric_limits<float>::infinity();

/// The number of a bit pattern by the definition of binary16, in double, for patterns that are no NaN.
double definition(std::uint16_t bits) {
    int const exponent = (bits >> 10) & 31;
    int const fraction = bits & 1023;
    double magnitude = 0.0;
    if (exponent == 31)
        magnitude = std::numeric_limits<double>::infinity();
    else if (exponent == 0)
        magnitude = std::ldexp(double(fraction), -24);
    else
        magnitude = std::ldexp(1024.0 + fraction, exponent - 25);
    return (bits & 0x8000) != 0 ? -magnitude : magnitude;
}

bool isNaN(std::uint16_t bits) { return (bits & 0x7FFF) > 0x7C00; }

std::uint32_t bitsOf(float value) {
    std::uint32_t bits = 0;
    std::memcpy(&bits, &value, sizeof(bits));
    return bits;
}

float floatOf(std::uint32_t bits) {
    float value = 0.0f;
    std::memcpy(&value, &bits, sizeof(value));
    return value;
}

TEST(Half, IsTwoBytesOfNothingButTheBitPattern) {
    static_assert(sizeof(half) == 2);
    static_assert(std::is_trivial_v<half>);
    std::uint16_t const bits = 0x3C00;
    half value;
    std::memcpy(static_cast<void*>(&value), &bits, sizeof(value));
    EXPECT_EQ(1.0f, float(value));
    EXPECT_EQ(0x3C00, value.bits());
    EXPECT_EQ(0xC000, half(-2.0f).bits());
}

TEST(Half, ReadsEveryPatternAsItsDefinitionSays) {
    for (std::uint32_t pattern = 0; pattern < 65536; ++pattern) {
        std::uint16_t const bits = static_cast<std::uint16_t>(pattern);
        float const value = half::fromBits(bits);
        if (isNaN(bits)) {
            ASSERT_TRUE(std::isnan(value)) << pattern;
        } else {
            ASSERT_EQ(definition(bits), double(value)) << pattern;
        }
        ASSERT_EQ((bits & 0x8000) != 0, std::signbit(value)) << pattern;
    }
}

TEST(Half, MakesEveryPatternAgainOfItsNumber) {
    for (std::uint32_t pattern = 0; pattern < 65536; ++pattern) {
        std::uint16_t const bits = static_cast<std::uint16_t>(pattern);
        half const again(static_cast<float>(half::fromBits(bits)));
        // A NaN becomes a quiet one and keeps the rest of its pattern.
        ASSERT_EQ(isNaN(bits) ? bits | 0x0200 : bits, again.bits()) << pattern;
    }
}

TEST(Half, RoundsToTheNearestAndTiesToEven) {
    for (std::uint32_t pattern = 0; pattern < 0x7BFF; ++pattern) {
        std::uint16_t const lower = static_cast<std::uint16_t>(pattern);
        std::uint16_t const upper = static_cast<std::uint16_t>(pattern + 1);
        // The middle of two halves has 12 significant bits: it is a float, exactly.
        float const middle = static_cast<float>((definition(lower) + definition(upper)) / 2);
        ASSERT_EQ((lower & 1) == 0 ? lower : upper, half(middle).bits()) << pattern;
        ASSERT_EQ(lower, half(std::nextafter(middle, 0.0f)).bits()) << pattern;
        ASSERT_EQ(upper, half(std::nextafter(middle, fInfinity)).bits()) << pattern;
        ASSERT_EQ(((lower & 1) == 0 ? lower : upper) | 0x8000, half(-middle).bits()) << pattern;
    }
}

TEST(Half, GoesToInfinityFromHalfAStepAboveTheLargest) {
    EXPECT_EQ(0x7BFF, half(65504.0f).bits());
    EXPECT_EQ(0x7BFF, half(std::nextafter(65520.0f, 0.0f)).bits());
    EXPECT_EQ(0x7C00, half(65520.0f).bits());
    EXPECT_EQ(0x7C00, half(65536.0f).bits());
    EXPECT_EQ(0x7C00, half(std::numeric_limits<float>::max()).bits());
    EXPECT_EQ(0x7C00, half(fInfinity).bits());
    EXPECT_EQ(0xFC00, half(-fInfinity).bits());
    EXPECT_EQ(0xFC00, half(-65520.0f).bits());
}

TEST(Half, GoesToZeroUpToHalfTheSmallest) {
    EXPECT_EQ(0x0000, half(0.0f).bits());
    EXPECT_EQ(0x8000, half(-0.0f).bits());
    EXPECT_EQ(0x0000, half(std::ldexp(1.0f, -25)).bits());
    EXPECT_EQ(0x0001, half(std::nextafter(std::ldexp(1.0f, -25), 1.0f)).bits());
    EXPECT_EQ(0x0001, half(std::ldexp(1.0f, -24)).bits());
    EXPECT_EQ(0x8000, half(-std::numeric_limits<float>::denorm_min()).bits());
}

TEST(Half, KeepsANaNOneWhereItsPayloadIsCutOff) {
    half const low(floatOf(0x7F800001u));
    EXPECT_EQ(0x7E00, low.bits());
    EXPECT_TRUE(std::isnan(float(low)));
    EXPECT_EQ(0xFE00, half(floatOf(0xFFC00000u)).bits());
    EXPECT_EQ(0x7FC00000u, bitsOf(half::fromBits(0x7E00)));
}

TEST(Half, Prints) {
    std::ostringstream stream;
    stream << half(0.5f) << ' ' << half(-3.0f);
    EXPECT_EQ("0.5 -3", stream.str());
}

} // namespace
