#pragma once

// To be included by one translation unit an instruction set, after LabVector.h: everything has internal
// linkage.
#include "orvo/image_flow/filters/bilateral/GridKernels.h"

namespace ORVO::ImageFlow::bilateral {
namespace {

constexpr std::size_t kLanes = Vector::kLanes;

/// The lowest and highest of a stretch of pixels, lane by lane.
struct VectorBounds {
    Vector::Floats lowest;
    Vector::Floats highest;

    explicit VectorBounds(ValueBounds const& bounds)
        : lowest(Vector::set(bounds.fLowest)), highest(Vector::set(bounds.fHighest)) {}

    // Of two operands one of which is NaN, min and max give the second.
    void include(Vector::Floats v) {
        lowest = Vector::min(v, lowest);
        highest = Vector::max(v, highest);
    }

    ValueBounds reduced() const { return {Vector::lowest(lowest), Vector::highest(highest)}; }
};

/// Whether alpha is 1 in a stretch of pixels.
struct Opacity {
    Vector::Floats others = Vector::zero();

    void include(Vector::Floats alpha) {
        Vector::Floats const one = Vector::set(1.0F);
        others = Vector::select(Vector::unequal(alpha, one), one, others);
    }
    bool isOpaque() const { return Vector::highest(others) == 0.0F; }
};

/// The last pixels of a row, followed by copies of the last one, which change no bounds.
void copyLastPixels(float (&block)[4 * kLanes], float const* pRGBA, std::size_t n) {
    for (std::size_t i = 0; i < kLanes; ++i) {
        std::size_t const pixel = i < n ? i : n - 1;
        for (std::size_t c = 0; c < 4; ++c) {
            block[4 * i + c] = pRGBA[4 * pixel + c];
        }
    }
}

struct PremultipliedPixels {
    Vector::Floats r;
    Vector::Floats g;
    Vector::Floats b;
    Vector::Floats alpha;

