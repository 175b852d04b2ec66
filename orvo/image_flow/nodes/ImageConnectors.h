#pragma once

#include "orvo/core/Export.h"
#include "orvo/data_flow/connectors/Inputs.h"
#include "orvo/data_flow/connectors/Outputs.h"
#include "orvo/data_flow/connectors/ParameterInput.h"
#include "orvo/data_flow/data/ConstDataPointer.h"
#include "orvo/data_flow/parameters/Parameter.h"
#include "orvo/image_runtime/images/ImageCPU.h"

namespace ORVO {
class ImageGPU;
}

/// The connectors of images and the parameters of host-memory formats. They are instantiated once, in the
/// library. Those who use connectors of `ImageGPU` include its header themselves.
namespace ORVO::DataFlow {

extern template class ORVO_API ConstDataPointer<ImageCPU>;
extern template class ORVO_API OutputTemplate<ImageCPU>;
extern template class ORVO_API ConstOutput<ImageCPU>;
extern template class ORVO_API Output<ImageCPU>;
extern template class ORVO_API InputTemplate<ImageCPU>;
extern template class ORVO_API ConstInput<ImageCPU>;
extern template class ORVO_API Input<ImageCPU>;

extern template class ORVO_API ConstDataPointer<ImageGPU>;
extern template class ORVO_API OutputTemplate<ImageGPU>;
extern template class ORVO_API ConstOutput<ImageGPU>;
extern template class ORVO_API Output<ImageGPU>;
extern template class ORVO_API InputTemplate<ImageGPU>;
extern template class ORVO_API ConstInput<ImageGPU>;
extern template class ORVO_API Input<ImageGPU>;

} // namespace ORVO::DataFlow

ORVO_DECLARE_PARAMETER(ORVO::ImageCPU::tePixelFormat)
