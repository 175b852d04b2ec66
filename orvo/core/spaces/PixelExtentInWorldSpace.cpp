#include "orvo/core/spaces/PixelExtentInWorldSpace.h"

#include <ostream>

namespace ORVO {

bool operator==(PixelExtentInWorldSpace const& a, PixelExtentInWorldSpace const& b) noexcept {
    return a.pixelExtent() == b.pixelExtent();
}

bool operator!=(PixelExtentInWorldSpace const& a, PixelExtentInWorldSpace const& b) noexcept {
    return !(a == b);
}

std::ostream& operator<<(std::ostream& stream, PixelExtentInWorldSpace const& pixelExtent) {
    return stream << pixelExtent.pixelExtent();
}

} // namespace ORVO
