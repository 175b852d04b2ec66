#include "orvo/image_runtime/images/ImageReadAccessor.h"

namespace ORVO {

ImageReadAccessor::~ImageReadAccessor() = default;

} // namespace ORVO
