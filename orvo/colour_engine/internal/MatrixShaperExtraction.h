#pragma once

#include "orvo/colour_engine/internal/ResolvedTransform.h"

#include <cstdint>
#include <optional>

namespace ORVO::ColourEngine::Internal {

class Profile;

/// The curves and the matrix from one profile to another as their tags give them; nothing where one of the
/// two has none, or a matrix without an inverse. Whether the colour library would use those tags is not asked
/// here.
///
/// Threads: one at a time.
std::optional<MatrixShaper> extractMatrixShaper(Profile const& source, Profile const& destination,
                                                std::uint32_t intent);

} // namespace ORVO::ColourEngine::Internal
