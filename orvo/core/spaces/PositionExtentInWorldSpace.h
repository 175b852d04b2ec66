#pragma once

#include <iosfwd>

#include "orvo/core/Export.h"
#include "orvo/core/spaces/ExtentInWorldSpace.h"
#include "orvo/core/spaces/PositionInWorldSpace.h"

namespace ORVO {

/// A rectangle in world space: its top-left point and its extent. y grows downwards.
///
/// *Undefined* (its extent is): no region yet. *Empty*: defined, and not both width and height above 0; it
/// contains no point. *Infinite* in a direction whose extent is IEEE infinity: it covers all of that
/// direction, and its position there says nothing.
///
/// | operation | with undefined | with empty | with infinite |
/// |---|---|---|---|
/// | a.include(b) | the other rectangle | the other rectangle; of two empty ones a stays | infinite |
/// | a.intersect(b) | undefined | empty, 0 by 0 | the other rectangle |
/// | a.outset(m) | stays | grows like any other | stays infinite |
/// | isInfinite() | false | false | true, in one direction or both |
///
/// Threads: a plain value.
class ORVO_API PositionExtentInWorldSpace {
public:
    /// At the origin, undefined.
    PositionExtentInWorldSpace() noexcept = default;
    /// At the origin.
    explicit PositionExtentInWorldSpace(ExtentInWorldSpace const& extent) noexcept : oExtent_(extent) {}
    PositionExtentInWorldSpace(PositionInWorldSpace const& position,
                               ExtentInWorldSpace const& extent) noexcept
        : oPosition_(position), oExtent_(extent) {}

    PositionInWorldSpace const& position() const noexcept { return oPosition_; }
    ExtentInWorldSpace const& extent() const noexcept { return oExtent_; }
    /// position() + extent(); the position itself while undefined.
    PositionInWorldSpace bottomRightPosition() const noexcept;

    /// Whether the extent is infinite.
    bool isInfinite() const noexcept { return oExtent_.isInfinite(); }
    /// Whether it is defined and contains no point.
    bool isEmpty() const noexcept;

    /// Grows to the smallest rectangle that contains both. Into an undefined rectangle it gives the other
    /// one; an undefined other changes nothing. Where one contains the other, the numbers of the larger are
    /// kept exactly.
    void include(PositionExtentInWorldSpace const& other) noexcept;

    /// Shrinks to what both cover; undefined if either is. Disjoint rectangles, and those that only touch,
    /// give a defined rectangle of 0 by 0. Where one contains the other, the numbers of the smaller are kept
    /// exactly.
    void intersect(PositionExtentInWorldSpace const& other) noexcept;

    /// Grows by margin on every side: x to the left and to the right, y to the top and to the bottom. A
    /// negative margin shrinks, at most to 0 around the centre. An undefined rectangle stays undefined.
    void outset(float2 const& margin) noexcept;

private:
    PositionInWorldSpace oPosition_;
    ExtentInWorldSpace oExtent_;
};

/// Equal if positions and extents are.
ORVO_API bool operator==(PositionExtentInWorldSpace const& a, PositionExtentInWorldSpace const& b) noexcept;
ORVO_API bool operator!=(PositionExtentInWorldSpace const& a, PositionExtentInWorldSpace const& b) noexcept;
/// Writes "(x, y) (width, height)" or "(x, y) undefined".
ORVO_API std::ostream& operator<<(std::ostream& stream, PositionExtentInWorldSpace const& rectangle);

} // namespace ORVO
