#include "orvo/core/math/Bool.h"

#include <ostream>

namespace ORVO {

std::ostream& operator<<(std::ostream& stream, bool2 const& value) {
    return stream << '(' << int(value.x) << ", " << int(value.y) << ')';
}

std::ostream& operator<<(std::ostream& stream, bool3 const& value) {
    return stream << '(' << int(value.x) << ", " << int(value.y) << ", " << int(value.z) << ')';
}

std::ostream& operator<<(std::ostream& stream, bool4 const& value) {
    return stream << '(' << int(value.x) << ", " << int(value.y) << ", " << int(value.z) << ", "
                  << int(value.w) << ')';
}

} // namespace ORVO
