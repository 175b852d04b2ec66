#include "orvo/filter_graph/impl/ImageCPU.h"

#include "orvo/core/Check.h"
#include "orvo/core/utility/SharedPtr.h"
#include "orvo/filter_graph/internal/ImageAccessor.h"
#include "orvo/image_runtime/images/ImageCPU.h"

#include <limits>
#include <memory>
#include <utility>

namespace ORVO::FilterGraph {

namespace {

std::size_t checkedPitch(int paddedWidthInBytes) {
    ORVO_CHECK_PARAMETER(paddedWidthInBytes >= 0);
    return static_cast<std::size_t>(paddedWidthInBytes);
}

} // namespace

ImageCPU::ImageCPU(ImageDescriptorCPU const& descriptor) : ImageBase(descriptor) {}

ImageCPU::ImageCPU(ImageDescriptorCPU const& descriptor, PositionExtentInPixelSpace const& rect,
                   unsigned char const* pixels, int paddedWidthInBytes)
    : ImageBase(descriptor, rect) {
    createImage(pixels, checkedPitch(paddedWidthInBytes));
}

ImageCPU::~ImageCPU() = default;

void ImageCPU::setPixelStorage(unsigned char* pixels, std::size_t paddedWidthInBytes) {
    createImage(pixels, paddedWidthInBytes);
}

void ImageCPU::createImage(unsigned char const* pixels, std::size_t paddedWidthInBytes) {
    ImageDescriptor::Format const& format = imageDescriptor().format();
    if (paddedWidthInBytes == 0)
        paddedWidthInBytes = width() * numBytesPerPixel();
    auto const ePixelFormat =
        Internal::ImageAccessor::mapDescriptorToCPUPixelFormat(format.nChannel, format.channelType);

    std::shared_ptr<ORVO::ImageBase> pImage;
    if (pixels) {
        ORVO_CHECK_PARAMETER(paddedWidthInBytes >= width() * numBytesPerPixel(),
                             "paddedWidthInBytes >= width()* numBytesPerPixel()");
        // The pitch of a runtime image is a number of pixels: a rest that is no whole pixel is cut off.
        std::size_t const capacityWidth = paddedWidthInBytes / numBytesPerPixel();
        ORVO_CHECK_PARAMETER(capacityWidth <= static_cast<std::size_t>(std::numeric_limits<int>::max()),
                             "paddedWidthInBytes / numBytesPerPixel() <= 2147483647");
        ExtentInPixelSpace const capacity(static_cast<int>(capacityWidth), static_cast<int>(height()));
        pImage.reset(
            ORVO_NEW ORVO::ImageCPU(ePixelFormat, pixels, rect(), imageDescriptor().pixelExtent(), capacity),
            ORVODeleter<ORVO::ImageBase>());
    }
    setWrappedImage(std::move(pImage));
    nPaddedWidthInBytes_ = paddedWidthInBytes;
}

unsigned char* ImageCPU::getPixelStorage() {
    auto* pImage = Internal::ImageAccessor::getImpl<ORVO::ImageCPU>(this);
    return pImage ? pImage->pixels() : nullptr;
}

unsigned char const* ImageCPU::getPixelStorage() const {
    auto const* pImage = Internal::ImageAccessor::getImpl<ORVO::ImageCPU>(this);
    return pImage ? pImage->pixels() : nullptr;
}

bool ImageCPU::isInSIMDOptimizedFormat() const {
    auto const* pImage = Internal::ImageAccessor::getImpl<ORVO::ImageCPU>(this);
    ORVO_ENFORCE(pImage, "pImage_");
    return pImage->isInSIMDOptimizedFormat();
}

void ImageCPU::clear() {
    if (ORVO::ImageBase* pImage = wrappedImage())
        pImage->initializeToTransparentBlack();
}

} // namespace ORVO::FilterGraph
