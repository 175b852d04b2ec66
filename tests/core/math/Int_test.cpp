#include "orvo/core/math/Int.h"

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
class IntVector : public testing::Test {
protected:
    static constexpr std::size_t nComponents = sizeof(Vector) / sizeof(std::int32_t);
};
using IntVectors = testing::Types<int2, int3, int4>;
TYPED_TEST_SUITE(IntVector, IntVectors);

TYPED_TEST(IntVector, IsZeroByDefaultAndFilledFromOneValue) {
    TypeParam const zero;
    TypeParam const filled(-7);
    for (std::size_t i = 0; i < this->nComponents; ++i) {
        EXPECT_EQ(0, zero[i]);
        EXPECT_EQ(-7, filled[i]);
    }
}

TYPED_TEST(IntVector, ComparesEveryComponent) {
    TypeParam const a(3);
    EXPECT_TRUE(a == TypeParam(3));
    EXPECT_FALSE(a != TypeParam(3));
    for (std::size_t i = 0; i < this->nComponents; ++i) {
        TypeParam b = a;
        b[i] = 4;
        EXPECT_FALSE(a == b) << i;
        EXPECT_TRUE(a != b) << i;
    }
}

TEST(Int, HasComponentsByName) {
    int4 const value(1, 2, 3, 4);
    EXPECT_EQ(1, value.x);
    EXPECT_EQ(2, value.y);
    EXPECT_EQ(3, value.z);
    EXPECT_EQ(4, value.w);
}

TEST(Int, Prints) {
    EXPECT_EQ("(1, -2)", printed(int2(1, -2)));
    EXPECT_EQ("(1, 2, 3)", printed(int3(1, 2, 3)));
    EXPECT_EQ("(1, 2, 3, 4)", printed(int4(1, 2, 3, 4)));
}

} // namespace
