/// What colour transforms make of pictures of one to four channels: rows of a table for both targets.
#pragma once

#include "tests/colour_engine/support/ICCProfiles.h"
#include "tests/filter_graph/support/ColourGraph.h"

#include <lcms2.h>

#include <array>
#include <cmath>
#include <cstddef>
#include <utility>
#include <vector>

#include "orvo/colour_engine/ProfileRegistry.h"

namespace ORVO::Test {

/// A profile of the host's, registered for a scope: the primaries of sRGB, with the curves u, u^2 and u^3 for
/// red, green and blue. To linear sRGB it takes (r, g, b) to (r, g^2, b^3).
class UnevenProfile {
public:
    static constexpr std::uint32_t kCode = ColourEngine::profileCode("unev");

    UnevenProfile() {
        cmsCIExyY const white = {0.3127, 0.3290, 1.0};
        cmsCIExyYTRIPLE const primaries = {{0.64, 0.33, 1.0}, {0.30, 0.60, 1.0}, {0.15, 0.06, 1.0}};
        cmsToneCurve* const aCurves[3] = {cmsBuildGamma(nullptr, 1.0), cmsBuildGamma(nullptr, 2.0),
                                          cmsBuildGamma(nullptr, 3.0)};
        Bytes const aBytes = bytesOf(cmsCreateRGBProfile(&white, &primaries, aCurves));
        for (cmsToneCurve* const pCurve : aCurves)
            cmsFreeToneCurve(pCurve);
        ColourEngine::registerProfile(kCode, aBytes.data(), aBytes.size());
    }
    ~UnevenProfile() { ColourEngine::unregisterProfile(kCode); }
    UnevenProfile(UnevenProfile const&) = delete;
    UnevenProfile& operator=(UnevenProfile const&) = delete;
};

using Colour = std::array<double, 3>;

/// A chain of transforms between pictures of so many channels, and what it makes of a colour.
struct GreyRow {
    char const* pName_;
    std::size_t nInput_;
    std::size_t nOutput_;
    std::vector<std::pair<std::uint32_t, std::uint32_t>> aSteps_;
    Colour (*result_)(Colour const&);
    /// How many codes of a byte the result may be off: 1, and more where a steep step follows rounded bytes.
    int nTolerance_;

    std::vector<FilterPtr> filters() const {
        std::vector<FilterPtr> aFilters;
        for (auto const& [source, destination] : aSteps_)
            aFilters.push_back(makeTransformer(source, destination));
        return aFilters;
    }
};

inline std::vector<GreyRow> const& greyRows() {
    using ColourEngine::PROFILE_GRAY;
    constexpr auto kLinear = ColourEngine::PROFILE_LINEAR_SRGB;
    constexpr auto kUneven = UnevenProfile::kCode;
    static constexpr auto all = [](Colour const& c) { return Colour{c[0], c[1] * c[1], c[2] * c[2] * c[2]}; };
    static constexpr auto green = [](Colour const& c) {
        double const g = c[1] * c[1];
        return Colour{g, g, g};
    };
    static std::vector<GreyRow> const aRows = {
        {"grey to grey", 1, 1, {{kUneven, kLinear}}, green, 1},
        {"grey and alpha to the same", 2, 2, {{kUneven, kLinear}}, green, 1},
        {"RGB to RGB", 3, 3, {{kUneven, kLinear}}, all, 1},
        {"RGBA to RGBA", 4, 4, {{kUneven, kLinear}}, all, 1},
        // The image that is written says what a result is.
        {"grey to RGB", 1, 3, {{kUneven, kLinear}}, all, 1},
        {"RGB to grey", 3, 1, {{kUneven, kLinear}}, green, 1},
        // Between transforms a picture has the channels that come in. The luminance of a linear grey is that
        // grey; to the power of 1 / 2.2 it is at most 2.1 times as steep from 64 on.
        {"grey, grey, grey",
         1,
         1,
         {{kUneven, kLinear}, {kLinear, PROFILE_GRAY}},
         [](Colour const& c) {
             double const v = std::pow(c[1] * c[1], 1 / 2.2);
             return Colour{v, v, v};
         },
         2},
        {"grey, grey, RGB",
         1,
         3,
         {{kUneven, kLinear}, {kUneven, kLinear}},
         [](Colour const& c) { return all(green(c)); },
         2},
        // The luminances of the primaries of sRGB, adapted to D50 as profiles have them.
        {"RGB, RGB, grey",
         3,
         1,
         {{kUneven, kLinear}, {kLinear, PROFILE_GRAY}},
         [](Colour const& c) {
             Colour const linear = all(c);
             double const v = std::pow(0.2225 * linear[0] + 0.7169 * linear[1] + 0.0606 * linear[2], 1 / 2.2);
             return Colour{v, v, v};
         },
         2}};
    return aRows;
}

/// Fills an image with values from 64 up to 255, or as much of white in words.
template <typename T>
void fillWithLightColours(PackedImage<T>& image) {
    image.fillAtRandom(9);
    for (T& value : image.pixels())
        value = static_cast<T>(value - value / 4 + PackedImage<T>::kWhite / 4);
}

/// Compares all pixels with the result of the row; alpha, where both have it, must have stayed.
template <typename T>
void expectResultOf(GreyRow const& row, std::vector<T> const& aInput, std::vector<T> const& aOutput) {
    double const white = PackedImage<T>::kWhite;
    double const tolerance = row.nTolerance_ * white / 255.0;
    std::size_t const nPixels = aInput.size() / row.nInput_;
    ASSERT_EQ(nPixels * row.nOutput_, aOutput.size());
    std::size_t const nColours = row.nOutput_ < 3 ? 1 : 3;
    double largest = 0.0;
    for (std::size_t i = 0; i < nPixels; ++i) {
        T const* const pIn = &aInput[i * row.nInput_];
        T const* const pOut = &aOutput[i * row.nOutput_];
        Colour colour{};
        for (std::size_t c = 0; c < 3; ++c)
            colour[c] = pIn[row.nInput_ < 3 ? 0 : c] / white;
        Colour const expected = row.result_(colour);
        for (std::size_t c = 0; c < nColours; ++c)
            largest = std::max(largest, std::abs(pOut[c] - expected[c] * white));
        if (row.nInput_ == row.nOutput_ && row.nInput_ % 2 == 0) {
            EXPECT_EQ(pIn[row.nInput_ - 1], pOut[row.nOutput_ - 1]);
        }
    }
    EXPECT_LE(largest, tolerance);
}

} // namespace ORVO::Test
