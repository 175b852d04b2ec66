#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_runtime/images/ImageReadAccessor.h"

namespace ORVO {

class ImageCPU;

/// Reads single pixels of an ImageCPU, which it does not own and which has to outlive it.
/// For whole rows use ImageRuntime::readRowAsRGBAFloat(), which recognises this class.
///
/// Threads: holds nothing but the image; one accessor may be shared by any number of threads.
class ORVO_API ImageCPUReadAccessor : public ImageReadAccessor {
public:
    explicit ImageCPUReadAccessor(ImageCPU const& image);
    ~ImageCPUReadAccessor() override;

    PositionExtentInPixelSpace positionExtent() const override;
    PositionInPixelSpace position() const override;
    ExtentInPixelSpace extent() const override;
    int physicalWidth() const override;

    /// The pixel at the pixel-space coordinates (x, y), without a test of bounds: 8-bit channels divided by
    /// 255, halves and floats as stored, alpha 1.0 where the format has none.
    /// @throws InternalException "Invalid input image type" for any format other than BGR8, BGRA8, RGB8,
    ///         RGBA8, RGB32F, RGBA32F, RGB16F and RGBA16F.
    float4 getRGBAFloat4PixelAt(int x, int y) const override;

    ImageCPU const& image() const;

private:
    ImageCPU const* pImage_;
};

} // namespace ORVO
