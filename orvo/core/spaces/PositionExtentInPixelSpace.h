#pragma once

#include <iosfwd>

#include "orvo/core/Export.h"
#include "orvo/core/spaces/ExtentInPixelSpace.h"
#include "orvo/core/spaces/PositionInPixelSpace.h"

namespace ORVO {

/// A rectangle of pixels: its top-left pixel and its extent. y grows downwards.
///
/// Threads: a plain value.
class ORVO_API PositionExtentInPixelSpace {
public:
    /// At the origin, undefined.
    PositionExtentInPixelSpace() noexcept = default;
    /// At the origin.
    explicit PositionExtentInPixelSpace(ExtentInPixelSpace const& extent) noexcept : oExtent_(extent) {}
    PositionExtentInPixelSpace(PositionInPixelSpace const& position,
                               ExtentInPixelSpace const& extent) noexcept
        : oPosition_(position), oExtent_(extent) {}

    PositionInPixelSpace const& position() const noexcept { return oPosition_; }
    ExtentInPixelSpace const& extent() const noexcept { return oExtent_; }

private:
    PositionInPixelSpace oPosition_;
    ExtentInPixelSpace oExtent_;
};

/// The rectangle moved back by the position, in saturating arithmetic; its extent stays.
ORVO_API PositionExtentInPixelSpace operator-(PositionExtentInPixelSpace const& rectangle,
                                              PositionInPixelSpace const& position) noexcept;

/// Equal if positions and extents are.
ORVO_API bool operator==(PositionExtentInPixelSpace const& a, PositionExtentInPixelSpace const& b) noexcept;
ORVO_API bool operator!=(PositionExtentInPixelSpace const& a, PositionExtentInPixelSpace const& b) noexcept;
/// Writes "(x, y) (width, height)" or "(x, y) undefined".
ORVO_API std::ostream& operator<<(std::ostream& stream, PositionExtentInPixelSpace const& rectangle);

} // namespace ORVO
