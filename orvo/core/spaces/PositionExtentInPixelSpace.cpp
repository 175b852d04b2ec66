#include "orvo/core/spaces/PositionExtentInPixelSpace.h"

#include <ostream>

#include "orvo/core/utility/SaturatingCast.h"

namespace ORVO {

PositionExtentInPixelSpace operator-(PositionExtentInPixelSpace const& rectangle,
                                     PositionInPixelSpace const& position) noexcept {
    auto const difference = [](int a, int b) {
        return saturatingCast<int>(static_cast<long long>(a) - static_cast<long long>(b));
    };
    return PositionExtentInPixelSpace(
        PositionInPixelSpace(difference(rectangle.position().x(), position.x()),
                             difference(rectangle.position().y(), position.y())),
        rectangle.extent());
}

bool operator==(PositionExtentInPixelSpace const& a, PositionExtentInPixelSpace const& b) noexcept {
    return a.position() == b.position() && a.extent() == b.extent();
}

bool operator!=(PositionExtentInPixelSpace const& a, PositionExtentInPixelSpace const& b) noexcept {
    return !(a == b);
}

std::ostream& operator<<(std::ostream& stream, PositionExtentInPixelSpace const& rectangle) {
    return stream << rectangle.position() << ' ' << rectangle.extent();
}

} // namespace ORVO
