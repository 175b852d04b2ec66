#pragma once

// To be included by one translation unit an instruction set, after ConversionBody.h: everything has internal
// linkage.
#include "orvo/image_flow/filters/bilateral/GridKernels.h"

namespace ORVO::ImageFlow::bilateral {
namespace {

/// The taps that kLanes neighbouring pixels find at one distance.
template <std::size_t kChannels>
struct Taps {
    Vector::Floats values[kChannels];
    Vector::Floats exists; ///< 1 where the tap lies in the image, else 0
};

/// Taps of which some lie before the first or behind the last pixel of the image.
template <std::size_t kChannels>
Taps<kChannels> partialTaps(DirectJob const& job, std::ptrdiff_t first) {
    float values[kChannels][kLanes] = {};
    float exists[kLanes] = {};
    for (std::size_t i = 0; i < kLanes; ++i) {
        std::ptrdiff_t const tap = first + static_cast<std::ptrdiff_t>(i);
        if (tap < 0 || tap >= static_cast<std::ptrdiff_t>(job.nPixels)) {
            continue;
        }
        exists[i] = 1.0F;
        for (std::size_t channel = 0; channel < kChannels; ++channel) {
            values[channel][i] = job.apPlanes[channel][tap];
        }
    }
    Taps<kChannels> taps;
    for (std::size_t channel = 0; channel < kChannels; ++channel) {
        taps.values[channel] = Vector::load(values[channel]);
    }
    taps.exists = Vector::load(exists);
    return taps;
}

template <std::size_t kChannels>
struct DirectSums {
    Vector::Floats sums[kChannels];
    Vector::Floats weight = Vector::zero();

    DirectSums() {
        for (Vector::Floats& sum : sums) {
            sum = Vector::zero();
        }
    }

    void add(Vector::Floats const (&values)[kChannels], Vector::Floats w) {
        for (std::size_t channel = 0; channel < kChannels; ++channel) {
            sums[channel] = Vector::mulAdd(w, values[channel], sums[channel]);
        }
        weight = Vector::add(weight, w);
    }
};

template <std::size_t kChannels>
void directPixels(DirectJob const& job, std::size_t column, int n) {
    std::ptrdiff_t const nPixels = static_cast<std::ptrdiff_t>(job.nPixels);
    std::ptrdiff_t const nWidth = static_cast<std::ptrdiff_t>(job.nWidth);
    std::ptrdiff_t const nLanes = static_cast<std::ptrdiff_t>(kLanes);
    std::ptrdiff_t const index =
        static_cast<std::ptrdiff_t>(job.nRow) * nWidth + static_cast<std::ptrdiff_t>(column);
    Vector::Floats const centre = Vector::loadFirst(job.apPlanes[0] + index, n);
    Vector::Floats const factor = Vector::set(-job.fRangeFactor);
    DirectSums<kChannels> sums;
    for (std::ptrdiff_t dy = -job.nRadiusY; dy <= job.nRadiusY; ++dy) {
        std::ptrdiff_t const line = index + dy * nWidth;
        std::ptrdiff_t const first = line - job.nRadiusX <= -nLanes ? -nLanes + 1 - line : -job.nRadiusX;
        std::ptrdiff_t const last = line + job.nRadiusX >= nPixels ? nPixels - 1 - line : job.nRadiusX;
        float const* const pWeights = job.pSpatialWeights + (dy < 0 ? -dy : dy) * (job.nRadiusX + 1);
        for (std::ptrdiff_t dx = first; dx <= last; ++dx) {
            Taps<kChannels> taps;
            bool const allExist = line + dx >= 0 && line + dx + nLanes <= nPixels;
            if (allExist) {
                for (std::size_t channel = 0; channel < kChannels; ++channel) {
                    taps.values[channel] = Vector::load(job.apPlanes[channel] + line + dx);
                }
            } else {
                taps = partialTaps<kChannels>(job, line + dx);
            }
            Vector::Floats const difference = Vector::sub(centre, taps.values[0]);
            Vector::Floats const range =
                VectorMath::exponential(Vector::mul(Vector::mul(difference, difference), factor));
            Vector::Floats w = Vector::mul(range, Vector::set(pWeights[dx < 0 ? -dx : dx]));
            if (!allExist) {
                w = Vector::select(Vector::unequal(taps.exists, Vector::zero()), w, Vector::zero());
            }
            sums.add(taps.values, w);
        }
    }
    Vector::Mask const hasWeight = Vector::unequal(sums.weight, Vector::zero());
    for (std::size_t channel = 0; channel < kChannels; ++channel) {
        Vector::Floats const quotient =
            Vector::select(hasWeight, Vector::div(sums.sums[channel], sums.weight), Vector::zero());
        Vector::storeFirst(job.apResults[channel] + column, quotient, n);
    }
}

template <std::size_t kChannels>
void directChannels(DirectJob const& job) {
    for (std::size_t column = 0; column < job.nWidth; column += kLanes) {
        std::size_t const rest = job.nWidth - column;
        directPixels<kChannels>(job, column, static_cast<int>(rest < kLanes ? rest : kLanes));
    }
}

void direct(DirectJob const& job) {
    if (job.nChannels == 1) {
        directChannels<1>(job);
    } else {
        directChannels<3>(job);
    }
}

} // namespace
} // namespace ORVO::ImageFlow::bilateral
