/// The way from sRGB to the wide gamut and back in bytes, and how far apart its ends may be.
#pragma once

#include "tests/filter_graph/support/ColourGraph.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <vector>

namespace ORVO::Test {

inline std::vector<FilterPtr> roundTrip() {
    return {makeTransformer(ColourEngine::PROFILE_SRGB, ColourEngine::PROFILE_WIDE_GAMUT),
            makeTransformer(ColourEngine::PROFILE_WIDE_GAMUT, ColourEngine::PROFILE_SRGB)};
}

/// 64 by 64 colours of R, G, B and A in bytes, and the largest steps that rounding to bytes on the way can
/// make.
///
/// Where bytes are kept in between, each channel w of the wide gamut is off by up to e = 0.5 / 255, and its
/// linear value, w^2.2, by 2.2 w^1.2 e. Back in the primaries of sRGB that is 1.40 times the error of red and
/// 0.40 times that of green in red, that of green alone in green, and 1.04 times that of blue and 0.04 times
/// that of green in blue. The curve of sRGB makes 12.92 times as much of it near black.
///
/// - Green: both curves belong to the same value, and their slopes multiply to 1.23 at most: 0.61 codes.
/// - Greys: as green, times 1.40 + 0.40 in red: 1.11 codes.
/// - Red that is 0 beside a green of 255: w is 0.565 in red and 1 in green, so that the linear error is
///   (1.40 * 1.11 + 0.40 * 2.2) e, and 12.92 times that is 15.8 codes.
/// - Blue of 7 beside a green of 255: w is 0.239 in blue; (1.04 * 0.40 + 0.04 * 2.2) e and 3.3 codes.
/// - Channels no more than 80 apart, at the end of the straight part of the curve, red and blue 11 beside a
///   green of 91: w is 0.21 in red, 0.36 in green and 0.11 in blue; (1.40 * 0.34 + 0.40 * 0.64) e and 4.7
///   codes in red, (1.04 * 0.15 + 0.04 * 0.64) e and 1.2 codes in blue.
///
/// Both ends are whole numbers: they are as far apart as those are when rounded.
struct RoundTripRow {
    char const* pName_;
    /// Random values are brought into a range that begins at a grey which rises from pixel to pixel.
    int nLargestGrey_;
    int nRange_;
    std::array<long, 3> aSteps_;

    void fill(PackedImage<std::uint8_t>& image) const {
        image.fillAtRandom(3);
        std::vector<std::uint8_t>& aPixels = image.pixels();
        for (std::size_t i = 0; i < aPixels.size(); ++i) {
            int const grey = static_cast<int>(i / 4 % 64) * nLargestGrey_ / 63;
            aPixels[i] = static_cast<std::uint8_t>(grey + aPixels[i] * nRange_ / 255);
        }
    }

    static long largestDifferenceIn(std::size_t iChannel, std::vector<std::uint8_t> const& a,
                                    std::vector<std::uint8_t> const& b) {
        long nLargest = 0;
        for (std::size_t i = iChannel; i < a.size(); i += 4)
            nLargest = std::max(nLargest, std::labs(long(a[i]) - long(b[i])));
        return nLargest;
    }
    void expectWithin(std::vector<std::uint8_t> const& aThere, std::vector<std::uint8_t> const& aBack) const {
        ASSERT_EQ(aThere.size(), aBack.size());
        for (std::size_t iChannel = 0; iChannel < 3; ++iChannel)
            EXPECT_LE(largestDifferenceIn(iChannel, aThere, aBack), aSteps_[iChannel]) << iChannel;
    }
};

inline std::vector<RoundTripRow> const& roundTripRows() {
    static std::vector<RoundTripRow> const aRows = {{"greys", 255, 0, {1, 1, 1}},
                                                    {"as in a photograph", 175, 80, {5, 1, 1}},
                                                    {"all colours", 0, 255, {16, 1, 3}}};
    return aRows;
}

} // namespace ORVO::Test
