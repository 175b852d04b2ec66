#pragma once

#include <array>
#include <cstddef>
#include <iosfwd>

#include "orvo/core/Export.h"

namespace ORVO {

/// A 2 by 2 matrix of 32-bit floats, row after row. A default-made one is the identity.
///
/// Threads: a plain value.
struct float2x2 {
    std::array<float, 4> a = {1.0f, 0.0f, 0.0f, 1.0f};

    /// Element by row and column, each 0 to 1; the indices are not checked.
    float& operator()(std::size_t row, std::size_t column) { return a[row * 2 + column]; }
    float const& operator()(std::size_t row, std::size_t column) const { return a[row * 2 + column]; }

    /// The first element; the others follow it in memory.
    float* begin() { return a.data(); }
    float const* begin() const { return a.data(); }
    float* end() { return a.data() + 4; }
    float const* end() const { return a.data() + 4; }
};

inline bool operator==(float2x2 const& a, float2x2 const& b) { return a.a == b.a; }
inline bool operator!=(float2x2 const& a, float2x2 const& b) { return !(a == b); }
/// Writes the rows: "((...), (...))".
ORVO_API std::ostream& operator<<(std::ostream& stream, float2x2 const& value);

/// A 3 by 3 matrix of 32-bit floats, row after row. A default-made one is the identity.
///
/// Threads: a plain value.
struct float3x3 {
    std::array<float, 9> a = {1.0f, 0.0f, 0.0f, 0.0f, 1.0f, 0.0f, 0.0f, 0.0f, 1.0f};

    /// Element by row and column, each 0 to 2; the indices are not checked.
    float& operator()(std::size_t row, std::size_t column) { return a[row * 3 + column]; }
    float const& operator()(std::size_t row, std::size_t column) const { return a[row * 3 + column]; }

    /// The first element; the others follow it in memory.
    float* begin() { return a.data(); }
    float const* begin() const { return a.data(); }
    float* end() { return a.data() + 9; }
    float const* end() const { return a.data() + 9; }
};

inline bool operator==(float3x3 const& a, float3x3 const& b) { return a.a == b.a; }
inline bool operator!=(float3x3 const& a, float3x3 const& b) { return !(a == b); }
/// Writes the rows: "((...), (...), ...)".
ORVO_API std::ostream& operator<<(std::ostream& stream, float3x3 const& value);

/// A 4 by 4 matrix of 32-bit floats, row after row. A default-made one is the identity.
///
/// Threads: a plain value.
struct float4x4 {
    std::array<float, 16> a = {1.0f, 0.0f, 0.0f, 0.0f, 0.0f, 1.0f, 0.0f, 0.0f,
                               0.0f, 0.0f, 1.0f, 0.0f, 0.0f, 0.0f, 0.0f, 1.0f};

    /// Element by row and column, each 0 to 3; the indices are not checked.
    float& operator()(std::size_t row, std::size_t column) { return a[row * 4 + column]; }
    float const& operator()(std::size_t row, std::size_t column) const { return a[row * 4 + column]; }

    /// The first element; the others follow it in memory.
    float* begin() { return a.data(); }
    float const* begin() const { return a.data(); }
    float* end() { return a.data() + 16; }
    float const* end() const { return a.data() + 16; }
};

inline bool operator==(float4x4 const& a, float4x4 const& b) { return a.a == b.a; }
inline bool operator!=(float4x4 const& a, float4x4 const& b) { return !(a == b); }
/// Writes the rows: "((...), (...), ...)".
ORVO_API std::ostream& operator<<(std::ostream& stream, float4x4 const& value);

} // namespace ORVO
