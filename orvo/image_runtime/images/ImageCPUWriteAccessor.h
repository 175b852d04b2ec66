#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_runtime/images/ImageWriteAccessor.h"

namespace ORVO {

class ImageCPU;

/// Writes single pixels of an ImageCPU, which it does not own and which has to outlive it.
/// For whole rows use ImageRuntime::writeRowFromRGBAFloat(), which recognises this class.
///
/// Threads: holds nothing but the image; one accessor may be shared by threads that write different pixels.
class ORVO_API ImageCPUWriteAccessor : public ImageWriteAccessor {
public:
    explicit ImageCPUWriteAccessor(ImageCPU& image);
    ~ImageCPUWriteAccessor() override;

    PositionExtentInPixelSpace positionExtent() const override;
    PositionInPixelSpace position() const override;
    ExtentInPixelSpace extent() const override;
    int physicalWidth() const override;

    /// Clamps the components to 0..1 (a NaN stays) and stores them at the pixel-space coordinates (x, y),
    /// without a test of bounds. An 8-bit channel becomes the truncation of the exact value * 255.0, NaN
    /// becoming 0; halves and floats are stored as clamped. Alpha is dropped where the format has none.
    /// @throws InternalException "Invalid input image type" for any format other than BGR8, BGRA8, RGB8,
    ///         RGBA8, RGB32F, RGBA32F, RGB16F and RGBA16F.
    void writeRGBAFloatPixel4At(float4 pixel, int x, int y) override;

    ImageCPU& image() const;

private:
    ImageCPU* pImage_;
};

} // namespace ORVO
