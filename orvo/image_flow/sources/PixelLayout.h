#pragma once

#include <cstdint>

namespace ORVO {

/// How the channels of raw pixels lie in memory. What a loader makes of a layout is its own: see
/// `ImageCPUInput::load8BitUnsignedImageData` and its siblings.
enum tePixelFormat : std::int32_t {
    PIXEL_LAYOUT_BGRA = 0,
    PIXEL_LAYOUT_RGBA = 1,
    PIXEL_LAYOUT_RGB = 2,
    PIXEL_LAYOUT_LUMINANCE = 3
};

} // namespace ORVO
