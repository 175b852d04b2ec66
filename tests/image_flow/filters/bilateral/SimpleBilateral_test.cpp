#include "orvo/image_flow/filters/bilateral/SimpleBilateral.h"

#include <gtest/gtest.h>

#include <limits>

namespace {

using namespace ORVO::ImageFlow::bilateral;

TEST(SimpleBilateral, HalfWindowIsThatOfTheRoundedSigmaAndBounded) {
    EXPECT_EQ(0, halfWindowOf(0.0F));
    EXPECT_EQ(0, halfWindowOf(0.46F));
    // ceil(1.0730) = 2, ceil(2.146) = 3, ceil(4.292) = 5, ceil(21.46) = 22, ceil(214.6) = 215; halved.
    EXPECT_EQ(1, halfWindowOf(0.5F));
    EXPECT_EQ(1, halfWindowOf(1.0F));
    EXPECT_EQ(2, halfWindowOf(2.0F));
    EXPECT_EQ(11, halfWindowOf(10.0F));
    EXPECT_EQ(107, halfWindowOf(100.0F));
    EXPECT_EQ(0, halfWindowOf(-10.0F));
    EXPECT_EQ(0, halfWindowOf(std::numeric_limits<float>::quiet_NaN()));
    EXPECT_EQ(kMaximalHalfWindow, halfWindowOf(1e30F));
    EXPECT_EQ(kMaximalHalfWindow, halfWindowOf(std::numeric_limits<float>::infinity()));
}

} // namespace
