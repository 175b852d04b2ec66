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

void mixBlockToWords(std::int32_t* __restrict pStep, float* __restrict pFraction, float const* const* pLight,
                     float const* pFactors, std::size_t n) {
    using Scale = colour::WordScale;
    constexpr std::int32_t nMask = (1 << Scale::nDroppedBits_) - 1;
    constexpr float fUnit = 1.0F / static_cast<float>(1 << Scale::nDroppedBits_);
    mixToLightBits<Scale>(pStep, pLight, pFactors, n);
    for (std::size_t i = 0; i < n; ++i) {
        std::int32_t const bits = pStep[i];
        pStep[i] = bits >> Scale::nDroppedBits_;
        pFraction[i] = static_cast<float>(bits & nMask) * fUnit;
    }
}

/// The cell of a coordinate 0..32.
inline std::int32_t cubeCell(float coordinate) {
    std::int32_t const whole = static_cast<std::int32_t>(coordinate);
    return whole < 31 ? whole : 31;
}

inline float largerOf(float a, float b) { return a > b ? a : b; }

inline float smallerOf(float a, float b) { return a < b ? a : b; }

void placeBlockInCube(colour::CubePlaces* __restrict pPlaces, float const* const* pColour, float white,
                      std::size_t n) {
    float const* __restrict pRed = pColour[0];
    float const* __restrict pGreen = pColour[1];
    float const* __restrict pBlue = pColour[2];
    constexpr std::int32_t nGreen = 33;
    constexpr std::int32_t nBlue = 33 * 33;
    for (std::size_t i = 0; i < n; ++i) {
        std::int32_t const red = cubeCell(pRed[i]);
        std::int32_t const green = cubeCell(pGreen[i]);
        std::int32_t const blue = cubeCell(pBlue[i]);
        float const fRed = pRed[i] - static_cast<float>(red);
        float const fGreen = pGreen[i] - static_cast<float>(green);
        float const fBlue = pBlue[i] - static_cast<float>(blue);
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
            (redFirst & 1) | (greenFirst & nGreen) | (~(redFirst | greenFirst) & nBlue);
        std::int32_t const last = (redLast & 1) | (greenLast & nGreen) | (~(redLast | greenLast) & nBlue);
        pPlaces->aNode_[i] = (blue * nGreen + green) * nGreen + red;
        pPlaces->aSecond_[i] = first;
        pPlaces->aThird_[i] = 1 + nGreen + nBlue - last;
        pPlaces->aWeights_[0][i] = (1.0F - largest) * white;
        pPlaces->aWeights_[1][i] = (largest - middle) * white;
        pPlaces->aWeights_[2][i] = (middle - smallest) * white;
        pPlaces->aWeights_[3][i] = smallest * white;
    }
}

constexpr colour::ApplyKernels applyKernelTable = {mixBlockToBytes, mixBlockToWords, placeBlockInCube};

} // namespace
