#include "orvo/core/spaces/PositionExtentInWorldSpace.h"

#include <algorithm>
#include <limits>
#include <ostream>

namespace ORVO {

namespace {

/// One direction of a rectangle. Ends are worked out in double, where the sum of two floats of any likely
/// magnitude is exact, so that a side that one operand gives alone keeps its float numbers.
struct Span {
    float fPosition_;
    float fExtent_;

    bool isInfinite() const { return fExtent_ == std::numeric_limits<float>::infinity(); }
    double end() const { return double(fPosition_) + double(fExtent_); }
};

bool contains(Span const& outer, Span const& inner) {
    return outer.isInfinite() ||
           (!inner.isInfinite() && outer.fPosition_ <= inner.fPosition_ && outer.end() >= inner.end());
}

Span include(Span const& a, Span const& b) {
    if (contains(a, b))
        return a;
    if (contains(b, a))
        return b;
    float const position = std::min(a.fPosition_, b.fPosition_);
    return {position, static_cast<float>(std::max(a.end(), b.end()) - double(position))};
}

Span intersect(Span const& a, Span const& b) {
    if (contains(a, b))
        return b;
    if (contains(b, a))
        return a;
    float const position = std::max(a.fPosition_, b.fPosition_);
    return {position, static_cast<float>(std::min(a.end(), b.end()) - double(position))};
}

Span outset(Span const& span, float margin) {
    if (span.isInfinite())
        return span;
    if (margin < 0.0f && -2.0 * margin >= span.fExtent_)
        return {static_cast<float>(span.fPosition_ + 0.5 * span.fExtent_), 0.0f};
    return {span.fPosition_ - margin, static_cast<float>(span.fExtent_ + 2.0 * margin)};
}

Span horizontal(PositionExtentInWorldSpace const& rectangle) {
    return {rectangle.position().x(), rectangle.extent().width()};
}

Span vertical(PositionExtentInWorldSpace const& rectangle) {
    return {rectangle.position().y(), rectangle.extent().height()};
}

PositionExtentInWorldSpace rectangleOf(Span const& x, Span const& y) {
    return PositionExtentInWorldSpace(PositionInWorldSpace(x.fPosition_, y.fPosition_),
                                      ExtentInWorldSpace(x.fExtent_, y.fExtent_));
}

} // namespace

PositionInWorldSpace PositionExtentInWorldSpace::bottomRightPosition() const noexcept {
    return oPosition_ + oExtent_;
}

bool PositionExtentInWorldSpace::isEmpty() const noexcept {
    return oExtent_.isDefined() && !(oExtent_.width() > 0.0f && oExtent_.height() > 0.0f);
}

void PositionExtentInWorldSpace::include(PositionExtentInWorldSpace const& other) noexcept {
    if (!other.oExtent_.isDefined())
        return;
    if (!oExtent_.isDefined() || (isEmpty() && !other.isEmpty())) {
        *this = other;
        return;
    }
    if (!other.isEmpty())
        *this = rectangleOf(ORVO::include(horizontal(*this), horizontal(other)),
                            ORVO::include(vertical(*this), vertical(other)));
}

void PositionExtentInWorldSpace::intersect(PositionExtentInWorldSpace const& other) noexcept {
    if (!oExtent_.isDefined() || !other.oExtent_.isDefined()) {
        oExtent_ = ExtentInWorldSpace();
        return;
    }
    *this = rectangleOf(ORVO::intersect(horizontal(*this), horizontal(other)),
                        ORVO::intersect(vertical(*this), vertical(other)));
    if (isEmpty())
        oExtent_ = ExtentInWorldSpace(0.0f, 0.0f);
}

void PositionExtentInWorldSpace::outset(float2 const& margin) noexcept {
    if (oExtent_.isDefined())
        *this =
            rectangleOf(ORVO::outset(horizontal(*this), margin.x), ORVO::outset(vertical(*this), margin.y));
}

bool operator==(PositionExtentInWorldSpace const& a, PositionExtentInWorldSpace const& b) noexcept {
    return a.position() == b.position() && a.extent() == b.extent();
}

bool operator!=(PositionExtentInWorldSpace const& a, PositionExtentInWorldSpace const& b) noexcept {
    return !(a == b);
}

std::ostream& operator<<(std::ostream& stream, PositionExtentInWorldSpace const& rectangle) {
    return stream << rectangle.position() << ' ' << rectangle.extent();
}

} // namespace ORVO
