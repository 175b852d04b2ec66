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

/// Where pixels stand on the intensity axis: two levels, counted from the first one in use, and how far the
/// pixels are from the lower one.
struct LevelPlaces {
    Vector::Ints low;
    Vector::Ints high;
    Vector::Floats fraction;

    LevelPlaces(GridLayout const& layout, SplatConstants const& constants, Vector::Floats value) {
        Vector::Floats const first = Vector::set(static_cast<float>(kFirstLevel));
        Vector::Floats const place = Vector::add(constants.cellsAlongAxis(value), first);
        Vector::Floats const whole = Vector::floor(place);
        fraction = Vector::sub(place, whole);
        Vector::Floats const last = Vector::set(static_cast<float>(layout.nUsed - 1));
        Vector::Floats const level =
            Vector::min(Vector::max(Vector::sub(whole, first), Vector::zero()), last);
        low = Vector::toInts(level);
        high = Vector::toInts(Vector::min(Vector::add(level, Vector::set(1.0F)), last));
    }
};

/// Reads back up to kLanes pixels between the same two columns.
template <std::size_t kChannels, Lookup lookup>
void slicePixels(SliceJob const& job, SplatConstants const& constants, std::size_t pixel, int n) {
    GridLayout const& layout = *job.pLayout;
    LevelPlaces const places(layout, constants, Vector::loadFirst(job.pIntensities + pixel, n));
    Vector::Floats const fractionX = Vector::loadFirst(job.pFractions + pixel, n);
#pragma GCC unroll 4
    for (std::size_t channel = 0; channel < kChannels; ++channel) {
        float const* const pLeft = job.pBlended + channel * planeFloats(layout) + job.pLevels[pixel];
        float const* const pRight = pLeft + layout.nLevels;
        Vector::Floats const below = interpolate(valuesAt<lookup, Vector>(pLeft, places.low),
                                                 valuesAt<lookup, Vector>(pRight, places.low), fractionX);
        Vector::Floats const above = interpolate(valuesAt<lookup, Vector>(pLeft, places.high),
                                                 valuesAt<lookup, Vector>(pRight, places.high), fractionX);
        Vector::storeFirst(job.apResults[channel] + pixel, interpolate(below, above, places.fraction), n);
    }
}

/// Pixels begin .. end-1, as many at a time as lie between the same columns.
template <std::size_t kChannels, Lookup lookup>
void sliceRuns(SliceJob const& job, SplatConstants const& constants, std::size_t begin, std::size_t end) {
    for (std::size_t pixel = begin; pixel < end;) {
        std::size_t const runEnd = job.pEnds[pixel] < end ? job.pEnds[pixel] : end;
        std::size_t const count = runEnd - pixel < kLanes ? runEnd - pixel : kLanes;
        slicePixels<kChannels, lookup>(job, constants, pixel, static_cast<int>(count));
        pixel += count;
    }
}

/// kLanes pixels between columns that all fit into the two vectors of a lookup.
template <std::size_t kChannels, class V>
void sliceAcrossColumns(SliceJob const& job, SplatConstants const& constants, std::size_t pixel) {
    GridLayout const& layout = *job.pLayout;
    LevelPlaces const places(layout, constants, V::load(job.pIntensities + pixel));
    typename V::Floats const fractionX = V::load(job.pFractions + pixel);
    typename V::Ints const left = V::subInt(V::loadInts(job.pLevels + pixel), V::setInt(job.pLevels[pixel]));
    typename V::Ints const right = V::addInt(left, V::setInt(static_cast<int>(layout.nLevels)));
#pragma GCC unroll 4
    for (std::size_t channel = 0; channel < kChannels; ++channel) {
        float const* const p = job.pBlended + channel * planeFloats(layout) + job.pLevels[pixel];
        typename V::Floats const below =
            interpolate(V::lookupTwice(p, V::addInt(left, places.low)),
                        V::lookupTwice(p, V::addInt(right, places.low)), fractionX);
        typename V::Floats const above =
            interpolate(V::lookupTwice(p, V::addInt(left, places.high)),
                        V::lookupTwice(p, V::addInt(right, places.high)), fractionX);
        V::store(job.apResults[channel] + pixel, interpolate(below, above, places.fraction));
    }
}

/// As sliceRuns, but whole vectors of pixels where their columns allow it.
template <std::size_t kChannels, Lookup lookup, class V = Vector>
void sliceVectors(SliceJob const& job, SplatConstants const& constants) {
    int const room = static_cast<int>(2 * (V::kLookup - job.pLayout->nLevels));
    std::size_t pixel = 0;
    for (; pixel + kLanes <= job.nPixels; pixel += kLanes) {
        if (job.pLevels[pixel + kLanes - 1] - job.pLevels[pixel] <= room) {
            sliceAcrossColumns<kChannels, V>(job, constants, pixel);
        } else {
            sliceRuns<kChannels, lookup>(job, constants, pixel, pixel + kLanes);
        }
    }
    sliceRuns<kChannels, lookup>(job, constants, pixel, job.nPixels);
}

template <std::size_t kChannels, class V = Vector>
void sliceChannels(SliceJob const& job) {
    SplatConstants const constants(*job.pLayout);
    if constexpr (V::kLookup > 0) {
        if (job.pLayout->nLevels <= V::kLookup && V::kLookup > 8) {
            return sliceVectors<kChannels, Lookup::PERMUTE>(job, constants);
        }
        if (job.pLayout->nUsed <= V::kLookup) {
            return sliceRuns<kChannels, Lookup::PERMUTE>(job, constants, 0, job.nPixels);
        }
        if (job.pLayout->nUsed <= 2 * V::kLookup) {
            return sliceRuns<kChannels, Lookup::PERMUTE_TWICE>(job, constants, 0, job.nPixels);
        }
    }
    sliceRuns<kChannels, Lookup::GATHER>(job, constants, 0, job.nPixels);
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
