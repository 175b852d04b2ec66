#include "orvo/image_flow/filters/bilateral/GridKernels.h"

#include "orvo/core/Check.h"
#include "orvo/image_flow/filters/bilateral/GridKernelTables.h"

namespace ORVO::ImageFlow::bilateral {

GridKernels const& gridKernels(ImageRuntime::InstructionSet eInstructionSet) {
    using ImageRuntime::InstructionSet;
    using ImageRuntime::isSupported;
    ORVO_CHECK_PARAMETER(isSupported(eInstructionSet));
    ORVO_CHECK_PARAMETER(eInstructionSet != InstructionSet::PLAIN);
    switch (eInstructionSet) {
    case InstructionSet::AVX512:
        return gridKernelsAVX512();
    case InstructionSet::AVX2:
        return gridKernelsAVX2();
    case InstructionSet::SSE2:
    case InstructionSet::PLAIN:
        break;
    }
    return gridKernelsSSE2();
}

} // namespace ORVO::ImageFlow::bilateral
