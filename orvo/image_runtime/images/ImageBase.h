#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/TargetPlatform.h"
#include "orvo/core/spaces/ExtentInPixelSpace.h"
#include "orvo/core/spaces/PixelExtentInWorldSpace.h"
#include "orvo/core/spaces/PositionExtentInPixelSpace.h"
#include "orvo/core/spaces/PositionInPixelSpace.h"

#include <cstddef>
#include <iosfwd>

namespace ORVO {

/// What every image is, wherever its pixels live: a rectangle of meaningful pixels in pixel space, tied to
/// world space by the size of one pixel.
///
/// The pixel at row r and column c of the rectangle has the pixel-space coordinates (position.x + c,
/// position.y + r); positions may be negative. A world position is a pixel-space position times the pixel
/// extent.
///
/// Threads: an image has no lock. Any number of threads may read one image; writing it, or changing its pixel
/// extent, asks for the caller's own order, except that threads may write disjoint rows.
class ORVO_API ImageBase {
public:
    /// An empty rectangle at the origin with pixels of 1.0 by 1.0.
    ImageBase();
    /// @param positionExtent the rectangle of meaningful pixels, in pixel space.
    /// @param pixelExtent the world size of one pixel; width and height have to be positive.
    /// @throws InternalException "pixelExtent.pixelExtent().extentAsFloat2().x > 0" if either is not.
    ImageBase(PositionExtentInPixelSpace const& positionExtent, PixelExtentInWorldSpace const& pixelExtent);
    virtual ~ImageBase();

    /// Width and height of the storage in pixels; the width is the row pitch.
    virtual ExtentInPixelSpace capacityExtent() const = 0;
    /// Sets every channel of the storage to zero.
    virtual void initializeToTransparentBlack() = 0;
    /// Writes a description of the image, a line for each property, without its pixels.
    virtual void doWrite(std::ostream& stream) const;

    ExtentInPixelSpace const& extent() const;
    PositionInPixelSpace const& position() const;
    PositionExtentInPixelSpace const& positionExtent() const;
    PixelExtentInWorldSpace pixelExtent() const;
    /// Ties the image to world space anew. The pixels stay as they are.
    void setPixelExtent(PixelExtentInWorldSpace const& pixelExtent);
    /// Width times height of the extent. The product is taken in 32 bits.
    std::size_t numberOfPixels() const;
    /// Where the pixels live.
    TargetPlatform targetPlatform() const;

protected:
    ImageBase(ImageBase const&) = default;
    ImageBase& operator=(ImageBase const&) = default;

    PositionExtentInPixelSpace oPositionExtent_;
    PixelExtentInWorldSpace oPixelExtent_;
    /// Set by the constructor of the derived class.
    TargetPlatform eTargetPlatform_;
};

} // namespace ORVO
