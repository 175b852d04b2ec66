#include "orvo/image_runtime/images/ImageAccessorBase.h"

namespace ORVO {

ImageAccessorBase::~ImageAccessorBase() = default;

} // namespace ORVO
