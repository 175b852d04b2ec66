#include "orvo/image_flow/filters/bilateral/WorkingImage.h"

#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/SaturatingCast.h"
#include "orvo/core/utility/SharedPtr.h"
#include "orvo/image_runtime/images/ImageCPU.h"
#include "orvo/image_runtime/images/PixelStructures.h"

#include <utility>

namespace ORVO::ImageFlow::bilateral {

std::shared_ptr<ImageCPU> makeFloats(std::size_t nFloats, std::size_t nRows, float*& pFirst) {
    PositionExtentInPixelSpace const rectangle(
        ExtentInPixelSpace(saturatingCast<int>(nFloats), saturatingCast<int>(nRows)));
    std::shared_ptr<ImageCPU> spFloats(ORVO_NEW ImageCPU(ImageCPU::PIXEL_FORMAT_LUMINANCE32F, rectangle,
                                                         PixelExtentInWorldSpace(1.0F, 1.0F),
                                                         ExtentInPixelSpace()),
                                       ORVODeleter<ImageCPU>());
    pFirst = reinterpret_cast<float*>(spFloats->pixels());
    return spFloats;
}

WorkingImage::WorkingImage(std::size_t nWidth, std::size_t nHeight, std::size_t nChannels)
    : nWidth_(nWidth), nHeight_(nHeight), nChannels_(nChannels), apPlanes_{} {
    for (std::size_t channel = 0; channel <= nChannels_; ++channel) {
        aspPlanes_[channel] = makeFloats(nWidth_, nHeight_, apPlanes_[channel]);
    }
}

void WorkingImage::swapPlane(WorkingImage& other, std::size_t channel) {
    std::swap(aspPlanes_[channel], other.aspPlanes_[channel]);
    std::swap(apPlanes_[channel], other.apPlanes_[channel]);
}

} // namespace ORVO::ImageFlow::bilateral
