#pragma once

#include <iosfwd>

#include "orvo/core/Export.h"
#include "orvo/core/math/Int.h"

namespace ORVO {

/// A pixel by its column and row; both may be negative.
///
/// Threads: a plain value.
class ORVO_API PositionInPixelSpace {
public:
    /// The origin.
    PositionInPixelSpace() noexcept = default;
    PositionInPixelSpace(int x, int y) noexcept : oPosition_(x, y) {}
    explicit PositionInPixelSpace(int2 const& position) noexcept : oPosition_(position) {}

    int x() const noexcept { return oPosition_.x; }
    int y() const noexcept { return oPosition_.y; }
    int2 const& positionAsInt2() const noexcept { return oPosition_; }

private:
    int2 oPosition_;
};

ORVO_API bool operator==(PositionInPixelSpace const& a, PositionInPixelSpace const& b) noexcept;
ORVO_API bool operator!=(PositionInPixelSpace const& a, PositionInPixelSpace const& b) noexcept;
/// Writes "(x, y)".
ORVO_API std::ostream& operator<<(std::ostream& stream, PositionInPixelSpace const& position);

} // namespace ORVO
