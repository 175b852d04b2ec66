#pragma once

#include <cstddef>

// To be included after LabVector.h; internal linkage for the same reason.
namespace {

template <void (*transform)(Vector::Floats&, Vector::Floats&, Vector::Floats&)>
void transformBlock(float* pOutput, float const* pInput) {
    Vector::Floats c0;
    Vector::Floats c1;
    Vector::Floats c2;
    Vector::Floats alpha;
    Vector::loadPixels(pInput, c0, c1, c2, alpha);
    transform(c0, c1, c2);
    Vector::storePixels(pOutput, c0, c1, c2, alpha);
}

template <void (*transform)(Vector::Floats&, Vector::Floats&, Vector::Floats&)>
void transformLabRow(float* pOutput, float const* pInput, std::size_t n) {
    constexpr std::size_t kLanes = Vector::kLanes;
    std::size_t x = 0;
    for (; x + kLanes <= n; x += kLanes) {
        transformBlock<transform>(pOutput + 4 * x, pInput + 4 * x);
    }
    if (x < n) {
        float block[4 * kLanes] = {};
        std::size_t const nFloats = 4 * (n - x);
        for (std::size_t i = 0; i < nFloats; ++i) {
            block[i] = pInput[4 * x + i];
        }
        transformBlock<transform>(block, block);
        for (std::size_t i = 0; i < nFloats; ++i) {
            pOutput[4 * x + i] = block[i];
        }
    }
}

} // namespace
