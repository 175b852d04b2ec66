#pragma once

#include <iosfwd>

#include "orvo/core/Export.h"
#include "orvo/core/math/Float.h"
#include "orvo/core/spaces/ExtentInWorldSpace.h"

namespace ORVO {

/// A point in world space: float, independent of any image's resolution.
///
/// Threads: a plain value.
class ORVO_API PositionInWorldSpace {
public:
    /// The origin.
    PositionInWorldSpace() noexcept = default;
    PositionInWorldSpace(float x, float y) noexcept : oPosition_(x, y) {}
    explicit PositionInWorldSpace(float2 const& position) noexcept : oPosition_(position) {}

    float x() const noexcept { return oPosition_.x; }
    float y() const noexcept { return oPosition_.y; }
    float2 const& positionAsFloat2() const noexcept { return oPosition_; }

private:
    float2 oPosition_;
};

/// The extent from b to a; its components may be negative.
ORVO_API ExtentInWorldSpace operator-(PositionInWorldSpace const& a, PositionInWorldSpace const& b) noexcept;
/// The point moved by the extent; an undefined extent moves nothing.
ORVO_API PositionInWorldSpace operator+(PositionInWorldSpace const& a, ExtentInWorldSpace const& b) noexcept;

ORVO_API bool operator==(PositionInWorldSpace const& a, PositionInWorldSpace const& b) noexcept;
ORVO_API bool operator!=(PositionInWorldSpace const& a, PositionInWorldSpace const& b) noexcept;
/// Writes "(x, y)".
ORVO_API std::ostream& operator<<(std::ostream& stream, PositionInWorldSpace const& position);

} // namespace ORVO
