#include "orvo/image_runtime/images/ImageCPUWriteAccessor.h"

#include "orvo/image_runtime/images/ImageCPU.h"
#include "orvo/image_runtime/kernels/PixelRuns.h"

namespace ORVO {

ImageCPUWriteAccessor::ImageCPUWriteAccessor(ImageCPU& image) : pImage_(&image) {}

ImageCPUWriteAccessor::~ImageCPUWriteAccessor() = default;

PositionExtentInPixelSpace ImageCPUWriteAccessor::positionExtent() const { return pImage_->positionExtent(); }

PositionInPixelSpace ImageCPUWriteAccessor::position() const { return pImage_->position(); }

ExtentInPixelSpace ImageCPUWriteAccessor::extent() const { return pImage_->extent(); }

int ImageCPUWriteAccessor::physicalWidth() const { return pImage_->capacityExtent().width(); }

void ImageCPUWriteAccessor::writeRGBAFloatPixel4At(float4 pixel, int x, int y) {
    float const aRGBA[4] = {pixel[0], pixel[1], pixel[2], pixel[3]};
    ImageRuntime::Internal::writePixelRun(*pImage_, x, y, 1, aRGBA);
}

ImageCPU& ImageCPUWriteAccessor::image() const { return *pImage_; }

} // namespace ORVO
