#pragma once

#include <iosfwd>

#include "orvo/core/Export.h"
#include "orvo/core/math/Int.h"

namespace ORVO {

/// A width and a height in pixels, or undefined: no region yet.
///
/// Threads: a plain value.
class ORVO_API ExtentInPixelSpace {
public:
    /// Undefined.
    ExtentInPixelSpace() noexcept = default;
    /// Defined, whatever the numbers.
    ExtentInPixelSpace(int width, int height) noexcept : oExtent_(width, height), bDefined_(true) {}
    explicit ExtentInPixelSpace(int2 const& extent) noexcept : oExtent_(extent), bDefined_(true) {}

    /// 0 while undefined.
    int width() const noexcept { return oExtent_.x; }
    int height() const noexcept { return oExtent_.y; }
    int2 const& extentAsInt2() const noexcept { return oExtent_; }

    bool isDefined() const noexcept { return bDefined_; }

private:
    int2 oExtent_;
    bool bDefined_ = false;
};

/// Equal if both are undefined, or both are defined and have equal numbers.
ORVO_API bool operator==(ExtentInPixelSpace const& a, ExtentInPixelSpace const& b) noexcept;
ORVO_API bool operator!=(ExtentInPixelSpace const& a, ExtentInPixelSpace const& b) noexcept;
/// Writes "(width, height)" or "undefined".
ORVO_API std::ostream& operator<<(std::ostream& stream, ExtentInPixelSpace const& extent);

} // namespace ORVO
