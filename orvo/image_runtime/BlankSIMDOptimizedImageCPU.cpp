#include "orvo/image_runtime/BlankSIMDOptimizedImageCPU.h"

#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/SharedPtr.h"

#include <cstdint>
#include <limits>
#include <memory>

namespace ORVO::ImageRuntime {

namespace {

struct Layout {
    ImageCPU::tePixelFormat eFormat;
    /// Pixels beyond the width that a vector loop may touch.
    int nSlack;
    /// Bytes that a row is a multiple of: whole pixels and whole lines of 64 bytes.
    int nRowBoundary;
};

Layout layoutOf(int channels) {
    switch (channels) {
    case 1:
        return {ImageCPU::PIXEL_FORMAT_LUMINANCE32F, 3, 64};
    case 2:
        return {ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F, 1, 64};
    case 3:
        return {ImageCPU::PIXEL_FORMAT_RGB32F, 1, 192};
    case 4:
        return {ImageCPU::PIXEL_FORMAT_RGBA32F, 0, 64};
    default:
        ORVO_FAIL("false");
    }
}

/// Pixels of a row: incrementToBoundary() over the bytes of width and slack, in 64 bits, since a row may be
/// longer than an int counts.
int capacityWidth(Layout const& layout, int width) {
    std::int64_t const nPixelBytes = static_cast<std::int64_t>(pixelSizeBytes(layout.eFormat));
    std::int64_t const nBytes = nPixelBytes * (static_cast<std::int64_t>(width) + layout.nSlack);
    std::int64_t const nRowBytes =
        (nBytes + layout.nRowBoundary - 1) / layout.nRowBoundary * layout.nRowBoundary;
    ORVO_CHECK_PARAMETER(nRowBytes <= std::numeric_limits<std::uint32_t>::max(),
                         "Image size exceeds 4294967295 bytes");
    return static_cast<int>(nRowBytes / nPixelBytes);
}

} // namespace

ImageCPU* getBlankSIMDOptimized32FFormat(int channels, ExtentInPixelSpace const& extent,
                                         PixelExtentInWorldSpace const& pixelExtent,
                                         PositionInPixelSpace const& position) {
    Layout const layout = layoutOf(channels);
    ORVO_CHECK_PARAMETER(extent.width() >= 0 && extent.height() >= 0,
                         "Image extent and capacity must not be negative");
    ExtentInPixelSpace const capacity(capacityWidth(layout, extent.width()), extent.height());
    std::unique_ptr<ImageCPU, ORVODeleter<ImageCPU>> pOutputImage(ORVO_NEW ImageCPU(
        layout.eFormat, PositionExtentInPixelSpace(position, extent), pixelExtent, capacity));
    ORVO_CHECK(pOutputImage->isInSIMDOptimizedFormat());
    return pOutputImage.release();
}

ImageCPU* getBlankSIMDOptimized32FFormat(ImageCPU::tePixelFormat ePixelFormat,
                                         ExtentInPixelSpace const& extent,
                                         PixelExtentInWorldSpace const& pixelExtent,
                                         PositionInPixelSpace const& position) {
    return getBlankSIMDOptimized32FFormat(static_cast<int>(nChannels(ePixelFormat)), extent, pixelExtent,
                                          position);
}

ImageCPU* getBlankSIMDOptimized32FFormat(ImageCPU const& image) {
    return getBlankSIMDOptimized32FFormat(image.pixelFormat(), image.extent(), image.pixelExtent(),
                                          image.position());
}

} // namespace ORVO::ImageRuntime
