#include "orvo/core/math/Int.h"

#include <ostream>

namespace ORVO {

std::ostream& operator<<(std::ostream& stream, int2 const& value) {
    return stream << '(' << value.x << ", " << value.y << ')';
}

std::ostream& operator<<(std::ostream& stream, int3 const& value) {
    return stream << '(' << value.x << ", " << value.y << ", " << value.z << ')';
}

std::ostream& operator<<(std::ostream& stream, int4 const& value) {
    return stream << '(' << value.x << ", " << value.y << ", " << value.z << ", " << value.w << ')';
}

} // namespace ORVO
