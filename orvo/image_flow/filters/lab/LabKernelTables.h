#pragma once

namespace ORVO::ImageFlow::lab {

struct LabKernels;

// One table a translation unit, each built with the flags of its instruction set. To be asked only where the
// processor has the instructions.
LabKernels const& labKernelsSSE2();
LabKernels const& labKernelsAVX2();
LabKernels const& labKernelsAVX512();

} // namespace ORVO::ImageFlow::lab
