#include "orvo/image_runtime/images/ImageCPUReadAccessor.h"

#include "orvo/image_runtime/images/ImageCPU.h"
#include "orvo/image_runtime/kernels/PixelRuns.h"

namespace ORVO {

ImageCPUReadAccessor::ImageCPUReadAccessor(ImageCPU const& image) : pImage_(&image) {}

ImageCPUReadAccessor::~ImageCPUReadAccessor() = default;

PositionExtentInPixelSpace ImageCPUReadAccessor::positionExtent() const { return pImage_->positionExtent(); }

PositionInPixelSpace ImageCPUReadAccessor::position() const { return pImage_->position(); }

ExtentInPixelSpace ImageCPUReadAccessor::extent() const { return pImage_->extent(); }

int ImageCPUReadAccessor::physicalWidth() const { return pImage_->capacityExtent().width(); }

float4 ImageCPUReadAccessor::getRGBAFloat4PixelAt(int x, int y) const {
    float aRGBA[4];
    ImageRuntime::Internal::readPixelRun(*pImage_, x, y, 1, aRGBA);
    return float4(aRGBA[0], aRGBA[1], aRGBA[2], aRGBA[3]);
}

ImageCPU const& ImageCPUReadAccessor::image() const { return *pImage_; }

} // namespace ORVO
