#pragma once

#include "orvo/core/Export.h"

#include <cstddef>
#include <vector>

namespace ORVO {
class ImageCPU;
class PositionExtentInPixelSpace;
} // namespace ORVO

namespace ORVO::ImageFlow::bilateral {

/// The rows of an image around the one that the simple bilateral filter is working on, laid out as SimpleJob
/// asks for.
///
/// Which pixel a neighbour is: its column and row, counted from the corner of the image, are compared with
/// the width and the height as unsigned numbers, of which the smaller counts: a column left of the image
/// counts as the width. The pixel is then the one number row * width + column in the image, or the last one
/// beyond it. In an image without pixels all are transparent black.
///
/// Threads: one window a thread.
class ORVO_API SimpleWindow {
public:
    /// @param image borrowed. @param region where the results are, in pixel space; it may lie outside the
    /// image. @param nHalf how far the window reaches.
    SimpleWindow(ImageCPU const& image, PositionExtentInPixelSpace const& region, int nHalf);

    /// Moves on to a row, counted from the top of the region. Going down one row reads one row.
    /// @throws InternalException "Invalid input image type" for formats that accessors do not serve, if the
    /// image has pixels.
    void moveTo(std::size_t row);

    /// The rows of the current window, 2 nHalf + 1 of them.
    float const* const* rows() const { return apRows_.data(); }
    /// The pixels of the current row themselves; transparent black outside the image.
    float const* centres() const { return aCentres_.data(); }
    /// Floats between the planes of a row.
    std::size_t pitch() const { return nPitch_; }

private:
    float const* rowAt(long long row);
    void fillRow(float* pRow, long long row);
    void fillCentres(float const* pRow, long long row);
    void setPixel(float* pRow, std::size_t column, float const* pRGBA) const;
    void readPixel(long long column, long long row, float* pRGBA) const;

    ImageCPU const& oImage_;
    long long nHalf_;
    long long nWidth_;   ///< of the image
    long long nHeight_;  ///< of the image
    long long nColumns_; ///< of a row: those of the region and nHalf_ at either side
    long long iColumn_;  ///< the first of them, counted from the left of the image
    long long iTop_;     ///< the top of the region, counted from the top of the image
    std::size_t nPitch_;
    long long nSlots_;                 ///< rows of the image that are held
    std::vector<float> aRows_;         ///< row r of the image stands in slot r % nSlots_
    std::vector<long long> aSlotRows_; ///< the row in each slot; -1 for none
    std::vector<float> aBeyond_;       ///< stands for all rows outside the image; empty until needed
    std::vector<float> aCentres_;
    std::vector<float> aPixels_; ///< a row of the image as it is read
    std::vector<float const*> apRows_;
};

} // namespace ORVO::ImageFlow::bilateral
