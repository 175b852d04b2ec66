#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_runtime/kernels/InstructionSet.h"

#include <cstddef>

namespace ORVO::ImageFlow::bilateral {

/// Floats behind each plane of a row of SimpleJob that a kernel may read; their values do not matter.
constexpr std::size_t kSimpleSlack = 16;

/// One row of the simple bilateral filter.
///
/// A row of the window is four planes of floats, nPitch apart: r, g, b, and the grey 0.39 r + 0.5 g + 0.11 b
/// (+ 0 alpha, so that it is NaN where alpha is not finite). In each plane pixel 0 of the row of the result
/// stands at nHalf, with the pixels left and right of it around it: nPixels + 2 nHalf floats.
struct SimpleJob {
    float const* const* apRows; ///< 2 nHalf + 1 rows, from the uppermost neighbours to the lowest
    float const* pCentres;      ///< a row in the same layout, with the pixels of the result themselves
    std::size_t nPitch;
    std::size_t nPixels;
    int nHalf; ///< how far the window reaches
    bool bColorize;
    float fRangeDivisor;          ///< rangeSigma * 2 * rangeSigma
    float const* pSpatialWeights; ///< at |dx| * (nHalf + 1) + |dy|
    float* pRGBA;                 ///< receives nPixels RGBA pixels; alpha 0
};

/// A kernel made for one instruction set. The plain one is the definition of the results. The others use a
/// polynomial with a relative error of 3e-7 for the exponential and are the same otherwise, operation by
/// operation: results differ from the plain ones by at most 1e-6 times the largest neighbour
/// where a pixel is one of its own neighbours, with a weight of about 1. NaN and infinity are treated alike.
///
/// Threads: free of state; any thread.
using SimpleKernel = void (*)(SimpleJob const& job);

/// The kernel of a given set.
/// @throws ParameterException "isSupported(eInstructionSet)" if the processor lacks it.
ORVO_API SimpleKernel simpleKernel(ImageRuntime::InstructionSet eInstructionSet);

} // namespace ORVO::ImageFlow::bilateral
