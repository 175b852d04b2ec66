#pragma once

#include <iosfwd>

#include "orvo/core/Export.h"

namespace ORVO {

/// Two truth values. A default-made one is false.
///
/// Threads: a plain value.
struct bool2 {
    bool x = false, y = false;

    constexpr bool2() = default;
    /// The same value in every component.
    explicit constexpr bool2(bool value) : x(value), y(value) {}
    constexpr bool2(bool xValue, bool yValue) : x(xValue), y(yValue) {}
};

constexpr bool operator==(bool2 const& a, bool2 const& b) { return a.x == b.x && a.y == b.y; }
constexpr bool operator!=(bool2 const& a, bool2 const& b) { return !(a == b); }
/// Writes "(x, y)", 1 for true and 0 for false.
ORVO_API std::ostream& operator<<(std::ostream& stream, bool2 const& value);

/// Three truth values. A default-made one is false.
///
/// Threads: a plain value.
struct bool3 {
    bool x = false, y = false, z = false;

    constexpr bool3() = default;
    /// The same value in every component.
    explicit constexpr bool3(bool value) : x(value), y(value), z(value) {}
    constexpr bool3(bool xValue, bool yValue, bool zValue) : x(xValue), y(yValue), z(zValue) {}
};

constexpr bool operator==(bool3 const& a, bool3 const& b) { return a.x == b.x && a.y == b.y && a.z == b.z; }
constexpr bool operator!=(bool3 const& a, bool3 const& b) { return !(a == b); }
/// Writes "(x, y, z)", 1 for true and 0 for false.
ORVO_API std::ostream& operator<<(std::ostream& stream, bool3 const& value);

/// Four truth values. A default-made one is false.
///
/// Threads: a plain value.
struct bool4 {
    bool x = false, y = false, z = false, w = false;

    constexpr bool4() = default;
    /// The same value in every component.
    explicit constexpr bool4(bool value) : x(value), y(value), z(value), w(value) {}
    constexpr bool4(bool xValue, bool yValue, bool zValue, bool wValue)
        : x(xValue), y(yValue), z(zValue), w(wValue) {}
};

constexpr bool operator==(bool4 const& a, bool4 const& b) {
    return a.x == b.x && a.y == b.y && a.z == b.z && a.w == b.w;
}
constexpr bool operator!=(bool4 const& a, bool4 const& b) { return !(a == b); }
/// Writes "(x, y, z, w)", 1 for true and 0 for false.
ORVO_API std::ostream& operator<<(std::ostream& stream, bool4 const& value);

} // namespace ORVO
