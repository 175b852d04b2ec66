#pragma once

#include "orvo/colour_engine/internal/ChannelCurve.h"
#include "orvo/colour_engine/internal/LcmsHandles.h"

#include <array>
#include <optional>

namespace ORVO::ColourEngine::Internal {

class Profile;

using Matrix = std::array<double, 9>; // row-major

/// One profile's tags: device value -> curve -> matrix -> XYZ relative to D50.
struct ShaperTags {
    std::array<cmsToneCurve const*, 3> aCurves_; ///< owned by the profile
    Matrix toXYZ_;
};

// Threads: one at a time.

Matrix multiply(Matrix const& a, Matrix const& b);

/// Nothing where the profile lacks one of them.
std::optional<ShaperTags> readTags(Profile const& profile);

/// XYZ -> linear device values; a grey device takes the luminance. Nothing for a matrix without an inverse.
std::optional<Matrix> fromXYZ(Profile const& profile, ShaperTags const& tags);

/// Over XYZ, what makes colours absolute: it puts the white of the one medium in the place of the other's.
Matrix whiteScale(Profile const& source, Profile const& destination);

/// Shares the curve, which is not null.
ChannelCurve curveFunction(CurveHandle spCurve);

} // namespace ORVO::ColourEngine::Internal
