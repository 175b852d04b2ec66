#pragma once

#include "orvo/core/spaces/ExtentInPixelSpace.h"
#include "orvo/ogl/Buffer.h"

#include <memory>

namespace ORVO::ImageFlow::bilateral {

/// A buffer object with a few floats for each pixel of a rectangle, row by row.
///
/// Threads: as OGL::Buffer.
class PixelBuffer {
public:
    /// @param extent the rectangle's size in pixels.
    /// @param nFloats floats a pixel.
    /// @param pData the contents, copied; null leaves them undefined.
    /// @throws OGL::ExceptionOGL.
    PixelBuffer(ExtentInPixelSpace const& extent, unsigned nFloats, float const* pData,
                OGL::Buffer::Usage usage);

    /// For each pixel its column and its row, as floats.
    static std::unique_ptr<PixelBuffer> ofPositions(ExtentInPixelSpace const& extent);

    /// Whether the buffer serves frames of this size in the context that is current.
    bool serves(ExtentInPixelSpace const& extent) noexcept;

    unsigned objectID() const { return oBuffer_.objectID(); }

private:
    ExtentInPixelSpace oExtent_;
    OGL::Buffer oBuffer_;
};

} // namespace ORVO::ImageFlow::bilateral
