#pragma once

// To be included by one translation unit an instruction set, after VectorMath.h: everything has internal
// linkage.
#include "orvo/image_flow/filters/bilateral/SimpleKernels.h"

#include <limits>

namespace ORVO::ImageFlow::bilateral {
namespace {

static_assert(Vector::kLanes <= kSimpleSlack);

/// What multiplies the square of a distance: -1 / divisor. Where that leaves the floats though the divisor is
/// not 0, the largest one stands for it, so that a distance of 0 still weighs 1.
float rangeFactorOf(float divisor) {
    float const factor = -1.0F / divisor;
    float const largest = std::numeric_limits<float>::max();
    return divisor > 0.0F && factor < -largest ? -largest : factor;
}

/// e ^ x for x <= 0, without a detour for results too small for a float, which would be slow.
Vector::Floats rangeWeight(Vector::Floats x) {
    Vector::Mask const vanishes = Vector::less(x, Vector::set(-104.0F));
    Vector::Floats const weight = VectorMath::exponential(Vector::select(vanishes, Vector::zero(), x));
    return Vector::select(vanishes, Vector::zero(), weight);
}

// Products and sums are rounded one by one, as in the plain kernel.
template <bool bColorize>
void simplePixels(SimpleJob const& job, std::size_t pixel, Vector::Floats (&results)[3]) {
    Vector::Floats const factor = Vector::set(rangeFactorOf(job.fRangeDivisor));
    float const* const pCentre = job.pCentres + pixel + job.nHalf;
    Vector::Floats const centres[3] = {Vector::load(pCentre), Vector::load(pCentre + job.nPitch),
                                       Vector::load(pCentre + 2 * job.nPitch)};
    Vector::Floats const greyWeights[3] = {Vector::set(0.39F), Vector::set(0.5F), Vector::set(0.11F)};
    Vector::Floats sums[3] = {Vector::zero(), Vector::zero(), Vector::zero()};
    Vector::Floats total = Vector::zero();
    for (int i = -job.nHalf; i <= job.nHalf; ++i) {
        float const* const pWeights = job.pSpatialWeights + (i < 0 ? -i : i) * (job.nHalf + 1);
        for (int j = -job.nHalf; j <= job.nHalf; ++j) {
            float const* const pTap =
                job.apRows[j + job.nHalf] + static_cast<std::ptrdiff_t>(pixel) + i + job.nHalf;
            Vector::Floats taps[3];
            Vector::Floats distance = Vector::zero();
            for (std::size_t c = 0; c < 3; ++c) {
                taps[c] = Vector::load(pTap + c * job.nPitch);
                Vector::Floats const difference = Vector::abs(Vector::sub(taps[c], centres[c]));
                Vector::Floats const part = Vector::mul(difference, bColorize ? difference : greyWeights[c]);
                distance = c == 0 ? part : Vector::add(distance, part);
            }
            Vector::Floats const range = rangeWeight(Vector::mul(Vector::mul(distance, distance), factor));
            Vector::Floats const weight = Vector::mul(range, Vector::set(pWeights[j < 0 ? -j : j]));
            if (bColorize) {
                for (std::size_t c = 0; c < 3; ++c) {
                    sums[c] = Vector::add(sums[c], Vector::mul(weight, taps[c]));
                }
            } else {
                sums[0] = Vector::add(sums[0], Vector::mul(weight, Vector::load(pTap + 3 * job.nPitch)));
            }
            total = Vector::add(total, weight);
        }
    }
    for (std::size_t c = 0; c < 3; ++c) {
        results[c] = Vector::div(sums[bColorize ? c : 0], total);
    }
}

template <bool bColorize>
void simplePixels(SimpleJob const& job) {
    constexpr std::size_t nLanes = Vector::kLanes;
    for (std::size_t pixel = 0; pixel < job.nPixels; pixel += nLanes) {
        Vector::Floats results[3];
        simplePixels<bColorize>(job, pixel, results);
        std::size_t const rest = job.nPixels - pixel;
        if (rest >= nLanes) {
            Vector::storePixels(job.pRGBA + 4 * pixel, results[0], results[1], results[2], Vector::zero());
        } else {
            float block[4 * nLanes];
            Vector::storePixels(block, results[0], results[1], results[2], Vector::zero());
            for (std::size_t i = 0; i < 4 * rest; ++i) {
                job.pRGBA[4 * pixel + i] = block[i];
            }
        }
    }
}

void simpleRow(SimpleJob const& job) {
    if (job.bColorize) {
        simplePixels<true>(job);
    } else {
        simplePixels<false>(job);
    }
}

} // namespace
} // namespace ORVO::ImageFlow::bilateral
