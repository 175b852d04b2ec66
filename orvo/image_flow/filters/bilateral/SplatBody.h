#pragma once

// To be included by one translation unit an instruction set, after ConversionBody.h: everything has internal
// linkage.
#include "orvo/image_flow/filters/bilateral/GridKernels.h"
#include "orvo/image_flow/filters/bilateral/GridShape.h"

namespace ORVO::ImageFlow::bilateral {
namespace {

/// How many rows of a strip are summed up at a time, so that their levels stay near.
constexpr std::size_t kStripRows = 64;

/// Where the levels of a strip spread over more groups than this, its pixels are added one by one instead.
constexpr int kMaximalGroups = 6;

struct SplatConstants {
    Vector::Floats valueMin;
    Vector::Floats valueExtent;
    Vector::Floats rangeStep;
    Vector::Floats lastLevel;
    bool isUnitAxis;

    explicit SplatConstants(GridLayout const& layout)
        : valueMin(Vector::set(layout.fValueMin)),
          valueExtent(Vector::set(layout.fValueExtent)),
          rangeStep(Vector::set(layout.fRangeStep)),
          lastLevel(Vector::set(static_cast<float>(layout.nDepth - 1))),
          isUnitAxis(layout.fValueMin == 0.0F && layout.fValueExtent == 1.0F) {}

    /// Where on the intensity axis a value stands, in cells, without the padding. Subtracting 0 and dividing
    /// by 1 change nothing.
    Vector::Floats cellsAlongAxis(Vector::Floats value) const {
        if (isUnitAxis) {
            return Vector::div(value, rangeStep);
        }
        return Vector::div(Vector::div(Vector::sub(value, valueMin), valueExtent), rangeStep);
    }

    /// The level that a value falls into, as a whole number; NaN falls into 0.
    Vector::Floats levelOf(Vector::Floats value) const {
        Vector::Floats const nearest = Vector::floor(Vector::add(cellsAlongAxis(value), Vector::set(0.5F)));
        Vector::Floats const level = Vector::add(nearest, Vector::set(static_cast<float>(kFirstLevel)));
        return Vector::min(Vector::max(level, Vector::zero()), lastLevel);
    }
};

/// A strip of pixels kLanes wide (or less at the right edge) and up to kStripRows high.
struct Strip {
    alignas(64) float levels[kStripRows * kLanes]; ///< by `findLevels`
    float const* apFirst[3];                       ///< its first pixel in each plane
    std::size_t nPitch;
    std::size_t nColumns;
    std::size_t nRows;
    std::uint32_t const* pColumns; ///< the grid column of each pixel column
    int nLowest;                   ///< the lowest level in it, by `findLevels`
    int nHighest;                  ///< the highest one

