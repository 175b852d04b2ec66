#pragma once

#include "orvo/core/Export.h"

#include <cstddef>
#include <vector>

namespace ORVO {
class ImageCPU;
class PositionExtentInPixelSpace;
} // namespace ORVO

namespace ORVO::ImageFlow::bilateral {

/// The half window of the simple bilateral filter is bounded, so that a sigma far beyond its interval does
/// not keep it busy for ever.
constexpr int kMaximalHalfWindow = 4096;

/// trunc(ceil(2.146 spatialSigma)) / 2, between 0 and kMaximalHalfWindow; 0 for NaN.
ORVO_API int halfWindowOf(float spatialSigma);

/// The direct bilateral filter with the weights of its window.
///
/// Threads: immutable after construction.
class ORVO_API SimpleBilateral {
public:
    /// @param spatialSigma in pixels. With 0 the weights are NaN, and so are the results; below 0 the window
    /// is the pixel alone. @param rangeSigma in units of intensity.
    SimpleBilateral(float spatialSigma, float rangeSigma, bool bColorize);

    /// Filters rows begin up to, but not including, end of a region from one image into another, which holds
    /// all of the region, with the kernel of the active instruction set. See SimpleWindow for the neighbours.
    /// @param region in pixel space; rows are counted from its top.
    /// @throws InternalException "Invalid input image type" for formats that accessors do not serve.
    void filterRows(ImageCPU const& input, ImageCPU& output, PositionExtentInPixelSpace const& region,
                    std::size_t begin, std::size_t end) const;

private:
    float fRangeSigma_;
    bool bColorize_;
    int nHalf_;
    std::vector<float> aSpatialWeights_; ///< at |i| * (nHalf_ + 1) + |j|
};

} // namespace ORVO::ImageFlow::bilateral
