#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/impl/ImageBase.h"
#include "orvo/filter_graph/impl/ImageDescriptorCPU.h"

#include <cstddef>

namespace ORVO::FilterGraph {

/// A client image in host memory. The handle does not own the memory: the host keeps it alive while the
/// handle has it.
///
///     std::vector<unsigned char> pixels(4 * width * height);
///     ImageDescriptor::Format const format = {4, ImageDescriptor::CHANNEL_TYPE_UINT8};
///     ImageDescriptorCPU const rgba8(format, PixelExtentInWorldSpace(1, 1));
///     PositionExtentInPixelSpace const rect(ExtentInPixelSpace(width, height));
///     ImageCPU image(rgba8, rect, pixels.data(), 0);
///
/// Rows stand one after the other, top row first, each `paddedWidthInBytes` long. That pitch should be a
/// whole number of pixels: a rest is cut off. The channels of a pixel are interleaved: grey; grey, alpha; R,
/// G, B; or R, G, B, A. Accepted channel types: `CHANNEL_TYPE_UINT8`, `CHANNEL_TYPE_UINT15_1`,
/// `CHANNEL_TYPE_UINT16` (read on the scale of the former) and `CHANNEL_TYPE_FLOAT32`.
///
/// Threads: as `ImageBase`.
class ORVO_API ImageCPU : public ImageBase {
public:
    /// No storage and no rectangle.
    explicit ImageCPU(ImageDescriptorCPU const& descriptor);

    /// The rectangle, and the storage as `setPixelStorage` takes it. The memory is written to if the image is
    /// bound to a sink or cleared, and only read otherwise.
    /// @throws ParameterException "paddedWidthInBytes >= 0" if it is negative; else as `setRect` and
    /// `setPixelStorage`.
    ImageCPU(ImageDescriptorCPU const& descriptor, PositionExtentInPixelSpace const& rect,
             unsigned char const* pixels, int paddedWidthInBytes);

    ImageCPU(ImageCPU const&) = default;
    ImageCPU& operator=(ImageCPU const&) = default;
    ~ImageCPU() override;

    /// Gives the handle the memory of `rect()`, or none with null. On an exception everything stays as it
    /// was.
    /// @param paddedWidthInBytes the bytes from one row to the next; 0 stands for rows without padding.
    /// @throws InternalException if images in host memory cannot have the descriptor's format.
    /// @throws InternalException "pixelExtent.pixelExtent().extentAsFloat2().x > 0" if the pixel extent is
    /// not positive.
    /// @throws ParameterException "paddedWidthInBytes >= width()* numBytesPerPixel()" if the pitch is smaller
    /// than a row, "paddedWidthInBytes / numBytesPerPixel() <= 2147483647" if it is out of all bounds, and
    /// "Image size exceeds 4294967295 bytes".
    void setPixelStorage(unsigned char* pixels, std::size_t paddedWidthInBytes);

    /// The first pixel of the storage, or null.
    unsigned char* getPixelStorage();
    unsigned char const* getPixelStorage() const;

    /// The bytes from one row to the next.
    std::size_t paddedWidthInBytes() const { return nPaddedWidthInBytes_; }

    /// Whether the storage is 32-bit float with storage and rows on 64-byte boundaries, so that no node needs
    /// a copy.
    /// @throws InternalException "Enforce pImage_ != NULL" without storage.
    bool isInSIMDOptimizedFormat() const;

    void clear() override;

private:
    void createImage(unsigned char const* pixels, std::size_t paddedWidthInBytes);

    std::size_t nPaddedWidthInBytes_ = 0;
};

} // namespace ORVO::FilterGraph
