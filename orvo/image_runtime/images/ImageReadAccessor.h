#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/math/Float.h"
#include "orvo/image_runtime/images/ImageAccessorBase.h"

namespace ORVO {

/// Reads single pixels as RGBA floats.
///
/// Threads: as ImageAccessorBase.
class ORVO_API ImageReadAccessor : public virtual ImageAccessorBase {
public:
    /// The pixel at the pixel-space coordinates (x, y), as R, G, B, A; 8-bit channels are scaled to 0..1.
    virtual float4 getRGBAFloat4PixelAt(int x, int y) const = 0;
    ~ImageReadAccessor() override;
};

} // namespace ORVO
