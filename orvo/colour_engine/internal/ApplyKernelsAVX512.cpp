#include "orvo/colour_engine/internal/ApplyKernelBody.h"

namespace ORVO::ColourEngine::Internal {

ApplyKernels const& applyKernelsAVX512() { return applyKernelTable; }

} // namespace ORVO::ColourEngine::Internal
