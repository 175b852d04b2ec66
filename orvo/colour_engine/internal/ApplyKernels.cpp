#include "orvo/colour_engine/internal/ApplyKernels.h"

namespace ORVO::ColourEngine::Internal {

ApplyKernels const& applyKernels(Core::InstructionSet eInstructionSet) {
    switch (eInstructionSet) {
    case Core::InstructionSet::AVX512:
        return applyKernelsAVX512();
    case Core::InstructionSet::AVX2:
        return applyKernelsAVX2();
    case Core::InstructionSet::SSE2:
    case Core::InstructionSet::PLAIN:
        break;
    }
    return applyKernelsSSE2();
}

} // namespace ORVO::ColourEngine::Internal
