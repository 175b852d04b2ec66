#pragma once

#include <cstdint>
#include <iosfwd>

#include "orvo/core/Export.h"

namespace ORVO {

/// The colour interpretation of image data. Channels stand in the order of the name; an A is alpha.
enum ColorSpace : std::int32_t {
    COLOR_SPACE_LUMINANCE = 0,       ///< 1 channel: grey.
    COLOR_SPACE_LUMINANCE_ALPHA = 1, ///< 2 channels.
    COLOR_SPACE_RGB = 2,             ///< 3 channels.
    COLOR_SPACE_RGBA = 3,            ///< 4 channels.
    COLOR_SPACE_LAB = 4,             ///< 3 channels: CIE L*a*b*.
    COLOR_SPACE_LABA = 5,            ///< 4 channels: CIE L*a*b* and alpha.
    COLOR_SPACE_UNNAMED = 6          ///< Channels of no named colour space, in any number.
};

/// The number of channels of a colour space; 0 for COLOR_SPACE_UNNAMED, whose number is not known from its
/// name. Throws ParameterException "Unknown color space" for a value outside the enumeration. Threads: any.
ORVO_API int getNumChannels(ColorSpace colorSpace);

/// Writes the enumerator's name, or "ColorSpace(<number>)" for any other value.
ORVO_API std::ostream& operator<<(std::ostream& stream, ColorSpace colorSpace);

} // namespace ORVO
