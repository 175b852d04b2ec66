#pragma once

// To be included by one translation unit an instruction set, after ConversionBody.h and SplatBody.h:
// everything has internal linkage.
#include "orvo/image_flow/filters/bilateral/GridKernels.h"
#include "orvo/image_flow/filters/bilateral/GridShape.h"

namespace ORVO::ImageFlow::bilateral {
namespace {

/// The blur along y of one vector of a row; rows that do not exist count as 0.
Vector::Floats blurredAcrossRows(DivideJob const& job, std::size_t offset) {
    Vector::Floats sum = job.apRows[3] != nullptr ? Vector::load(job.apRows[3] + offset) : Vector::zero();
    for (int distance = 1; distance <= 3; ++distance) {
        Vector::Floats const weight = Vector::set(kBlurWeights[distance]);
        if (job.apRows[3 - distance] != nullptr) {
            sum = Vector::mulAdd(Vector::load(job.apRows[3 - distance] + offset), weight, sum);
        }
        if (job.apRows[3 + distance] != nullptr) {
            sum = Vector::mulAdd(Vector::load(job.apRows[3 + distance] + offset), weight, sum);
        }
    }
    return sum;
}

void divide(DivideJob const& job) {
    GridLayout const& layout = *job.pLayout;
    std::size_t const count = planeFloats(layout);
    for (std::size_t i = 0; i < count; i += kLanes) {
        Vector::Floats const weight = blurredAcrossRows(job, layout.nChannels * count + i);
        Vector::Mask const hasWeight = Vector::unequal(weight, Vector::zero());
        for (std::size_t channel = 0; channel < layout.nChannels; ++channel) {
            Vector::Floats const sum = blurredAcrossRows(job, channel * count + i);
            Vector::Floats const quotient =
                Vector::select(hasWeight, Vector::div(sum, weight), Vector::zero());
            float* const p = job.pResult + channel * count + i;
            if (count - i >= kLanes) {
                Vector::store(p, quotient);
            } else {
                Vector::storeFirst(p, quotient, static_cast<int>(count - i));
            }
        }
    }
}

Vector::Floats interpolate(Vector::Floats first, Vector::Floats second, Vector::Floats fraction) {
    return Vector::mulAdd(Vector::sub(second, first), fraction, first);
}

/// The two rows of the grid at the height of the pixels.
void blendRows(SliceJob const& job) {
    std::size_t const count = planeFloats(*job.pLayout) * job.pLayout->nChannels;
    Vector::Floats const fraction = Vector::set(job.fFraction);
    std::size_t i = 0;
    for (; i + kLanes <= count; i += kLanes) {
        Vector::store(job.pBlended + i,
                      interpolate(Vector::load(job.pUpper + i), Vector::load(job.pLower + i), fraction));
    }
    if (i < count) {
        int const rest = static_cast<int>(count - i);
        Vector::storeFirst(job.pBlended + i,
                           interpolate(Vector::loadFirst(job.pUpper + i, rest),
                                       Vector::loadFirst(job.pLower + i, rest), fraction),
                           rest);
    }
}

/// How values of a column are found by their level.
enum class Lookup { PERMUTE, PERMUTE_TWICE, GATHER };

template <Lookup lookup, class V>
typename V::Floats valuesAt(float const* pColumn, typename V::Ints level) {
    if constexpr (lookup == Lookup::PERMUTE) {
        return V::lookup(pColumn, level);
    } else if constexpr (lookup == Lookup::PERMUTE_TWICE) {
        return V::lookupTwice(pColumn, level);
    } else if constexpr (V::kHasGather) {
        return V::gather(pColumn, level);
    } else {
        int levels[kLanes];
        float values[kLanes];
        V::storeInts(levels, level);
        for (std::size_t i = 0; i < kLanes; ++i) {
            values[i] = pColumn[levels[i]];
        }
        return V::load(values);
    }
}

/// Reads back up to kLanes pixels of a run.
template <std::size_t kChannels, Lookup lookup>
void slicePixels(SliceJob const& job, SplatConstants const& constants, PixelRun const& run, std::size_t pixel,
                 int n) {
    GridLayout const& layout = *job.pLayout;
    Vector::Floats const value = Vector::loadFirst(job.apPixels[0] + pixel, n);
    // The whole part counts levels from the padding on.
    Vector::Floats const place =
        Vector::add(constants.cellsAlongAxis(value), Vector::set(static_cast<float>(kFirstLevel)));
    Vector::Floats const whole = Vector::floor(place);
    Vector::Floats const fractionZ = Vector::sub(place, whole);
    Vector::Floats const fractionX = Vector::loadFirst(job.pFractions + pixel, n);
    Vector::Floats const last = Vector::set(static_cast<float>(layout.nUsed - 1));
    Vector::Floats const offset = Vector::sub(whole, Vector::set(static_cast<float>(kFirstLevel)));
    Vector::Floats const low = Vector::min(Vector::max(offset, Vector::zero()), last);
    Vector::Floats const high = Vector::min(Vector::add(low, Vector::set(1.0F)), last);
    Vector::Ints const lowLevel = Vector::toInts(low);
    Vector::Ints const highLevel = Vector::toInts(high);
#pragma GCC unroll 4
    for (std::size_t channel = 0; channel < kChannels; ++channel) {
        float const* const pPlane = job.pBlended + channel * planeFloats(layout);
        float const* const pLeft = pPlane + run.nColumn * layout.nLevels;
        float const* const pRight = pPlane + run.nNextColumn * layout.nLevels;
        Vector::Floats const below = interpolate(valuesAt<lookup, Vector>(pLeft, lowLevel),
                                                 valuesAt<lookup, Vector>(pRight, lowLevel), fractionX);
        Vector::Floats const above = interpolate(valuesAt<lookup, Vector>(pLeft, highLevel),
                                                 valuesAt<lookup, Vector>(pRight, highLevel), fractionX);
        Vector::storeFirst(job.apPixels[channel] + pixel, interpolate(below, above, fractionZ), n);
    }
}

template <std::size_t kChannels, Lookup lookup>
void sliceRuns(SliceJob const& job) {
    SplatConstants const constants(*job.pLayout);
    for (std::size_t i = 0; i < job.nRuns; ++i) {
        PixelRun const& run = job.pRuns[i];
        for (std::size_t pixel = run.nBegin; pixel < run.nEnd; pixel += kLanes) {
            std::size_t const rest = run.nEnd - pixel;
            slicePixels<kChannels, lookup>(job, constants, run, pixel,
                                           static_cast<int>(rest < kLanes ? rest : kLanes));
        }
    }
}

template <std::size_t kChannels>
void sliceChannels(SliceJob const& job) {
    if constexpr (Vector::kLookup > 0) {
        if (job.pLayout->nUsed <= Vector::kLookup) {
            return sliceRuns<kChannels, Lookup::PERMUTE>(job);
        }
        if (job.pLayout->nUsed <= 2 * Vector::kLookup) {
            return sliceRuns<kChannels, Lookup::PERMUTE_TWICE>(job);
        }
    }
    sliceRuns<kChannels, Lookup::GATHER>(job);
}

void slice(SliceJob const& job) {
    blendRows(job);
    if (job.pLayout->nChannels == 1) {
        sliceChannels<1>(job);
    } else {
        sliceChannels<3>(job);
    }
}

} // namespace
} // namespace ORVO::ImageFlow::bilateral
