#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/spaces/PositionExtentInPixelSpace.h"

#include <cstddef>

namespace ORVO {
class ImageCPU;
class ImageReadAccessor;
class ImageWriteAccessor;
} // namespace ORVO

namespace ORVO::ImageFlow::bilateral {

/// Rows of a source as RGBA floats, cut to a rectangle; pixels outside the source are transparent black.
///
/// Threads: isConcurrent() tells whether several threads may read at once.
class ORVO_API RowSource {
public:
    /// @param source borrowed. @param rectangle what is read of it, in pixel space.
    /// @throws InternalException "Invalid input image type" if an image of the library is to be read whose
    /// format
    ///         accessors do not serve.
    RowSource(ImageReadAccessor const& source, PositionExtentInPixelSpace const& rectangle);

    /// Whether the source is an image of the library.
    bool isConcurrent() const { return pImage_ != nullptr; }
    /// The pixels of a row, counted from the top of the rectangle: in the image itself, or put into the given
    /// buffer of four floats a pixel.
    float const* row(std::size_t row, float* pBuffer) const;

private:
    ImageReadAccessor const& oSource_;
    ImageCPU const* pImage_;
    PositionExtentInPixelSpace oRectangle_;
    int nBeginX_; ///< the columns that the source has, in pixel space
    int nEndX_;
    long long nBeginY_;
    long long nEndY_;
    bool bDirect_; ///< rows are RGBA floats of the whole width
};

/// Rows of RGBA floats that go to a destination.
///
/// Threads: isConcurrent() tells whether several threads may write, disjoint rows, at once.
class ORVO_API RowTarget {
public:
    /// @param destination borrowed; all of its rectangle is written.
    /// @throws InternalException "Invalid input image type" if it is an image of the library whose format
    /// accessors do
    ///         not serve and it has pixels.
    explicit RowTarget(ImageWriteAccessor& destination);

    bool isConcurrent() const { return pImage_ != nullptr; }
    /// Whether rowBuffer() gives rows of the image itself, into which pixels go clamped to 0..1.
    bool isDirect() const { return bDirect_; }
    /// Whether such rows are better written past the caches.
    bool prefersStreaming() const { return bStream_; }
    /// Where to put a row: into the image itself, or into the given buffer of four floats a pixel.
    float* rowBuffer(std::size_t row, float* pBuffer) const;
    /// Hands on a row that was put where rowBuffer() said.
    void finishRow(std::size_t row, float const* pRow) const;

private:
    ImageWriteAccessor& oDestination_;
    ImageCPU* pImage_;
    PositionExtentInPixelSpace oRectangle_;
    bool bDirect_;
    bool bStream_;
};

} // namespace ORVO::ImageFlow::bilateral
