#pragma once

#include "orvo/core/math/Half.h"

/// Plain structures of one pixel in host memory, in the memory order of the format that bears the same name.
/// 8-bit channels are 0..255 for 0.0 to 1.0. There are none for the formats of 16-bit integers.
///
/// Threads: plain values.
namespace ORVO {

struct PixelBGR8 {
    unsigned char b, g, r;
};

struct PixelBGRA8 {
    unsigned char b, g, r, a;
};

struct PixelRGB8 {
    unsigned char r, g, b;
};

struct PixelRGBA8 {
    unsigned char r, g, b, a;
};

struct PixelLuminance8 {
    unsigned char l;
};

struct PixelLuminanceAlpha8 {
    unsigned char l, a;
};

struct PixelRGB16F {
    half r, g, b;
};

struct PixelRGBA16F {
    half r, g, b, a;
};

struct PixelLuminance16F {
    half l;
};

struct PixelLuminanceAlpha16F {
    half l, a;
};

struct PixelRGB32F {
    float r, g, b;
};

struct PixelRGBA32F {
    float r, g, b, a;
};

struct PixelLuminance32F {
    float l;
};

struct PixelLuminanceAlpha32F {
    float l, a;
};

/// Arithmetic for resampling and blending: component-wise, alpha included.
inline PixelRGBA32F& operator+=(PixelRGBA32F& left, PixelRGBA32F const& right) {
    left.r += right.r;
    left.g += right.g;
    left.b += right.b;
    left.a += right.a;
    return left;
}

inline PixelRGBA32F operator+(PixelRGBA32F left, PixelRGBA32F const& right) { return left += right; }

inline PixelRGBA32F& operator*=(PixelRGBA32F& pixel, float factor) {
    pixel.r *= factor;
    pixel.g *= factor;
    pixel.b *= factor;
    pixel.a *= factor;
    return pixel;
}

inline PixelRGBA32F operator*(PixelRGBA32F pixel, float factor) { return pixel *= factor; }

inline PixelLuminanceAlpha32F& operator+=(PixelLuminanceAlpha32F& left, PixelLuminanceAlpha32F const& right) {
    left.l += right.l;
    left.a += right.a;
    return left;
}

inline PixelLuminanceAlpha32F operator+(PixelLuminanceAlpha32F left, PixelLuminanceAlpha32F const& right) {
    return left += right;
}

inline PixelLuminanceAlpha32F& operator*=(PixelLuminanceAlpha32F& pixel, float factor) {
    pixel.l *= factor;
    pixel.a *= factor;
    return pixel;
}

inline PixelLuminanceAlpha32F operator*(PixelLuminanceAlpha32F pixel, float factor) {
    return pixel *= factor;
}

} // namespace ORVO
