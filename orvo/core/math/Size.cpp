#include "orvo/core/math/Size.h"

#include <ostream>

namespace ORVO {

std::ostream& operator<<(std::ostream& stream, size2 const& value) {
    return stream << '(' << value.x << ", " << value.y << ')';
}

std::ostream& operator<<(std::ostream& stream, size3 const& value) {
    return stream << '(' << value.x << ", " << value.y << ", " << value.z << ')';
}

} // namespace ORVO
