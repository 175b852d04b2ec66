#pragma once

#include <array>
#include <cstdint>

namespace ORVO::ColourEngine {

/// A profile code from its four characters, the first in the highest byte.
constexpr std::uint32_t profileCode(char const (&text)[5]) {
    return static_cast<std::uint32_t>(static_cast<unsigned char>(text[0])) << 24U |
           static_cast<std::uint32_t>(static_cast<unsigned char>(text[1])) << 16U |
           static_cast<std::uint32_t>(static_cast<unsigned char>(text[2])) << 8U |
           static_cast<std::uint32_t>(static_cast<unsigned char>(text[3]));
}

/// The system's default: a wide-gamut RGB space.
constexpr std::uint32_t PROFILE_WIDE_GAMUT = 0x41533938;
constexpr std::uint32_t PROFILE_SRGB = profileCode("sRGB");
constexpr std::uint32_t PROFILE_DISPLAY_P3 = profileCode("P3  ");
constexpr std::uint32_t PROFILE_BT_2020 = profileCode("2020");
/// The primaries of sRGB, linear.
constexpr std::uint32_t PROFILE_LINEAR_SRGB = profileCode("LnRG");
/// Grey of gamma 2.2.
constexpr std::uint32_t PROFILE_GRAY = profileCode("GRAY");

/// How a space encodes linear light v, 0..1, as a sample u, 0..1.
enum class Transfer {
    Gamma,  ///< v = u ^ gamma
    SRGB,   ///< IEC 61966-2-1: v = u / 12.92 up to 0.04045, then ((u + 0.055) / 1.055) ^ 2.4
    BT2020, ///< BT.2020: v = u / 4.5 up to 4.5 * beta, then ((u + alpha - 1) / alpha) ^ (1 / 0.45)
};

/// A space that the embedded engine knows by itself.
struct BuiltInProfile {
    struct Chromaticity {
        double x;
        double y;
    };

    std::uint32_t code;
    bool bGray;                             ///< one channel; the primaries do not count
    std::array<Chromaticity, 3> aPrimaries; ///< red, green, blue, CIE 1931 xy
    Transfer eTransfer;
    double gamma; ///< of Transfer::Gamma
};

/// CIE standard illuminant D65, the white of all of them.
constexpr BuiltInProfile::Chromaticity PROFILE_WHITE = {0.3127, 0.3290};

constexpr std::array<BuiltInProfile, 6> BUILT_IN_PROFILES = {{
    {PROFILE_WIDE_GAMUT, false, {{{0.64, 0.33}, {0.21, 0.71}, {0.15, 0.06}}}, Transfer::Gamma, 563.0 / 256.0},
    {PROFILE_SRGB, false, {{{0.64, 0.33}, {0.30, 0.60}, {0.15, 0.06}}}, Transfer::SRGB, 0.0},
    {PROFILE_DISPLAY_P3, false, {{{0.680, 0.320}, {0.265, 0.690}, {0.150, 0.060}}}, Transfer::SRGB, 0.0},
    {PROFILE_BT_2020, false, {{{0.708, 0.292}, {0.170, 0.797}, {0.131, 0.046}}}, Transfer::BT2020, 0.0},
    {PROFILE_LINEAR_SRGB, false, {{{0.64, 0.33}, {0.30, 0.60}, {0.15, 0.06}}}, Transfer::Gamma, 1.0},
    {PROFILE_GRAY, true, {{{0.0, 0.0}, {0.0, 0.0}, {0.0, 0.0}}}, Transfer::Gamma, 2.2},
}};

} // namespace ORVO::ColourEngine
