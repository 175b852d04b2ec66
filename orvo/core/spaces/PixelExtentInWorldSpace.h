#pragma once

#include <iosfwd>

#include "orvo/core/Export.h"
#include "orvo/core/spaces/ExtentInWorldSpace.h"

namespace ORVO {

/// The size of one pixel in world space, which ties an image's pixel space to world space.
///
/// Threads: a plain value.
class ORVO_API PixelExtentInWorldSpace {
public:
    /// 1 by 1.
    PixelExtentInWorldSpace() noexcept : oExtent_(1.0f, 1.0f) {}
    /// Takes any numbers; those who divide by them check them.
    PixelExtentInWorldSpace(float width, float height) noexcept : oExtent_(width, height) {}

    float width() const noexcept { return oExtent_.width(); }
    float height() const noexcept { return oExtent_.height(); }
    /// Always defined.
    ExtentInWorldSpace const& pixelExtent() const noexcept { return oExtent_; }

private:
    ExtentInWorldSpace oExtent_;
};

ORVO_API bool operator==(PixelExtentInWorldSpace const& a, PixelExtentInWorldSpace const& b) noexcept;
ORVO_API bool operator!=(PixelExtentInWorldSpace const& a, PixelExtentInWorldSpace const& b) noexcept;
/// Writes "(width, height)".
ORVO_API std::ostream& operator<<(std::ostream& stream, PixelExtentInWorldSpace const& pixelExtent);

} // namespace ORVO
