#include "orvo/image_flow/nodes/ImageFilter.h"
#include "orvo/image_runtime/images/ImageGPU.h"

namespace ORVO::DataFlow {

template class ConstDataPointer<ImageCPU>;
template class OutputTemplate<ImageCPU>;
template class ConstOutput<ImageCPU>;
template class Output<ImageCPU>;
template class InputTemplate<ImageCPU>;
template class ConstInput<ImageCPU>;
template class Input<ImageCPU>;

template class ConstDataPointer<ImageGPU>;
template class OutputTemplate<ImageGPU>;
template class ConstOutput<ImageGPU>;
template class Output<ImageGPU>;
template class InputTemplate<ImageGPU>;
template class ConstInput<ImageGPU>;
template class Input<ImageGPU>;

} // namespace ORVO::DataFlow

ORVO_DEFINE_PARAMETER(ORVO::ImageCPU::tePixelFormat)
ORVO_DEFINE_PARAMETER(ORVO::ImageFilter::teOutputPrecisionHint)
