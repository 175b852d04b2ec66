#pragma once

#include "orvo/colour_engine/internal/TableStages.h"

#include <cstdint>
#include <optional>

namespace ORVO::ColourEngine::Internal {

class Profile;

/// The steps from one profile to another as their tags give them, tables before curves and matrix: those of
/// the source, the way through the connection space (with the black point or the white to be moved), those of
/// the destination. Nothing where a profile has neither, where its tables are in floats, for one or four
/// channels, or have more than 2^20 nodes. Whether the colour library takes the same steps is not asked here.
///
/// Threads: one at a time.
std::optional<TableStages> extractStages(Profile const& source, Profile const& destination,
                                         std::uint32_t intent, std::uint32_t options);

} // namespace ORVO::ColourEngine::Internal
