#pragma once

#include "orvo/core/Export.h"

#include <cstdint>
#include <memory>

namespace ORVO::ColourEngine::Internal {

class Profile;
class ResolvedTransform;

/// The option of a transform: the source's darkest colour goes to the destination's.
constexpr std::uint32_t TRANSFORM_BLACK_POINT_COMPENSATION = 1;

/// Works out what a transform does. Where both profiles are curves and a matrix, and what follows from those
/// agrees with the colour library's own double-precision road, that is the result; else the steps through the
/// profiles' tables, where those agree; else a cube fitted to that road. Throws `std::runtime_error` where
/// the colour library knows no road between the two.
///
/// Threads: any; one at a time works.
ORVO_API std::shared_ptr<ResolvedTransform const> resolveTransform(Profile const& source,
                                                                   Profile const& destination,
                                                                   std::uint32_t intent,
                                                                   std::uint32_t options);

} // namespace ORVO::ColourEngine::Internal
