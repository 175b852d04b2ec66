#include "orvo/image_flow/filters/lab/LabKernels.h"

#include "orvo/core/Check.h"
#include "orvo/image_flow/filters/lab/LabKernelTables.h"
#include "orvo/image_flow/filters/lab/LabTransform.h"

namespace ORVO::ImageFlow::lab {

namespace {

template <float4 (*transform)(float4 const&)>
void transformRow(float* pOutput, float const* pInput, std::size_t n) {
    for (std::size_t i = 0; i < 4 * n; i += 4) {
        float4 const pixel = transform(float4(pInput[i], pInput[i + 1], pInput[i + 2], pInput[i + 3]));
        pOutput[i] = pixel.x;
        pOutput[i + 1] = pixel.y;
        pOutput[i + 2] = pixel.z;
        pOutput[i + 3] = pixel.w;
    }
}

LabKernels const kPlainKernels = {transformRow<sRGBToLab>, transformRow<LabTosRGB>};

} // namespace

LabKernels const& labKernels() { return labKernels(ImageRuntime::activeInstructionSet()); }

LabKernels const& labKernels(ImageRuntime::InstructionSet eInstructionSet) {
    using ImageRuntime::InstructionSet;
    using ImageRuntime::isSupported;
    ORVO_CHECK_PARAMETER(isSupported(eInstructionSet));
    switch (eInstructionSet) {
    case InstructionSet::SSE2:
        return labKernelsSSE2();
    case InstructionSet::AVX2:
        return labKernelsAVX2();
    case InstructionSet::AVX512:
        return labKernelsAVX512();
    case InstructionSet::PLAIN:
        break;
    }
    return kPlainKernels;
}

} // namespace ORVO::ImageFlow::lab
