#pragma once

#include "orvo/colour_engine/internal/ApplyKernels.h"

// Included by one translation unit an instruction set, for whose instructions the compiler turns these loops
// into vectors. Everything has internal linkage and nothing of the standard library is called, so that no
// function built for a larger set is ever shared with code for a smaller one.
namespace {

namespace colour = ORVO::ColourEngine::Internal;

/// The light as offset from the bits of the scale's smallest. The bits of floats are in the order of the
/// floats, negative ones below all others.
template <typename Scale>
inline std::int32_t lightBits(float light) {
    constexpr std::int32_t nWhite = 127 << 23;
    std::int32_t const bits = __builtin_bit_cast(std::int32_t, light);
    std::int32_t const raised = bits > Scale::nBias_ ? bits : Scale::nBias_;
    return (raised < nWhite ? raised : nWhite) - Scale::nBias_;
}

template <typename Scale>
inline void mixToLightBits(std::int32_t* __restrict pBits, float const* const* pLight, float const* pFactors,
                           std::size_t n) {
    float const* __restrict pRed = pLight[0];
    float const* __restrict pGreen = pLight[1];
    float const* __restrict pBlue = pLight[2];
    float const fRed = pFactors[0];
    float const fGreen = pFactors[1];
    float const fBlue = pFactors[2];
    for (std::size_t i = 0; i < n; ++i) {
        pBits[i] = lightBits<Scale>(fRed * pRed[i] + fGreen * pGreen[i] + fBlue * pBlue[i]);
    }
}

// The second loops are no part of the first: a compiler that sees the clamp and the shift together branches
// on the clamp.

void mixBlockToBytes(std::int32_t* pStep, float const* const* pLight, float const* pFactors, std::size_t n) {
    using Scale = colour::ByteScale;
    mixToLightBits<Scale>(pStep, pLight, pFactors, n);
    for (std::size_t i = 0; i < n; ++i) {
        pStep[i] >>= Scale::nDroppedBits_;
    }
}

void splitSteps(std::int32_t* __restrict pStep, float* __restrict pFraction, std::size_t n) {
    using Scale = colour::WordScale;
    constexpr std::int32_t nMask = (1 << Scale::nDroppedBits_) - 1;
    constexpr float fUnit = 1.0F / static_cast<float>(1 << Scale::nDroppedBits_);
    for (std::size_t i = 0; i < n; ++i) {
        std::int32_t const bits = pStep[i];
        pStep[i] = bits >> Scale::nDroppedBits_;
        pFraction[i] = static_cast<float>(bits & nMask) * fUnit;
    }
}

void mixBlockToWords(std::int32_t* pStep, float* pFraction, float const* const* pLight, float const* pFactors,
                     std::size_t n) {
    mixToLightBits<colour::WordScale>(pStep, pLight, pFactors, n);
    splitSteps(pStep, pFraction, n);
}

void stepBlockToBytes(std::int32_t* __restrict pStep, float const* __restrict pLight, std::size_t n) {
    using Scale = colour::ByteScale;
    for (std::size_t i = 0; i < n; ++i) {
        pStep[i] = lightBits<Scale>(pLight[i]);
    }
    for (std::size_t i = 0; i < n; ++i) {
        pStep[i] >>= Scale::nDroppedBits_;
    }
}

void stepBlockToWords(std::int32_t* __restrict pStep, float* __restrict pFraction,
                      float const* __restrict pLight, std::size_t n) {
    using Scale = colour::WordScale;
    for (std::size_t i = 0; i < n; ++i) {
        pStep[i] = lightBits<Scale>(pLight[i]);
    }
    splitSteps(pStep, pFraction, n);
}

void mixBlock(float* const* pPlanes, float const* pFactors, std::size_t n) {
    float* __restrict pFirst = pPlanes[0];
    float* __restrict pSecond = pPlanes[1];
    float* __restrict pThird = pPlanes[2];
    float aFactors[12];
    for (std::size_t i = 0; i < 12; ++i) {
        aFactors[i] = pFactors[i];
    }
    for (std::size_t i = 0; i < n; ++i) {
        float const x = pFirst[i];
        float const y = pSecond[i];
        float const z = pThird[i];
        pFirst[i] = aFactors[0] * x + aFactors[1] * y + aFactors[2] * z + aFactors[3];
        pSecond[i] = aFactors[4] * x + aFactors[5] * y + aFactors[6] * z + aFactors[7];
        pThird[i] = aFactors[8] * x + aFactors[9] * y + aFactors[10] * z + aFactors[11];
    }
}

inline float largerOf(float a, float b) { return a > b ? a : b; }

inline float smallerOf(float a, float b) { return a < b ? a : b; }

/// By bits: a compiler must not work out a float that it might not need, so it would branch on a condition
/// between two of them.
inline float chosen(bool bFirst, float first, float second) {
    std::int32_t const nMask = bFirst ? -1 : 0;
    return __builtin_bit_cast(float, (nMask & __builtin_bit_cast(std::int32_t, first)) |
                                         (~nMask & __builtin_bit_cast(std::int32_t, second)));
}

constexpr float fLabLimit = 24.0F / 116.0F;

inline float linearOf(float lightness) {
    float const cube = lightness * lightness * lightness;
    float const line = (lightness - 16.0F / 116.0F) * (108.0F / 841.0F);
    return chosen(lightness > fLabLimit, cube, line);
}

/// For light from the limit up: a guess from the exponent, which is right to a twentieth, and two steps of
/// Halley's method, which each cube the error.
inline float cubeRoot(float light) {
    auto const bits = static_cast<float>(__builtin_bit_cast(std::int32_t, light));
    float root = __builtin_bit_cast(float, static_cast<std::int32_t>(bits * (1.0F / 3.0F)) + 709921077);
    for (int i = 0; i < 2; ++i) {
        float const cube = root * root * root;
        root = root * ((cube + 2.0F * light) / (2.0F * cube + light));
    }
    return root;
}

inline float lightnessOf(float light) {
    constexpr float fLimit = fLabLimit * fLabLimit * fLabLimit;
    // Bits of positive floats are in their order. Light beyond any white, which no table of Lab can hold, is
    // kept from overflowing.
    constexpr std::int32_t nLow = __builtin_bit_cast(std::int32_t, fLimit);
    constexpr std::int32_t nHigh = __builtin_bit_cast(std::int32_t, 1e6F);
    std::int32_t const bits = __builtin_bit_cast(std::int32_t, light);
    std::int32_t const raised = bits > nLow ? bits : nLow;
    float const root = cubeRoot(__builtin_bit_cast(float, raised < nHigh ? raised : nHigh));
    float const line = light * (841.0F / 108.0F) + 16.0F / 116.0F;
    return chosen(light > fLimit, root, line);
}

constexpr float fWhiteX = 0.9642F;
constexpr float fWhiteZ = 0.8249F;

void fromLabBlock(float* const* pPlanes, std::size_t n) {
    float* __restrict pFirst = pPlanes[0];
    float* __restrict pSecond = pPlanes[1];
    float* __restrict pThird = pPlanes[2];
    for (std::size_t i = 0; i < n; ++i) {
        float const y = pFirst[i] * (100.0F / 116.0F) + 16.0F / 116.0F;
        float const x = y + (pSecond[i] * (255.0F / 500.0F) - 128.0F / 500.0F);
        float const z = y - (pThird[i] * (255.0F / 200.0F) - 128.0F / 200.0F);
        pFirst[i] = fWhiteX * linearOf(x);
        pSecond[i] = linearOf(y);
        pThird[i] = fWhiteZ * linearOf(z);
    }
}

void toLabBlock(float* const* pPlanes, std::size_t n) {
    float* __restrict pFirst = pPlanes[0];
    float* __restrict pSecond = pPlanes[1];
    float* __restrict pThird = pPlanes[2];
    for (std::size_t i = 0; i < n; ++i) {
        float const x = lightnessOf(pFirst[i] * (1.0F / fWhiteX));
        float const y = lightnessOf(pSecond[i]);
        float const z = lightnessOf(pThird[i] * (1.0F / fWhiteZ));
        pFirst[i] = y * 1.16F - 0.16F;
        pSecond[i] = (x - y) * (500.0F / 255.0F) + 128.0F / 255.0F;
        pThird[i] = (y - z) * (200.0F / 255.0F) + 128.0F / 255.0F;
    }
}

/// Along an axis: the cell and where in it.
struct GridPlace {
    std::int32_t nCell_;
    float fFraction_;
};

/// A value in 0..1 times 65535, to the nearest whole number. As 65536 times the value is exact, and the value
/// is what that is too much, no rounding of floats gets in between.
inline std::int32_t nearestWord(float value) {
    float const parts = value * 65536.0F;
    auto const whole = static_cast<std::int32_t>(parts);
    float const rest = (parts - static_cast<float>(whole)) - value;
    return whole + (rest >= 0.5F ? 1 : 0) - (rest < -0.5F ? 1 : 0);
}

/// Into the places, clamped to 0..1; what is no number lies at an end. A loop of its own: a compiler that
/// sees the clamp together with what follows branches on the clamp.
inline void clampBlock(colour::GridPlaces* __restrict pPlaces, float const* const* pColour, std::size_t n) {
    // Bits of positive floats are in their order, and those of negative ones are negative.
    constexpr std::int32_t nWhite = 127 << 23;
    for (std::size_t axis = 0; axis < 3; ++axis) {
        float const* __restrict pValues = pColour[axis];
        float* __restrict pClamped = pPlaces->aFractions_[axis];
        for (std::size_t i = 0; i < n; ++i) {
            std::int32_t const bits = __builtin_bit_cast(std::int32_t, pValues[i]);
            std::int32_t const raised = bits > 0 ? bits : 0;
            pClamped[i] = __builtin_bit_cast(float, raised < nWhite ? raised : nWhite);
        }
    }
}

/// Steps are below 2^24, which floats hold exactly; the carry may be one part in 65536 of a cell off where
/// parts lie next to a half.
template <bool bWords>
inline GridPlace placeAlong(float clamped, float last) {
    float position = clamped * last;
    if (bWords) {
        float const steps = static_cast<float>(nearestWord(clamped)) * last;
        float const parts = steps * (1.0F / 65535.0F);
        auto const wholeParts = static_cast<std::int32_t>(parts);
        std::int32_t const carry = wholeParts + (parts - static_cast<float>(wholeParts) >= 0.5F ? 1 : 0);
        position = (steps + static_cast<float>(carry)) * (1.0F / 65536.0F);
    }
    auto const whole = static_cast<std::int32_t>(position);
    std::int32_t const nLastCell = static_cast<std::int32_t>(last) - 1;
    std::int32_t const cell = whole < nLastCell ? whole : nLastCell;
    return {cell, position - static_cast<float>(cell)};
}

template <bool bWords>
void placeBlockInTetrahedra(colour::GridPlaces* __restrict pPlaces, float const* const* pColour,
                            colour::GridShape const& shape, std::size_t n) {
    clampBlock(pPlaces, pColour, n);
    auto& aClamped = pPlaces->aFractions_;
    std::int32_t const nRed = shape.aStride_[0];
    std::int32_t const nGreen = shape.aStride_[1];
    std::int32_t const nBlue = shape.aStride_[2];
    float const fLastRed = shape.aLast_[0];
    float const fLastGreen = shape.aLast_[1];
    float const fLastBlue = shape.aLast_[2];
    for (std::size_t i = 0; i < n; ++i) {
        GridPlace const red = placeAlong<bWords>(aClamped[0][i], fLastRed);
        GridPlace const green = placeAlong<bWords>(aClamped[1][i], fLastGreen);
        GridPlace const blue = placeAlong<bWords>(aClamped[2][i], fLastBlue);
        float const fRed = red.fFraction_;
        float const fGreen = green.fFraction_;
        float const fBlue = blue.fFraction_;
        float const largest = largerOf(largerOf(fRed, fGreen), fBlue);
        float const smallest = smallerOf(smallerOf(fRed, fGreen), fBlue);
        float const middle = largerOf(smallerOf(fRed, fGreen), smallerOf(largerOf(fRed, fGreen), fBlue));
        // All bits set where true: where fractions are equal, the axis of the largest and that of the
        // smallest are still two.
        std::int32_t const redGreen = fRed >= fGreen ? -1 : 0;
        std::int32_t const greenBlue = fGreen >= fBlue ? -1 : 0;
        std::int32_t const redBlue = fRed >= fBlue ? -1 : 0;
        std::int32_t const redFirst = redGreen & redBlue;
        std::int32_t const greenFirst = ~redGreen & greenBlue;
        std::int32_t const redLast = ~redGreen & ~redBlue;
        std::int32_t const greenLast = redGreen & ~greenBlue;
        std::int32_t const first =
            (redFirst & nRed) | (greenFirst & nGreen) | (~(redFirst | greenFirst) & nBlue);
        std::int32_t const last = (redLast & nRed) | (greenLast & nGreen) | (~(redLast | greenLast) & nBlue);
        pPlaces->aNode_[i] = blue.nCell_ * nBlue + green.nCell_ * nGreen + red.nCell_ * nRed;
        pPlaces->aSecond_[i] = first;
        pPlaces->aThird_[i] = nRed + nGreen + nBlue - last;
        pPlaces->aFractions_[0][i] = largest;
        pPlaces->aFractions_[1][i] = middle;
        pPlaces->aFractions_[2][i] = smallest;
    }
}

template <bool bWords>
void placeBlockInCells(colour::GridPlaces* __restrict pPlaces, float const* const* pColour,
                       colour::GridShape const& shape, std::size_t n) {
    clampBlock(pPlaces, pColour, n);
    auto& aClamped = pPlaces->aFractions_;
    colour::GridShape const local = shape;
    for (std::size_t i = 0; i < n; ++i) {
        GridPlace const red = placeAlong<bWords>(aClamped[0][i], local.aLast_[0]);
        GridPlace const green = placeAlong<bWords>(aClamped[1][i], local.aLast_[1]);
        GridPlace const blue = placeAlong<bWords>(aClamped[2][i], local.aLast_[2]);
        pPlaces->aNode_[i] = blue.nCell_ * local.aStride_[2] + green.nCell_ * local.aStride_[1] +
                             red.nCell_ * local.aStride_[0];
        pPlaces->aFractions_[0][i] = red.fFraction_;
        pPlaces->aFractions_[1][i] = green.fFraction_;
        pPlaces->aFractions_[2][i] = blue.fFraction_;
    }
}

constexpr colour::ApplyKernels applyKernelTable = {mixBlockToBytes,
                                                   mixBlockToWords,
                                                   stepBlockToBytes,
                                                   stepBlockToWords,
                                                   mixBlock,
                                                   fromLabBlock,
                                                   toLabBlock,
                                                   placeBlockInTetrahedra<false>,
                                                   placeBlockInTetrahedra<true>,
                                                   placeBlockInCells<false>,
                                                   placeBlockInCells<true>};

} // namespace
