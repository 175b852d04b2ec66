#include "orvo/core/ColorSpace.h"

#include <ostream>

#include "orvo/core/Check.h"

namespace ORVO {

int getNumChannels(ColorSpace colorSpace) {
    switch (colorSpace) {
    case COLOR_SPACE_LUMINANCE:
        return 1;
    case COLOR_SPACE_LUMINANCE_ALPHA:
        return 2;
    case COLOR_SPACE_RGB:
    case COLOR_SPACE_LAB:
        return 3;
    case COLOR_SPACE_RGBA:
    case COLOR_SPACE_LABA:
        return 4;
    case COLOR_SPACE_UNNAMED:
        return 0;
    }
    ORVO_FAIL_PARAMETER("Unknown color space");
}

std::ostream& operator<<(std::ostream& stream, ColorSpace colorSpace) {
    switch (colorSpace) {
    case COLOR_SPACE_LUMINANCE:
        return stream << "COLOR_SPACE_LUMINANCE";
    case COLOR_SPACE_LUMINANCE_ALPHA:
        return stream << "COLOR_SPACE_LUMINANCE_ALPHA";
    case COLOR_SPACE_RGB:
        return stream << "COLOR_SPACE_RGB";
    case COLOR_SPACE_RGBA:
        return stream << "COLOR_SPACE_RGBA";
    case COLOR_SPACE_LAB:
        return stream << "COLOR_SPACE_LAB";
    case COLOR_SPACE_LABA:
        return stream << "COLOR_SPACE_LABA";
    case COLOR_SPACE_UNNAMED:
        return stream << "COLOR_SPACE_UNNAMED";
    }
    return stream << "ColorSpace(" << static_cast<std::int32_t>(colorSpace) << ")";
}

} // namespace ORVO
