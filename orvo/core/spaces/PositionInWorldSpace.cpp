#include "orvo/core/spaces/PositionInWorldSpace.h"

#include <ostream>

namespace ORVO {

ExtentInWorldSpace operator-(PositionInWorldSpace const& a, PositionInWorldSpace const& b) noexcept {
    return ExtentInWorldSpace(a.positionAsFloat2() - b.positionAsFloat2());
}

PositionInWorldSpace operator+(PositionInWorldSpace const& a, ExtentInWorldSpace const& b) noexcept {
    return PositionInWorldSpace(a.positionAsFloat2() + b.extentAsFloat2());
}

bool operator==(PositionInWorldSpace const& a, PositionInWorldSpace const& b) noexcept {
    return a.positionAsFloat2() == b.positionAsFloat2();
}

bool operator!=(PositionInWorldSpace const& a, PositionInWorldSpace const& b) noexcept { return !(a == b); }

std::ostream& operator<<(std::ostream& stream, PositionInWorldSpace const& position) {
    return stream << position.positionAsFloat2();
}

} // namespace ORVO
