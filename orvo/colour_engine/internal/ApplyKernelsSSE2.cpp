#include "orvo/colour_engine/internal/ApplyKernelBody.h"

namespace ORVO::ColourEngine::Internal {

ApplyKernels const& applyKernelsSSE2() { return applyKernelTable; }

} // namespace ORVO::ColourEngine::Internal
