#pragma once

#include <cstddef>
#include <iosfwd>

#include "orvo/core/Export.h"

namespace ORVO {

/// Two sizes. A default-made one is 0.
///
/// Threads: a plain value.
struct size2 {
    std::size_t x = 0, y = 0;

    constexpr size2() = default;
    constexpr size2(std::size_t xValue, std::size_t yValue) : x(xValue), y(yValue) {}

    /// Component by index, 0 to 1; the index is not checked.
    std::size_t& operator[](std::size_t index) { return (&x)[index]; }
    std::size_t const& operator[](std::size_t index) const { return (&x)[index]; }

    /// Component by component, modulo the type's range.
    constexpr size2& operator+=(size2 const& other) {
        x += other.x;
        y += other.y;
        return *this;
    }
};

constexpr bool operator==(size2 const& a, size2 const& b) { return a.x == b.x && a.y == b.y; }
constexpr bool operator!=(size2 const& a, size2 const& b) { return !(a == b); }
/// Lexicographic order, x first.
constexpr bool operator<(size2 const& a, size2 const& b) { return a.x != b.x ? a.x < b.x : a.y < b.y; }
constexpr size2 operator+(size2 a, size2 const& b) { return a += b; }
/// Writes "(x, y)".
ORVO_API std::ostream& operator<<(std::ostream& stream, size2 const& value);

/// Three sizes. A default-made one is 0.
///
/// Threads: a plain value.
struct size3 {
    std::size_t x = 0, y = 0, z = 0;

    constexpr size3() = default;
    constexpr size3(std::size_t xValue, std::size_t yValue, std::size_t zValue)
        : x(xValue), y(yValue), z(zValue) {}

    /// Component by index, 0 to 2; the index is not checked.
    std::size_t& operator[](std::size_t index) { return (&x)[index]; }
    std::size_t const& operator[](std::size_t index) const { return (&x)[index]; }

    /// Component by component, modulo the type's range.
    constexpr size3& operator+=(size3 const& other) {
        x += other.x;
        y += other.y;
        z += other.z;
        return *this;
    }
};

constexpr bool operator==(size3 const& a, size3 const& b) { return a.x == b.x && a.y == b.y && a.z == b.z; }
constexpr bool operator!=(size3 const& a, size3 const& b) { return !(a == b); }
/// Lexicographic order, x first.
constexpr bool operator<(size3 const& a, size3 const& b) {
    return a.x != b.x ? a.x < b.x : (a.y != b.y ? a.y < b.y : a.z < b.z);
}
constexpr size3 operator+(size3 a, size3 const& b) { return a += b; }
/// Writes "(x, y, z)".
ORVO_API std::ostream& operator<<(std::ostream& stream, size3 const& value);

} // namespace ORVO
