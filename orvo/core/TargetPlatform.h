#pragma once

#include <cstdint>
#include <iosfwd>

#include "orvo/core/Export.h"

namespace ORVO {

/// Where an image lives and where a filter runs. The numbers are part of the interface.
enum TargetPlatform : std::int32_t {
    ORVO_TARGET_GL = 0,         ///< OpenGL: textures and fragment programs.
    ORVO_TARGET_CPU = 1,        ///< Host memory and host processors.
    ORVO_TARGET_RESERVED_2 = 2, ///< Not in use.
    ORVO_TARGET_RESERVED_3 = 3, ///< Not in use.
    ORVO_TARGET_UNSET = 4       ///< A filter whose constructor has not yet said where it runs.
};

/// Writes the enumerator's name, or "TargetPlatform(<number>)" for any other value.
ORVO_API std::ostream& operator<<(std::ostream& stream, TargetPlatform platform);

} // namespace ORVO
