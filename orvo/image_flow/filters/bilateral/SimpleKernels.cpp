#include "orvo/image_flow/filters/bilateral/SimpleKernels.h"

#include "orvo/core/Check.h"
#include "orvo/image_flow/filters/bilateral/SimpleKernelTables.h"

#include <cmath>
#include <cstdlib>

namespace ORVO::ImageFlow::bilateral {

namespace {

/// The distance of colours that the range weight is made of.
template <bool bColorize>
float distanceOf(float const (&tap)[3], float const (&centre)[3]) {
    float const r = std::fabs(tap[0] - centre[0]);
    float const g = std::fabs(tap[1] - centre[1]);
    float const b = std::fabs(tap[2] - centre[2]);
    return bColorize ? r * r + g * g + b * b : r * 0.39F + g * 0.5F + b * 0.11F;
}

template <bool bColorize>
void plainPixel(SimpleJob const& job, std::size_t pixel) {
    std::size_t const nHalf = static_cast<std::size_t>(job.nHalf);
    float const* const pCentre = job.pCentres + pixel + nHalf;
    float const centre[3] = {pCentre[0], pCentre[job.nPitch], pCentre[2 * job.nPitch]};
    float sums[3] = {0.0F, 0.0F, 0.0F};
    float total = 0.0F;
    for (int i = -job.nHalf; i <= job.nHalf; ++i) {
        float const* const pWeights = job.pSpatialWeights + std::abs(i) * (job.nHalf + 1);
        for (int j = -job.nHalf; j <= job.nHalf; ++j) {
            float const* const pTap =
                job.apRows[j + job.nHalf] + static_cast<std::ptrdiff_t>(pixel) + i + job.nHalf;
            float const tap[3] = {pTap[0], pTap[job.nPitch], pTap[2 * job.nPitch]};
            float const distance = distanceOf<bColorize>(tap, centre);
            float const weight =
                std::exp(distance * distance * -1.0F / job.fRangeDivisor) * pWeights[std::abs(j)];
            if (bColorize) {
                sums[0] += weight * tap[0];
                sums[1] += weight * tap[1];
                sums[2] += weight * tap[2];
            } else {
                sums[0] += weight * pTap[3 * job.nPitch];
            }
            total += weight;
        }
    }
    float* const pResult = job.pRGBA + 4 * pixel;
    pResult[0] = sums[0] / total;
    pResult[1] = bColorize ? sums[1] / total : pResult[0];
    pResult[2] = bColorize ? sums[2] / total : pResult[0];
    pResult[3] = 0.0F;
}

void simpleRowPlain(SimpleJob const& job) {
    for (std::size_t pixel = 0; pixel < job.nPixels; ++pixel) {
        if (job.bColorize) {
            plainPixel<true>(job, pixel);
        } else {
            plainPixel<false>(job, pixel);
        }
    }
}

} // namespace

SimpleKernel simpleKernel(ImageRuntime::InstructionSet eInstructionSet) {
    using ImageRuntime::InstructionSet;
    using ImageRuntime::isSupported;
    ORVO_CHECK_PARAMETER(isSupported(eInstructionSet));
    switch (eInstructionSet) {
    case InstructionSet::SSE2:
        return simpleRowSSE2;
    case InstructionSet::AVX2:
        return simpleRowAVX2;
    case InstructionSet::AVX512:
        return simpleRowAVX512;
    case InstructionSet::PLAIN:
        break;
    }
    return simpleRowPlain;
}

} // namespace ORVO::ImageFlow::bilateral
