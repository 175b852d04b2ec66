#pragma once

#include "orvo/core/spaces/PositionExtentInPixelSpace.h"

#include <cstddef>

namespace ORVO {

class ImageCPU;

/// Copies pixels between images in host memory, pixel (x, y) to pixel (x, y), and converts the channel type
/// and the order of the channels on the way. 8-bit integers are 0..255 and 16-bit integers 0..32768 for 0.0
/// to 1.0; numbers beyond that range saturate in an integer channel, NaN becomes 0, and values in between are
/// rounded to the nearest. Equal channel types are copied bit by bit.
///
/// Threads: free of state; disjoint rows may be copied by several threads at once.
class ImageRegionCopy {
public:
    /// A copy of `region` (pixels), as far as `source` covers it, into `destination`, which must contain all
    /// of it. Both images stay the caller's and must outlive the copy. Throws `ParameterException` "Source
    /// and bound output image differ in their channels" unless both have the same number of channels.
    ImageRegionCopy(ImageCPU const& source, ImageCPU& destination, PositionExtentInPixelSpace const& region);

    /// Copies the rows `begin` to `end` (exclusive), counted from the top of the region.
    void copyRows(std::size_t begin, std::size_t end) const;

private:
    ImageCPU const& source_;
    ImageCPU& destination_;
    PositionExtentInPixelSpace oRegion_;
    int nBeginX_;
    int nEndX_;
    int nBeginY_;
    int nEndY_;
};

} // namespace ORVO
