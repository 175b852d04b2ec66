#include "orvo/core/spaces/ExtentInPixelSpace.h"

#include <ostream>

namespace ORVO {

bool operator==(ExtentInPixelSpace const& a, ExtentInPixelSpace const& b) noexcept {
    return a.isDefined() == b.isDefined() && a.extentAsInt2() == b.extentAsInt2();
}

bool operator!=(ExtentInPixelSpace const& a, ExtentInPixelSpace const& b) noexcept { return !(a == b); }

std::ostream& operator<<(std::ostream& stream, ExtentInPixelSpace const& extent) {
    return extent.isDefined() ? stream << extent.extentAsInt2() : stream << "undefined";
}

} // namespace ORVO