    bool isWhole() const { return nColumns == kLanes; }
    Vector::Floats pixels(std::size_t channel, std::size_t row) const {
        return loadPixelsOf(apFirst[channel] + row * nPitch, static_cast<int>(nColumns));
    }
};

/// Finds the level of each pixel. Lanes beyond the right edge get a level that no bin has.
void findLevels(SplatConstants const& constants, Strip& strip) {
    float beyond[kLanes] = {};
    for (std::size_t i = strip.nColumns; i < kLanes; ++i) {
        beyond[i] = 1.0F;
    }
    Vector::Mask const isBeyond = Vector::unequal(Vector::load(beyond), Vector::zero());
    Vector::Floats lowest = constants.lastLevel;
    Vector::Floats highest = Vector::zero();
    for (std::size_t row = 0; row < strip.nRows; ++row) {
        Vector::Floats const level = constants.levelOf(strip.pixels(0, row));
        lowest = Vector::min(lowest, Vector::select(isBeyond, lowest, level));
        highest = Vector::max(highest, Vector::select(isBeyond, highest, level));
        Vector::store(strip.levels + row * kLanes, Vector::select(isBeyond, Vector::set(-1.0F), level));
    }
    strip.nLowest = static_cast<int>(Vector::lowest(lowest));
    strip.nHighest = static_cast<int>(Vector::highest(highest));
}

/// Adds what was summed up for one grid column: kBins levels of each channel, then of the weight.
template <std::size_t kBins>
void addToColumn(float* pColumn, std::size_t stride, Vector::Floats sums) {
    float lanes[kLanes];
    Vector::store(lanes, sums);
    for (std::size_t channel = 0; channel < kLanes / kBins; ++channel) {
        for (std::size_t bin = 0; bin < kBins; ++bin) {
            pColumn[channel * stride + bin] += lanes[channel * kBins + bin];
        }
    }
}

/// Turned over, a vector holds all levels and channels of one pixel column; those of a grid column are added.
template <std::size_t kChannels>
void addColumns(SplatJob const& job, Strip const& strip, int firstLevel, Vector::Floats (&sums)[kLanes]) {
    constexpr std::size_t kBins = kLanes / (kChannels + 1);
    Vector::transpose(sums);
    std::size_t const stride = splatStride(*job.pLayout);
    float* const pCells = job.pCells + 4 + firstLevel;
    std::uint32_t const* const pColumns = strip.pColumns;
    Vector::Floats sum = sums[0];
    for (std::size_t i = 1; i < strip.nColumns; ++i) {
        if (pColumns[i] == pColumns[i - 1]) {
            sum = Vector::add(sum, sums[i]);
        } else {
            addToColumn<kBins>(pCells + pColumns[i - 1] * (kChannels + 1) * stride, stride, sum);
            sum = sums[i];
        }
    }
    addToColumn<kBins>(pCells + pColumns[strip.nColumns - 1] * (kChannels + 1) * stride, stride, sum);
}

/// Sums up the pixels of kBins levels of a strip, without scattered stores: each lane stands for a pixel
/// column and each vector for a level and a channel, and a pixel is added to its level under a mask. The
/// levels of a row come from a function, which is given the intensities.
template <std::size_t kChannels, class LevelsOf>
void splatGroup(SplatJob const& job, Strip const& strip, int firstLevel, LevelsOf const& levelsOf) {
    constexpr std::size_t kBins = kLanes / (kChannels + 1);
    Vector::Floats sums[kLanes];
    Vector::Floats bins[kBins];
#pragma GCC unroll 16
    for (std::size_t i = 0; i < kLanes; ++i) {
        sums[i] = Vector::zero();
    }
#pragma GCC unroll 16
    for (std::size_t bin = 0; bin < kBins; ++bin) {
        bins[bin] = Vector::set(static_cast<float>(firstLevel + static_cast<int>(bin)));
    }
    Vector::Floats const one = Vector::set(1.0F);
    for (std::size_t row = 0; row < strip.nRows; ++row) {
        Vector::Floats values[kChannels];
#pragma GCC unroll 4
        for (std::size_t channel = 0; channel < kChannels; ++channel) {
            values[channel] = strip.pixels(channel, row);
        }
        Vector::Floats const level = levelsOf(row, values[0]);
#pragma GCC unroll 16
        for (std::size_t bin = 0; bin < kBins; ++bin) {
            Vector::Mask const isHere = Vector::equal(level, bins[bin]);
#pragma GCC unroll 4
            for (std::size_t channel = 0; channel < kChannels; ++channel) {
                sums[channel * kBins + bin] =
                    Vector::addWhere(sums[channel * kBins + bin], isHere, values[channel]);
            }
            sums[kChannels * kBins + bin] = Vector::addWhere(sums[kChannels * kBins + bin], isHere, one);
        }
    }
    addColumns<kChannels>(job, strip, firstLevel, sums);
}

/// Adds the pixels of levels below a limit one by one.
template <std::size_t kChannels>
void scatterStrip(SplatJob const& job, Strip const& strip, float limit) {
    std::size_t const stride = splatStride(*job.pLayout);
    for (std::size_t row = 0; row < strip.nRows; ++row) {
        for (std::size_t i = 0; i < strip.nColumns; ++i) {
            float const level = strip.levels[row * kLanes + i];
            if (level >= limit) {
                continue;
            }
            float* const pCell =
                job.pCells + strip.pColumns[i] * (kChannels + 1) * stride + 4 + static_cast<int>(level);
            for (std::size_t channel = 0; channel < kChannels; ++channel) {
                pCell[channel * stride] += strip.apFirst[channel][row * strip.nPitch + i];
            }
            pCell[kChannels * stride] += 1.0F;
        }
    }
}

/// A strip in one go, where one group holds all levels that numbers fall into; what is no number is added
/// afterwards.
template <std::size_t kChannels>
void splatWhole(SplatJob const& job, SplatConstants const& constants, Strip& strip) {
    Vector::Floats lowest = constants.lastLevel;
    splatGroup<kChannels>(job, strip, static_cast<int>(kFirstLevel), [&](std::size_t, Vector::Floats value) {
        Vector::Floats const level = constants.levelOf(value);
        lowest = Vector::min(lowest, level);
        return level;
    });
    float const first = static_cast<float>(kFirstLevel);
    if (Vector::lowest(lowest) < first) {
        findLevels(constants, strip);
        scatterStrip<kChannels>(job, strip, first);
    }
}

/// A strip group by group of the levels that are found in it, or pixel by pixel where they spread far.
template <std::size_t kChannels>
void splatGroups(SplatJob const& job, SplatConstants const& constants, Strip& strip) {
    constexpr int kBins = static_cast<int>(kLanes / (kChannels + 1));
    findLevels(constants, strip);
    if (strip.nHighest - strip.nLowest >= kMaximalGroups * kBins) {
        scatterStrip<kChannels>(job, strip, static_cast<float>(job.pLayout->nDepth));
        return;
    }
    for (int level = strip.nLowest; level <= strip.nHighest; level += kBins) {
        splatGroup<kChannels>(job, strip, level, [&strip](std::size_t row, Vector::Floats) {
            return Vector::load(strip.levels + row * kLanes);
        });
    }
}

template <std::size_t kChannels>
void splatChannels(SplatJob const& job) {
    SplatConstants const constants(*job.pLayout);
    bool const oneGroup = job.pLayout->nUsed <= kLanes / (kChannels + 1);
    Strip strip;
    strip.nPitch = job.nPitch;
    for (std::size_t row = job.nFirstRow; row < job.nEndRow; row += kStripRows) {
        strip.nRows = job.nEndRow - row < kStripRows ? job.nEndRow - row : kStripRows;
        for (std::size_t column = 0; column < job.nColumns; column += kLanes) {
            strip.nColumns = job.nColumns - column < kLanes ? job.nColumns - column : kLanes;
            strip.pColumns = job.pColumns + column;
            for (std::size_t channel = 0; channel < kChannels; ++channel) {
                strip.apFirst[channel] = job.apPlanes[channel] + row * job.nPitch + column;
            }
            if (oneGroup && strip.isWhole()) {
                splatWhole<kChannels>(job, constants, strip);
            } else {
                splatGroups<kChannels>(job, constants, strip);
            }
        }
    }
}

void splat(SplatJob const& job) {
    if (job.pLayout->nChannels == 1) {
        splatChannels<1>(job);
    } else {
        splatChannels<3>(job);
    }
}

/// The blur at one place, of taps given by their distance.
template <class Tap>
Vector::Floats blurred(Tap const& tap) {
    Vector::Floats sum = tap(0);
#pragma GCC unroll 3
    for (int distance = 1; distance <= 3; ++distance) {
        Vector::Floats const pair = Vector::add(tap(-distance), tap(distance));
        sum = Vector::mulAdd(pair, Vector::set(kBlurWeights[distance]), sum);
    }
    return sum;
}

/// The buffer holds zeros beyond the intensity axis, which stand for the taps that do not exist.
void blurLevels(BlurJob const& job) {
    GridLayout const& layout = *job.pLayout;
    std::size_t const stride = splatStride(layout);
    std::size_t const plane = (layout.nWidth + 6) * layout.nLevels;
    for (std::size_t column = 0; column < layout.nWidth; ++column) {
        for (std::size_t channel = 0; channel <= layout.nChannels; ++channel) {
            float const* const pCells =
                job.pCells + (column * (layout.nChannels + 1) + channel) * stride + 4 + kFirstLevel;
            float* const pLevels = job.pLevels + channel * plane + (column + 3) * layout.nLevels;
            for (std::size_t level = 0; level < layout.nLevels; level += kLanes) {
                Vector::Floats const v =
                    blurred([&](int d) { return Vector::load(pCells + static_cast<int>(level) + d); });
                std::size_t const rest = layout.nLevels - level;
                if (rest >= kLanes) {
                    Vector::store(pLevels + level, v);
                } else {
                    Vector::storeFirst(pLevels + level, v, static_cast<int>(rest));
                }
            }
        }
    }
}

void blur(BlurJob const& job) {
    blurLevels(job);
    GridLayout const& layout = *job.pLayout;
    std::size_t const count = planeFloats(layout);
    std::ptrdiff_t const step = static_cast<std::ptrdiff_t>(layout.nLevels);
    for (std::size_t channel = 0; channel <= layout.nChannels; ++channel) {
        float const* const pLevels =
            job.pLevels + channel * (layout.nWidth + 6) * layout.nLevels + 3 * layout.nLevels;
        float* const pRow = job.pRow + channel * count;
        std::size_t i = 0;
        for (; i + kLanes <= count; i += kLanes) {
            Vector::store(pRow + i, blurred([&](int d) { return Vector::load(pLevels + i + d * step); }));
        }
        if (i < count) {
            Vector::Floats const v = blurred([&](int d) { return Vector::load(pLevels + i + d * step); });
            Vector::storeFirst(pRow + i, v, static_cast<int>(count - i));
        }
    }
}

} // namespace
} // namespace ORVO::ImageFlow::bilateral
