#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_runtime/kernels/InstructionSet.h"

#include <cstddef>

namespace ORVO::ImageFlow::lab {

/// Kernels over a row of n pixels of four interleaved floats, made for one instruction set. The plain kernels
/// are LabTransform pixel by pixel. The others use polynomials for the powers: each component differs from
/// the plain one by at most 1e-5 times max(1, its magnitude) for sRGB components in 0..1 and the Lab of such
/// colours, and by 1e-4 times that for components of magnitude up to 4 (Lab: 2), where terms of different
/// signs cancel. Signs, infinities and NaN are treated alike. Input and output may be the same row, else they
/// must not overlap. Pointers need the alignment of a float only.
///
/// Threads: free of state; any thread.
struct LabKernels {
    /// sRGB to Lab; alpha passes.
    void (*labFromRGB)(float* pOutput, float const* pInput, std::size_t n);
    /// Lab to sRGB; alpha passes.
    void (*rgbFromLab)(float* pOutput, float const* pInput, std::size_t n);
};

/// The kernels of the active instruction set.
ORVO_API LabKernels const& labKernels();

/// The kernels of a given set.
/// @throws ParameterException "isSupported(eInstructionSet)" if the processor lacks it.
ORVO_API LabKernels const& labKernels(ImageRuntime::InstructionSet eInstructionSet);

} // namespace ORVO::ImageFlow::lab
