#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/math/Float.h"

#include <cstddef>
#include <vector>

namespace ORVO {
class ImageCPU;
}

namespace ORVO::ImageFlow::bilateral {

/// The half window of the simple bilateral filter is bounded, so that a sigma far beyond its interval does
/// not keep it busy for ever.
constexpr int kMaximalHalfWindow = 4096;

/// The rows of an image around the one that is being worked on, as RGBA floats.
///
/// Threads: one window a thread.
class ORVO_API PixelWindow {
public:
    /// @param image borrowed. @param nHalf how many rows are read above and below.
    PixelWindow(ImageCPU const& image, int nHalf);

    /// Moves on to the row at y, in pixel space. Going down one row reads one row.
    /// @throws InternalException "Invalid input image type" for formats that accessors do not serve, if the
    /// image has
    ///         pixels.
    void moveTo(int y);

    /// The pixel of the current row at x, in pixel space; transparent black outside the image.
    float4 centreAt(int x) const;

    /// The neighbour of (x, current row) at a distance. Its column and row are compared with the width and
    /// the height as unsigned numbers, of which the smaller counts: a column left of the image counts as the
    /// width. The pixel is then the one number row * width + column in the image, or the last one beyond it.
    float4 neighbourAt(int x, int dx, int dy) const;

private:
    float const* cachedRow(long long row) const;
    void cacheRow(long long row);

    ImageCPU const& oImage_;
    long long nHalf_;
    long long nWidth_;
    long long nHeight_;
    long long nSlots_; ///< rows that are held: one more than the window, for the pixel beyond the right edge
    long long iRow_;   ///< the current row, counted from the top of the image
    std::vector<float> aRows_;         ///< row r stands in slot r % nSlots_
    std::vector<long long> aSlotRows_; ///< the row in each slot; -1 for none
    float4 oLastPixel_;
    bool bHasLastPixel_;
};

/// The direct bilateral filter at one pixel, with the weights of its window.
///
/// Threads: immutable after construction.
class ORVO_API SimpleBilateral {
public:
    /// @param spatialSigma in pixels. With 0 the weights are NaN, and so are the results; below 0 and for NaN
    /// the window
    ///        is the pixel alone. @param rangeSigma in units of intensity.
    SimpleBilateral(float spatialSigma, float rangeSigma, bool bColorize);

    /// trunc(ceil(2.146 spatialSigma)) / 2, between 0 and kMaximalHalfWindow.
    int halfWindow() const { return nHalf_; }

    /// The result at x in the window's current row, with an alpha of 0.
    float4 resultAt(PixelWindow const& window, int x) const;

private:
    float fRangeSigma_;
    bool bColorize_;
    int nHalf_;
    std::vector<float> aSpatialWeights_; ///< at |i| * (nHalf_ + 1) + |j|
};

} // namespace ORVO::ImageFlow::bilateral
