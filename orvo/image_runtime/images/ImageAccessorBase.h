#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/spaces/ExtentInPixelSpace.h"
#include "orvo/core/spaces/PositionExtentInPixelSpace.h"
#include "orvo/core/spaces/PositionInPixelSpace.h"

namespace ORVO {

/// What a reader and a writer of single pixels have in common: the geometry of the image behind them.
/// Algorithms written against ImageReadAccessor and ImageWriteAccessor serve any pixel format, and any image
/// that a caller presents through accessors of its own.
///
/// Threads: implementations are asked by several threads at once, for different rows, and need to allow that.
class ORVO_API ImageAccessorBase {
public:
    /// The rectangle of meaningful pixels, in pixel space.
    virtual PositionExtentInPixelSpace positionExtent() const = 0;
    virtual PositionInPixelSpace position() const = 0;
    virtual ExtentInPixelSpace extent() const = 0;
    /// The row pitch in pixels.
    virtual int physicalWidth() const = 0;
    virtual ~ImageAccessorBase();
};

} // namespace ORVO
