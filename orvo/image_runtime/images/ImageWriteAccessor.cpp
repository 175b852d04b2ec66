#include "orvo/image_runtime/images/ImageWriteAccessor.h"

namespace ORVO {

ImageWriteAccessor::~ImageWriteAccessor() = default;

} // namespace ORVO
