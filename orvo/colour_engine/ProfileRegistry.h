#pragma once

#include "orvo/core/Export.h"

#include <cstddef>
#include <cstdint>

namespace ORVO::ColourEngine {

/// Makes an ICC profile known to the embedded engine under a code, which "srcProfile" and "dstProfile" of the
/// colour transform then take:
///
///     ColourEngine::registerProfile(ColourEngine::profileCode("Cam1"), bytes.data(), bytes.size());
///
/// The bytes, a whole profile as it stands in a file, are copied. RGB and grey profiles of versions 2 and 4
/// are taken; one that has tables in one direction alone works in that direction. A code that was registered
/// before stands for the new profile from then on, except that identical bytes change nothing; transforms
/// that exist keep theirs.
///
/// Throws `ParameterException` "Not an ICC profile", "Profile is neither RGB nor grey", "Profile describes no
/// colours" (device links, and profiles that lack their curves or tables), "Profile code is built in" or
/// "Enforce pBytes != NULL"; the codes are then as they were. Threads: any.
ORVO_API void registerProfile(std::uint32_t code, void const* pBytes, std::size_t nBytes);

/// Takes a registered profile away; false where the code is not one of them. Transforms that exist keep it.
/// Threads: any.
ORVO_API bool unregisterProfile(std::uint32_t code);

/// Whether the embedded engine knows a code, built in or registered.
/// Threads: any.
ORVO_API bool isKnownProfile(std::uint32_t code);

} // namespace ORVO::ColourEngine
