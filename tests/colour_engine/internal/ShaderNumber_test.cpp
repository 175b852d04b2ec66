#include "orvo/colour_engine/internal/ShaderNumber.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <string>

namespace ORVO::ColourEngine::Internal {
namespace {

TEST(ShaderNumber, IsNeverAnInteger) {
    EXPECT_EQ("1.0", shaderNumber(1.0));
    EXPECT_EQ("0.0", shaderNumber(0.0));
    EXPECT_EQ("0.5", shaderNumber(0.5));
    EXPECT_EQ("16777216.0", shaderNumber(16777216.0));
    EXPECT_EQ("1e-05", shaderNumber(1e-5));
}

TEST(ShaderNumber, PutsNegativeOnesInParentheses) {
    EXPECT_EQ("(-1.0)", shaderNumber(-1.0));
    EXPECT_EQ("(-2.5)", shaderNumber(-2.5));
}

TEST(ShaderNumber, IsTheFloatItself) {
    for (double const value : {1.0 / 3.0, 0.055 / 1.055, 3.0e-7, 123456.789}) {
        EXPECT_EQ(static_cast<float>(value), std::strtof(shaderNumber(value).c_str(), nullptr));
    }
}

} // namespace
} // namespace ORVO::ColourEngine::Internal
