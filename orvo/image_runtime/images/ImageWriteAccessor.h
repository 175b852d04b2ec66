#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/math/Float.h"
#include "orvo/image_runtime/images/ImageAccessorBase.h"

namespace ORVO {

/// Writes single pixels from RGBA floats.
///
/// Threads: as ImageAccessorBase.
class ORVO_API ImageWriteAccessor : public virtual ImageAccessorBase {
public:
    /// Writes the pixel at the pixel-space coordinates (x, y) from R, G, B, A in 0..1.
    virtual void writeRGBAFloatPixel4At(float4 pixel, int x, int y) = 0;
    ~ImageWriteAccessor() override;
};

} // namespace ORVO
