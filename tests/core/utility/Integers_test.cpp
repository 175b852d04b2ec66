#include "orvo/core/utility/Integers.h"

#include <limits>

#include "tests/support/Expect.h"

namespace {

using namespace ORVO;

TEST(Integers, NextPowerOfTwoIsNotLessThanItsArgument) {
    unsigned const rows[][2] = {{0, 1},
                                {1, 1},
                                {2, 2},
                                {3, 4},
                                {4, 4},
                                {5, 8},
                                {1000, 1024},
                                {1024, 1024},
                                {1025, 2048},
                                {0x7FFFFFFFu, 0x80000000u},
                                {0x80000000u, 0x80000000u}};
    for (auto const& row : rows)
        EXPECT_EQ(row[1], nextPowerOfTwo(row[0])) << row[0];
    for (unsigned power = 1; power != 0; power <<= 1)
        EXPECT_EQ(power, nextPowerOfTwo(power));
    ORVO_EXPECT_PARAMETER(nextPowerOfTwo(0x80000001u), "value <= 0x80000000u");
    ORVO_EXPECT_PARAMETER(nextPowerOfTwo(0xFFFFFFFFu), "value <= 0x80000000u");
}

TEST(Integers, IsPowerOfTwoKnowsThemAll) {
    EXPECT_FALSE(isPowerOfTwo(0));
    for (unsigned power = 4; power != 0; power <<= 1) {
        EXPECT_TRUE(isPowerOfTwo(power)) << power;
        EXPECT_FALSE(isPowerOfTwo(power - 1)) << power;
        EXPECT_FALSE(isPowerOfTwo(power + 1)) << power;
    }
    EXPECT_TRUE(isPowerOfTwo(1));
    EXPECT_TRUE(isPowerOfTwo(2));
    EXPECT_FALSE(isPowerOfTwo(3));
}

TEST(Integers, IncrementToBoundaryRoundsUp) {
    int const most = std::numeric_limits<int>::max();
    int const rows[][3] = {{0, 4, 0},       {1, 4, 4},          {5, 4, 8},      {8, 4, 8},   {100, 64, 128},
                           {193, 192, 384}, {7, 1, 7},          {-5, 4, -4},    {-8, 4, -8}, {-3, 4, 0},
                           {most, 1, most}, {most, most, most}, {1, most, most}};
    for (auto const& row : rows)
        EXPECT_EQ(row[2], incrementToBoundary(row[0], row[1])) << row[0] << ' ' << row[1];
}

TEST(Integers, IncrementToBoundaryRefusesWhatItCannotDo) {
    ORVO_EXPECT_PARAMETER(incrementToBoundary(5, 0), "boundary > 0");
    ORVO_EXPECT_PARAMETER(incrementToBoundary(5, -4), "boundary > 0");
    ORVO_EXPECT_PARAMETER(incrementToBoundary(std::numeric_limits<int>::max(), 64),
                          "Result of incrementToBoundary is out of range");
}

TEST(Integers, IsAlignedLooksAtTheAddress) {
    alignas(64) char const aBytes[128] = {};
    EXPECT_TRUE(isAligned(aBytes, 64));
    EXPECT_TRUE(isAligned(aBytes + 64, 64));
    EXPECT_FALSE(isAligned(aBytes + 16, 64));
    EXPECT_TRUE(isAligned(aBytes + 16, 16));
    EXPECT_TRUE(isAligned(aBytes + 3, 1));
    EXPECT_TRUE(isAligned(nullptr, 64));
}

} // namespace
