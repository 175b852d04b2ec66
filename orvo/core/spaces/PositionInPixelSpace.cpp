#include "orvo/core/spaces/PositionInPixelSpace.h"

#include <ostream>

namespace ORVO {

bool operator==(PositionInPixelSpace const& a, PositionInPixelSpace const& b) noexcept {
    return a.positionAsInt2() == b.positionAsInt2();
}

bool operator!=(PositionInPixelSpace const& a, PositionInPixelSpace const& b) noexcept { return !(a == b); }

std::ostream& operator<<(std::ostream& stream, PositionInPixelSpace const& position) {
    return stream << position.positionAsInt2();
}

} // namespace ORVO
