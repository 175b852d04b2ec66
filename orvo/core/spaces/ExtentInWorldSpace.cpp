#include "orvo/core/spaces/ExtentInWorldSpace.h"

#include <limits>
#include <ostream>

namespace ORVO {

namespace {
constexpr float fInfinity = std::numeric_limits<float>::infinity();
} // namespace

ExtentInWorldSpace ExtentInWorldSpace::infinite() noexcept {
    return ExtentInWorldSpace(fInfinity, fInfinity);
}

bool ExtentInWorldSpace::isInfinite() const noexcept {
    return bDefined_ && (oExtent_.x == fInfinity || oExtent_.y == fInfinity);
}

bool operator==(ExtentInWorldSpace const& a, ExtentInWorldSpace const& b) noexcept {
    return a.isDefined() == b.isDefined() && a.extentAsFloat2() == b.extentAsFloat2();
}

bool operator!=(ExtentInWorldSpace const& a, ExtentInWorldSpace const& b) noexcept { return !(a == b); }

std::ostream& operator<<(std::ostream& stream, ExtentInWorldSpace const& extent) {
    return extent.isDefined() ? stream << extent.extentAsFloat2() : stream << "undefined";
}

} // namespace ORVO
