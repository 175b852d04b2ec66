#pragma once

namespace ORVO::ImageFlow::bilateral {

struct GridKernels;

// One table a translation unit, each built with the flags of its instruction set. To be asked only where the
// processor has the instructions.
GridKernels const& gridKernelsSSE2();
GridKernels const& gridKernelsAVX2();
GridKernels const& gridKernelsAVX512();

} // namespace ORVO::ImageFlow::bilateral
