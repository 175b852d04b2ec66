#include "orvo/core/utility/SaturatingCast.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <limits>

namespace {

using ORVO::saturatingCast;

template <typename Int>
class SaturatingCast : public testing::Test {};
using Ints = testing::Types<std::int8_t, std::uint8_t, std::int16_t, std::uint16_t, std::int32_t,
                            std::uint32_t, std::int64_t, std::uint64_t>;
TYPED_TEST_SUITE(SaturatingCast, Ints);

template <typename Int, typename Float>
void expectFromFloat() {
    using Limits = std::numeric_limits<Int>;
    Float const infinity = std::numeric_limits<Float>::infinity();
    EXPECT_EQ(Int(0), saturatingCast<Int>(std::numeric_limits<Float>::quiet_NaN()));
    EXPECT_EQ(Limits::max(), saturatingCast<Int>(infinity));
    EXPECT_EQ(Limits::min(), saturatingCast<Int>(-infinity));
    EXPECT_EQ(Limits::max(), saturatingCast<Int>(std::numeric_limits<Float>::max()));
    EXPECT_EQ(Limits::min(), saturatingCast<Int>(std::numeric_limits<Float>::lowest()));
    // 2^digits is the first number beyond; the number below it is in range.
    Float const beyond = std::ldexp(Float(1), Limits::digits);
    EXPECT_EQ(Limits::max(), saturatingCast<Int>(beyond));
    Float const below = std::nextafter(beyond, Float(0));
    EXPECT_EQ(static_cast<Int>(below), saturatingCast<Int>(below));
    EXPECT_EQ(Int(0), saturatingCast<Int>(Float(0.999)));
    EXPECT_EQ(Int(0), saturatingCast<Int>(Float(-0.999)));
    EXPECT_EQ(Int(100), saturatingCast<Int>(Float(100.7)));
    EXPECT_EQ(Limits::is_signed ? Int(-100) : Int(0), saturatingCast<Int>(Float(-100.7)));
    if (Limits::is_signed) {
        EXPECT_EQ(Limits::min(), saturatingCast<Int>(-beyond));
        EXPECT_EQ(Limits::min(), saturatingCast<Int>(std::nextafter(-beyond, -infinity)));
    }
}

TYPED_TEST(SaturatingCast, TakesFloatingPointNumbers) {
    expectFromFloat<TypeParam, float>();
    expectFromFloat<TypeParam, double>();
}

TYPED_TEST(SaturatingCast, TakesIntegers) {
    using Limits = std::numeric_limits<TypeParam>;
    EXPECT_EQ(TypeParam(0), saturatingCast<TypeParam>(0));
    EXPECT_EQ(TypeParam(100), saturatingCast<TypeParam>(100));
    EXPECT_EQ(TypeParam(100), saturatingCast<TypeParam>(100u));
    EXPECT_EQ(Limits::is_signed ? TypeParam(-100) : TypeParam(0), saturatingCast<TypeParam>(-100));
    EXPECT_EQ(Limits::max(), saturatingCast<TypeParam>(std::numeric_limits<std::uint64_t>::max()));
    EXPECT_EQ(Limits::min(), saturatingCast<TypeParam>(std::numeric_limits<std::int64_t>::min()));
    EXPECT_EQ(Limits::max(), saturatingCast<TypeParam>(Limits::max()));
    EXPECT_EQ(Limits::min(), saturatingCast<TypeParam>(Limits::min()));
}

TEST(SaturatingCastToInt, TakesTheLastFloatBelowTheBound) {
    EXPECT_EQ(2147483520, saturatingCast<int>(2147483520.0f)); // 2^31 - 128
    EXPECT_EQ(2147483647, saturatingCast<int>(2147483648.0f)); // 2^31
    EXPECT_EQ(-2147483647 - 1, saturatingCast<int>(-2147483648.0f));
    EXPECT_EQ(2147483647, saturatingCast<int>(2147483647.5));
    EXPECT_EQ(2147483646, saturatingCast<int>(2147483646.5));
    static_assert(saturatingCast<std::uint8_t>(300.0f) == 255);
}

} // namespace
