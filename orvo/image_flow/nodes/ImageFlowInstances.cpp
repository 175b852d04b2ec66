#include "orvo/image_flow/nodes/ImageFilter.h"

namespace ORVO::DataFlow {

template class ConstDataPointer<ImageCPU>;
template class OutputTemplate<ImageCPU>;
template class ConstOutput<ImageCPU>;
template class Output<ImageCPU>;
template class InputTemplate<ImageCPU>;
template class ConstInput<ImageCPU>;
template class Input<ImageCPU>;

} // namespace ORVO::DataFlow

ORVO_DEFINE_PARAMETER(ORVO::ImageCPU::tePixelFormat)
ORVO_DEFINE_PARAMETER(ORVO::ImageFilter::teOutputPrecisionHint)
