#include "orvo/core/math/Matrix.h"

#include <gtest/gtest.h>

#include <sstream>

namespace {

using namespace ORVO;

template <typename Matrix>
class SquareMatrix : public testing::Test {};
using Matrices = testing::Types<float2x2, float3x3, float4x4>;
TYPED_TEST_SUITE(SquareMatrix, Matrices);

TYPED_TEST(SquareMatrix, IsTheIdentityByDefault) {
    TypeParam const matrix;
    std::size_t const nRows = sizeof(TypeParam) == 16 ? 2 : sizeof(TypeParam) == 36 ? 3 : 4;
    ASSERT_EQ(nRows * nRows * sizeof(float), sizeof(TypeParam));
    for (std::size_t row = 0; row < nRows; ++row) {
        for (std::size_t column = 0; column < nRows; ++column)
            EXPECT_EQ(row == column ? 1.0f : 0.0f, matrix(row, column)) << row << ' ' << column;
    }
}

TYPED_TEST(SquareMatrix, StandsRowAfterRowAndComparesEveryElement) {
    TypeParam const identity;
    std::size_t i = 0;
    for (float const& element : identity) {
        TypeParam other;
        EXPECT_TRUE(identity == other);
        EXPECT_FALSE(identity != other);
        other.begin()[i] = 5.0f;
        EXPECT_FALSE(identity == other) << i;
        EXPECT_TRUE(identity != other) << i;
        EXPECT_EQ(identity.begin() + i, &element);
        ++i;
    }
    TypeParam matrix;
    matrix(1, 0) = 7.0f;
    EXPECT_EQ(7.0f, matrix.begin()[sizeof(TypeParam) == 16 ? 2 : sizeof(TypeParam) == 36 ? 3 : 4]);
}

TEST(Matrix, Prints) {
    std::ostringstream stream;
    float2x2 two;
    two(0, 1) = 2.5f;
    stream << two << '\n' << float3x3() << '\n' << float4x4();
    EXPECT_EQ("((1, 2.5), (0, 1))\n"
              "((1, 0, 0), (0, 1, 0), (0, 0, 1))\n"
              "((1, 0, 0, 0), (0, 1, 0, 0), (0, 0, 1, 0), (0, 0, 0, 1))",
              stream.str());
}

} // namespace
