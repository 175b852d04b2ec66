#include "orvo/core/math/Float.h"

#include <gtest/gtest.h>

#include <sstream>

namespace {

using namespace ORVO;

template <typename Vector>
std::string printed(Vector const& value) {
    std::ostringstream stream;
    stream << value;
    return stream.str();
}

template <typename Vector>
class FloatVector : public testing::Test {
protected:
    static constexpr std::size_t nComponents = sizeof(Vector) / sizeof(float);
    /// Components from, from + step, ...
    static Vector ramp(float from, float step) {
        Vector result;
        for (std::size_t i = 0; i < nComponents; ++i)
            result[i] = from + step * static_cast<float>(i);
        return result;
    }
};
using FloatVectors = testing::Types<float2, float3, float4>;
TYPED_TEST_SUITE(FloatVector, FloatVectors);

TYPED_TEST(FloatVector, IsZeroByDefaultAndFilledFromOneValue) {
    for (float component : TypeParam())
        EXPECT_EQ(0.0f, component);
    for (float component : TypeParam(2.5f))
        EXPECT_EQ(2.5f, component);
}

TYPED_TEST(FloatVector, GivesItsComponentsByIndexAndInOrder) {
    TypeParam value = this->ramp(1.0f, 1.0f);
    TypeParam const& constant = value;
    EXPECT_EQ(&value.x, value.begin());
    EXPECT_EQ(&value.x, constant.begin());
    for (std::size_t i = 0; i < this->nComponents; ++i) {
        EXPECT_EQ(static_cast<float>(i + 1), constant[i]);
        EXPECT_EQ(value.begin() + i, &value[i]);
    }
    EXPECT_EQ(value.begin() + this->nComponents, value.end());
    EXPECT_EQ(constant.begin() + this->nComponents, constant.end());
    value[1] = 9.0f;
    EXPECT_EQ(9.0f, value.y);
}

TYPED_TEST(FloatVector, CalculatesComponentByComponent) {
    TypeParam const a = this->ramp(8.0f, 4.0f); // 8 12 16 20
    TypeParam const b = this->ramp(2.0f, 2.0f); // 2 4 6 8
    for (std::size_t i = 0; i < this->nComponents; ++i) {
        SCOPED_TRACE(i);
        float const x = 8.0f + 4.0f * static_cast<float>(i);
        float const y = 2.0f + 2.0f * static_cast<float>(i);
        EXPECT_EQ(x + y, (a + b)[i]);
        EXPECT_EQ(x - y, (a - b)[i]);
        EXPECT_EQ(x * y, (a * b)[i]);
        EXPECT_EQ(x / y, (a / b)[i]);
        EXPECT_EQ(x * 3.0f, (a * 3.0f)[i]);
        EXPECT_EQ(3.0f * x, (3.0f * a)[i]);
        EXPECT_EQ(x / 4.0f, (a / 4.0f)[i]);
        TypeParam c = a;
        EXPECT_EQ(x + y, (c += b)[i]);
        EXPECT_EQ(x, (c -= b)[i]);
        EXPECT_EQ(x * y, (c *= b)[i]);
        EXPECT_EQ(x, (c /= b)[i]);
        EXPECT_EQ(x * 0.5f, (c *= 0.5f)[i]);
        EXPECT_EQ(x, (c /= 0.5f)[i]);
    }
}

TYPED_TEST(FloatVector, ComparesEveryComponent) {
    TypeParam const a = this->ramp(1.0f, 1.0f);
    EXPECT_TRUE(a == TypeParam(a));
    EXPECT_FALSE(a != TypeParam(a));
    for (std::size_t i = 0; i < this->nComponents; ++i) {
        TypeParam b = a;
        b[i] = -1.0f;
        EXPECT_FALSE(a == b) << i;
        EXPECT_TRUE(a != b) << i;
    }
}

TEST(Float, HasComponentsByName) {
    float4 const value(1.0f, 2.0f, 3.0f, 4.0f);
    EXPECT_EQ(1.0f, value.x);
    EXPECT_EQ(2.0f, value.y);
    EXPECT_EQ(3.0f, value.z);
    EXPECT_EQ(4.0f, value.w);
}

TEST(Float, AddsProductsToADotProduct) {
    EXPECT_EQ(1.0f * 5.0f + 2.0f * 6.0f, dot(float2(1.0f, 2.0f), float2(5.0f, 6.0f)));
    EXPECT_EQ(38.0f, dot(float3(1.0f, 2.0f, 3.0f), float3(5.0f, 6.0f, 7.0f)));
    EXPECT_EQ(70.0f, dot(float4(1.0f, 2.0f, 3.0f, 4.0f), float4(5.0f, 6.0f, 7.0f, 8.0f)));
}

TEST(Float, Prints) {
    EXPECT_EQ("(1, -2.5)", printed(float2(1.0f, -2.5f)));
    EXPECT_EQ("(1, 2, 3)", printed(float3(1.0f, 2.0f, 3.0f)));
    EXPECT_EQ("(1, 2, 3, 0.25)", printed(float4(1.0f, 2.0f, 3.0f, 0.25f)));
}

} // namespace
