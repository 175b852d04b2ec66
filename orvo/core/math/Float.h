#pragma once

#include <cstddef>
#include <iosfwd>

#include "orvo/core/Export.h"

namespace ORVO {

/// Two 32-bit floats. A default-made one is zero.
///
/// Threads: a plain value.
struct float2 {
    float x = 0.0f, y = 0.0f;

    constexpr float2() = default;
    /// The same value in every component.
    explicit constexpr float2(float value) : x(value), y(value) {}
    constexpr float2(float xValue, float yValue) : x(xValue), y(yValue) {}

    /// Component by index, 0 to 1; the index is not checked.
    float& operator[](std::size_t index) { return begin()[index]; }
    float const& operator[](std::size_t index) const { return begin()[index]; }

    /// The first component; the others follow it in memory.
    float* begin() { return &x; }
    float const* begin() const { return &x; }
    float* end() { return &x + 2; }
    float const* end() const { return &x + 2; }

    constexpr float2& operator+=(float2 const& other) {
        x += other.x;
        y += other.y;
        return *this;
    }
    constexpr float2& operator-=(float2 const& other) {
        x -= other.x;
        y -= other.y;
        return *this;
    }
    constexpr float2& operator*=(float2 const& other) {
        x *= other.x;
        y *= other.y;
        return *this;
    }
    constexpr float2& operator/=(float2 const& other) {
        x /= other.x;
        y /= other.y;
        return *this;
    }
    constexpr float2& operator*=(float value) { return *this *= float2(value); }
    constexpr float2& operator/=(float value) { return *this /= float2(value); }
};

/// Component by component.
constexpr float2 operator+(float2 a, float2 const& b) { return a += b; }
/// Component by component.
constexpr float2 operator-(float2 a, float2 const& b) { return a -= b; }
/// Component by component.
constexpr float2 operator*(float2 a, float2 const& b) { return a *= b; }
/// Component by component.
constexpr float2 operator/(float2 a, float2 const& b) { return a /= b; }
constexpr float2 operator*(float2 a, float b) { return a *= b; }
constexpr float2 operator*(float a, float2 b) { return b *= a; }
constexpr float2 operator/(float2 a, float b) { return a /= b; }
/// The sum of the products, added from the first component on.
constexpr float dot(float2 const& a, float2 const& b) { return a.x * b.x + a.y * b.y; }
constexpr bool operator==(float2 const& a, float2 const& b) { return a.x == b.x && a.y == b.y; }
constexpr bool operator!=(float2 const& a, float2 const& b) { return !(a == b); }
/// Writes "(x, y)".
ORVO_API std::ostream& operator<<(std::ostream& stream, float2 const& value);

/// Three 32-bit floats. A default-made one is zero.
///
/// Threads: a plain value.
struct float3 {
    float x = 0.0f, y = 0.0f, z = 0.0f;

    constexpr float3() = default;
    /// The same value in every component.
    explicit constexpr float3(float value) : x(value), y(value), z(value) {}
    constexpr float3(float xValue, float yValue, float zValue) : x(xValue), y(yValue), z(zValue) {}

    /// Component by index, 0 to 2; the index is not checked.
    float& operator[](std::size_t index) { return begin()[index]; }
    float const& operator[](std::size_t index) const { return begin()[index]; }

    /// The first component; the others follow it in memory.
    float* begin() { return &x; }
    float const* begin() const { return &x; }
    float* end() { return &x + 3; }
    float const* end() const { return &x + 3; }

