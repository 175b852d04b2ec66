#pragma once

#include <cstddef>
#include <cstdint>
#include <ostream>
#include <vector>

namespace ORVO::DataFlow::internal {

/// Writes a value as its type does.
template <typename T>
void writeParameterValue(std::ostream& oStream, T const& value) {
    oStream << value;
}

/// Writes a pointer as its number, in decimal.
inline void writeParameterValue(std::ostream& oStream, void* const& pValue) {
    oStream << reinterpret_cast<std::uintptr_t>(pValue);
}

/// Writes a sequence as "[a, b, c]".
template <typename T>
void writeParameterValue(std::ostream& oStream, std::vector<T> const& aValues) {
    oStream << "[";
    for (std::size_t i = 0; i < aValues.size(); ++i) {
        oStream << (i == 0 ? "" : ", ") << aValues[i];
    }
    oStream << "]";
}

} // namespace ORVO::DataFlow::internal