    explicit PremultipliedPixels(float const* pRGBA) {
        Vector::loadPixels(pRGBA, r, g, b, alpha);
        r = Vector::mul(r, alpha);
        g = Vector::mul(g, alpha);
        b = Vector::mul(b, alpha);
    }
};

// Rounded after each operation, as the plain version does, so that both find the same bounds and cells. Alpha
// counts with the weight 0: where it is not finite, the luminance is NaN.
Vector::Floats luminanceOf(PremultipliedPixels const& pixels) {
    Vector::Floats sum = Vector::mul(pixels.r, Vector::set(0.39F));
    sum = Vector::add(sum, Vector::mul(pixels.g, Vector::set(0.5F)));
    sum = Vector::add(sum, Vector::mul(pixels.b, Vector::set(0.11F)));
    return Vector::add(sum, Vector::mul(pixels.alpha, Vector::zero()));
}

bool luminanceFromRGBA(float const* pRGBA, float* pLuminance, float* pAlpha, std::size_t n,
                       ValueBounds* pBounds) {
    VectorBounds bounds(*pBounds);
    Opacity opacity;
    std::size_t x = 0;
    for (; x + kLanes <= n; x += kLanes) {
        PremultipliedPixels const pixels(pRGBA + 4 * x);
        Vector::Floats const luminance = luminanceOf(pixels);
        bounds.include(luminance);
        opacity.include(pixels.alpha);
        Vector::store(pLuminance + x, luminance);
        Vector::store(pAlpha + x, pixels.alpha);
    }
    if (x < n) {
        float block[4 * kLanes];
        copyLastPixels(block, pRGBA + 4 * x, n - x);
        PremultipliedPixels const pixels(block);
        Vector::Floats const luminance = luminanceOf(pixels);
        bounds.include(luminance);
        opacity.include(pixels.alpha);
        Vector::storeFirst(pLuminance + x, luminance, static_cast<int>(n - x));
        Vector::storeFirst(pAlpha + x, pixels.alpha, static_cast<int>(n - x));
    }
    *pBounds = bounds.reduced();
    return opacity.isOpaque();
}

bool labFromRGBA(float const* pRGBA, float* const* apPlanes, std::size_t n, ValueBounds* pBounds) {
    VectorBounds bounds(*pBounds);
    Opacity opacity;
    std::size_t x = 0;
    for (; x + kLanes <= n; x += kLanes) {
        PremultipliedPixels pixels(pRGBA + 4 * x);
        LabVector::toLab(pixels.r, pixels.g, pixels.b);
        bounds.include(pixels.r);
        opacity.include(pixels.alpha);
        Vector::store(apPlanes[0] + x, pixels.r);
        Vector::store(apPlanes[1] + x, pixels.g);
        Vector::store(apPlanes[2] + x, pixels.b);
        Vector::store(apPlanes[3] + x, pixels.alpha);
    }
    if (x < n) {
        float block[4 * kLanes];
        copyLastPixels(block, pRGBA + 4 * x, n - x);
        PremultipliedPixels pixels(block);
        LabVector::toLab(pixels.r, pixels.g, pixels.b);
        bounds.include(pixels.r);
        opacity.include(pixels.alpha);
        int const rest = static_cast<int>(n - x);
        Vector::storeFirst(apPlanes[0] + x, pixels.r, rest);
        Vector::storeFirst(apPlanes[1] + x, pixels.g, rest);
        Vector::storeFirst(apPlanes[2] + x, pixels.b, rest);
        Vector::storeFirst(apPlanes[3] + x, pixels.alpha, rest);
    }
    *pBounds = bounds.reduced();
    return opacity.isOpaque();
}

// NaN is taken from the second operand.
Vector::Floats clampToUnit(Vector::Floats v) {
    return Vector::min(Vector::set(1.0F), Vector::max(Vector::zero(), v));
}

/// What is divided by alpha, where that is not 0.
Vector::Floats unpremultiply(Vector::Floats v, Vector::Floats alpha) {
    return Vector::select(Vector::unequal(alpha, Vector::zero()), Vector::div(v, alpha), v);
}

/// Stores pixels made by a function of the column, which gives four channels.
template <class Pixels>
void storeRow(float* pRGBA, std::size_t n, StoreStyle style, Pixels const& pixelsAt) {
    Vector::Floats c[4];
    auto const makePixels = [&](std::size_t x, std::size_t count) {
        pixelsAt(x, static_cast<int>(count), c);
        if (style.bClamp) {
            for (Vector::Floats& channel : c) {
                channel = clampToUnit(channel);
            }
        }
    };
    std::size_t x = 0;
    if (style.bStream && reinterpret_cast<std::uintptr_t>(pRGBA) % 64 == 0) {
        for (; x + kLanes <= n; x += kLanes) {
            makePixels(x, kLanes);
            Vector::streamPixels(pRGBA + 4 * x, c[0], c[1], c[2], c[3]);
        }
        Vector::finishStreaming();
    }
    for (; x + kLanes <= n; x += kLanes) {
        makePixels(x, kLanes);
        Vector::storePixels(pRGBA + 4 * x, c[0], c[1], c[2], c[3]);
    }
    if (x < n) {
        float block[4 * kLanes];
        makePixels(x, n - x);
        Vector::storePixels(block, c[0], c[1], c[2], c[3]);
        for (std::size_t i = 0; i < 4 * (n - x); ++i) {
            pRGBA[4 * x + i] = block[i];
        }
    }
}

Vector::Floats loadPixelsOf(float const* p, int n) {
    return n == static_cast<int>(kLanes) ? Vector::load(p) : Vector::loadFirst(p, n);
}

void greyFromLuminance(float const* pLuminance, float const* pAlpha, float* pRGBA, std::size_t n,
                       StoreStyle style) {
    storeRow(pRGBA, n, style, [&](std::size_t x, int count, Vector::Floats(&c)[4]) {
        c[3] = loadPixelsOf(pAlpha + x, count);
        c[0] = unpremultiply(loadPixelsOf(pLuminance + x, count), c[3]);
        c[1] = c[0];
        c[2] = c[0];
    });
}

void rgbaFromLab(float const* const* apPlanes, float* pRGBA, std::size_t n, StoreStyle style) {
    storeRow(pRGBA, n, style, [&](std::size_t x, int count, Vector::Floats(&c)[4]) {
        for (int channel = 0; channel < 4; ++channel) {
            c[channel] = loadPixelsOf(apPlanes[channel] + x, count);
        }
        LabVector::toRGB(c[0], c[1], c[2]);
        for (int channel = 0; channel < 3; ++channel) {
            c[channel] = unpremultiply(c[channel], c[3]);
        }
    });
}

} // namespace
} // namespace ORVO::ImageFlow::bilateral
