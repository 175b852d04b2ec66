#pragma once

#include <cstddef>
#include <cstdint>
#include <iosfwd>

#include "orvo/core/Export.h"

namespace ORVO {

/// Two 32-bit signed integers. A default-made one is 0.
///
/// Threads: a plain value.
struct int2 {
    std::int32_t x = 0, y = 0;

    constexpr int2() = default;
    /// The same value in every component.
    explicit constexpr int2(std::int32_t value) : x(value), y(value) {}
    constexpr int2(std::int32_t xValue, std::int32_t yValue) : x(xValue), y(yValue) {}

    /// Component by index, 0 to 1; the index is not checked.
    std::int32_t& operator[](std::size_t index) { return (&x)[index]; }
    std::int32_t const& operator[](std::size_t index) const { return (&x)[index]; }
};

constexpr bool operator==(int2 const& a, int2 const& b) { return a.x == b.x && a.y == b.y; }
constexpr bool operator!=(int2 const& a, int2 const& b) { return !(a == b); }
/// Writes "(x, y)".
ORVO_API std::ostream& operator<<(std::ostream& stream, int2 const& value);

/// Three 32-bit signed integers. A default-made one is 0.
///
/// Threads: a plain value.
struct int3 {
    std::int32_t x = 0, y = 0, z = 0;

    constexpr int3() = default;
    /// The same value in every component.
    explicit constexpr int3(std::int32_t value) : x(value), y(value), z(value) {}
    constexpr int3(std::int32_t xValue, std::int32_t yValue, std::int32_t zValue)
        : x(xValue), y(yValue), z(zValue) {}

    /// Component by index, 0 to 2; the index is not checked.
    std::int32_t& operator[](std::size_t index) { return (&x)[index]; }
    std::int32_t const& operator[](std::size_t index) const { return (&x)[index]; }
};

constexpr bool operator==(int3 const& a, int3 const& b) { return a.x == b.x && a.y == b.y && a.z == b.z; }
constexpr bool operator!=(int3 const& a, int3 const& b) { return !(a == b); }
/// Writes "(x, y, z)".
ORVO_API std::ostream& operator<<(std::ostream& stream, int3 const& value);

/// Four 32-bit signed integers. A default-made one is 0.
///
/// Threads: a plain value.
struct int4 {
    std::int32_t x = 0, y = 0, z = 0, w = 0;

    constexpr int4() = default;
    /// The same value in every component.
    explicit constexpr int4(std::int32_t value) : x(value), y(value), z(value), w(value) {}
    constexpr int4(std::int32_t xValue, std::int32_t yValue, std::int32_t zValue, std::int32_t wValue)
        : x(xValue), y(yValue), z(zValue), w(wValue) {}

    /// Component by index, 0 to 3; the index is not checked.
    std::int32_t& operator[](std::size_t index) { return (&x)[index]; }
    std::int32_t const& operator[](std::size_t index) const { return (&x)[index]; }
};

constexpr bool operator==(int4 const& a, int4 const& b) {
    return a.x == b.x && a.y == b.y && a.z == b.z && a.w == b.w;
}
constexpr bool operator!=(int4 const& a, int4 const& b) { return !(a == b); }
/// Writes "(x, y, z, w)".
ORVO_API std::ostream& operator<<(std::ostream& stream, int4 const& value);

} // namespace ORVO
