#include "orvo/core/math/Float.h"

#include <ostream>

namespace ORVO {

std::ostream& operator<<(std::ostream& stream, float2 const& value) {
    return stream << '(' << value.x << ", " << value.y << ')';
}

std::ostream& operator<<(std::ostream& stream, float3 const& value) {
    return stream << '(' << value.x << ", " << value.y << ", " << value.z << ')';
}

std::ostream& operator<<(std::ostream& stream, float4 const& value) {
    return stream << '(' << value.x << ", " << value.y << ", " << value.z << ", " << value.w << ')';
}

} // namespace ORVO