    constexpr float3& operator+=(float3 const& other) {
        x += other.x;
        y += other.y;
        z += other.z;
        return *this;
    }
    constexpr float3& operator-=(float3 const& other) {
        x -= other.x;
        y -= other.y;
        z -= other.z;
        return *this;
    }
    constexpr float3& operator*=(float3 const& other) {
        x *= other.x;
        y *= other.y;
        z *= other.z;
        return *this;
    }
    constexpr float3& operator/=(float3 const& other) {
        x /= other.x;
        y /= other.y;
        z /= other.z;
        return *this;
    }
    constexpr float3& operator*=(float value) { return *this *= float3(value); }
    constexpr float3& operator/=(float value) { return *this /= float3(value); }
};

/// Component by component.
constexpr float3 operator+(float3 a, float3 const& b) { return a += b; }
/// Component by component.
constexpr float3 operator-(float3 a, float3 const& b) { return a -= b; }
/// Component by component.
constexpr float3 operator*(float3 a, float3 const& b) { return a *= b; }
/// Component by component.
constexpr float3 operator/(float3 a, float3 const& b) { return a /= b; }
constexpr float3 operator*(float3 a, float b) { return a *= b; }
constexpr float3 operator*(float a, float3 b) { return b *= a; }
constexpr float3 operator/(float3 a, float b) { return a /= b; }
/// The sum of the products, added from the first component on.
constexpr float dot(float3 const& a, float3 const& b) { return a.x * b.x + a.y * b.y + a.z * b.z; }
constexpr bool operator==(float3 const& a, float3 const& b) { return a.x == b.x && a.y == b.y && a.z == b.z; }
constexpr bool operator!=(float3 const& a, float3 const& b) { return !(a == b); }
/// Writes "(x, y, z)".
ORVO_API std::ostream& operator<<(std::ostream& stream, float3 const& value);

/// Four 32-bit floats. A default-made one is zero.
///
/// Threads: a plain value.
struct float4 {
    float x = 0.0f, y = 0.0f, z = 0.0f, w = 0.0f;

    constexpr float4() = default;
    /// The same value in every component.
    explicit constexpr float4(float value) : x(value), y(value), z(value), w(value) {}
    constexpr float4(float xValue, float yValue, float zValue, float wValue)
        : x(xValue), y(yValue), z(zValue), w(wValue) {}

    /// Component by index, 0 to 3; the index is not checked.
    float& operator[](std::size_t index) { return begin()[index]; }
    float const& operator[](std::size_t index) const { return begin()[index]; }

    /// The first component; the others follow it in memory.
    float* begin() { return &x; }
    float const* begin() const { return &x; }
    float* end() { return &x + 4; }
    float const* end() const { return &x + 4; }

    constexpr float4& operator+=(float4 const& other) {
        x += other.x;
        y += other.y;
        z += other.z;
        w += other.w;
        return *this;
    }
    constexpr float4& operator-=(float4 const& other) {
        x -= other.x;
        y -= other.y;
        z -= other.z;
        w -= other.w;
        return *this;
    }
    constexpr float4& operator*=(float4 const& other) {
        x *= other.x;
        y *= other.y;
        z *= other.z;
        w *= other.w;
        return *this;
    }
    constexpr float4& operator/=(float4 const& other) {
        x /= other.x;
        y /= other.y;
        z /= other.z;
        w /= other.w;
        return *this;
    }
    constexpr float4& operator*=(float value) { return *this *= float4(value); }
    constexpr float4& operator/=(float value) { return *this /= float4(value); }
};

/// Component by component.
constexpr float4 operator+(float4 a, float4 const& b) { return a += b; }
/// Component by component.
constexpr float4 operator-(float4 a, float4 const& b) { return a -= b; }
/// Component by component.
constexpr float4 operator*(float4 a, float4 const& b) { return a *= b; }
/// Component by component.
constexpr float4 operator/(float4 a, float4 const& b) { return a /= b; }
constexpr float4 operator*(float4 a, float b) { return a *= b; }
constexpr float4 operator*(float a, float4 b) { return b *= a; }
constexpr float4 operator/(float4 a, float b) { return a /= b; }
/// The sum of the products, added from the first component on.
constexpr float dot(float4 const& a, float4 const& b) {
    return a.x * b.x + a.y * b.y + a.z * b.z + a.w * b.w;
}
constexpr bool operator==(float4 const& a, float4 const& b) {
    return a.x == b.x && a.y == b.y && a.z == b.z && a.w == b.w;
}
constexpr bool operator!=(float4 const& a, float4 const& b) { return !(a == b); }
/// Writes "(x, y, z, w)".
ORVO_API std::ostream& operator<<(std::ostream& stream, float4 const& value);

} // namespace ORVO
