#include "orvo/core/math/Matrix.h"

#include <ostream>

namespace ORVO {

namespace {

std::ostream& writeRows(std::ostream& stream, float const* pElements, std::size_t nRows) {
    stream << '(';
    for (std::size_t row = 0; row < nRows; ++row) {
        stream << (row == 0 ? "(" : ", (");
        for (std::size_t column = 0; column < nRows; ++column)
            stream << (column == 0 ? "" : ", ") << pElements[row * nRows + column];
        stream << ')';
    }
    return stream << ')';
}

} // namespace

std::ostream& operator<<(std::ostream& stream, float2x2 const& value) {
    return writeRows(stream, value.begin(), 2);
}

std::ostream& operator<<(std::ostream& stream, float3x3 const& value) {
    return writeRows(stream, value.begin(), 3);
}

std::ostream& operator<<(std::ostream& stream, float4x4 const& value) {
    return writeRows(stream, value.begin(), 4);
}

} // namespace ORVO
