#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_runtime/images/PixelStructures.h"

#include <cstddef>
#include <memory>
#include <vector>

namespace ORVO {
class ImageCPU;
class ImageReadAccessor;
class ImageWriteAccessor;
} // namespace ORVO

namespace ORVO::ImageFlow::bilateral {

class RowSource;

/// The fast bilateral filter written down plainly, as an ordinary scalar program: one thread, row by row and
/// pixel by pixel. It defines the results of FastBilateralCPUFilter, runs in its place where the portable
/// instruction set was chosen, and is what tests and benchmarks compare with. What does not depend on the
/// pixel is worked out once, so that the comparison is a fair one: the columns of the grid once a call, the
/// quotients of its cells once a cell.
///
/// A grid is an image of nGridWidth_ * nGridDepth_ by nGridHeight_ pixels; the cell (x, y, z) is the pixel
/// (y * nGridDepth_ + z) * nGridWidth_ + x, holding the sums of the channels and, as the last channel, the
/// number of pixels (the weight).
///
/// Threads: an object serves one call at a time.
class ORVO_API PlainBilateralFilter {
public:
    /// Asked after each row; see FastBilateralCPUFilter::registerProcessingCallback(). Null asks nobody.
    PlainBilateralFilter(bool (*pfnCallback)(void*), void* pCallbackData);

    /// As FastBilateralCPUFilter::applyFilter(); both pointers must not be null.
    bool applyFilter(ImageReadAccessor const& source, ImageWriteAccessor& destination, float rangeSigma,
                     float sigmaX, float sigmaY, bool colorize);

private:
    using ImagePointer = std::shared_ptr<ImageCPU>;

    /// The two cells of an axis that something stands between, and how far it is from the first.
    struct Place {
        std::size_t nFirst;
        std::size_t nSecond;
        float fFraction;
    };

    void runPhases(RowSource const& source, ImageWriteAccessor& destination);
    bool gridServes() const;
    void askCallback(std::size_t nTimes = 1) const;

    void convertToLuminance(RowSource const& source, ImageCPU& working);
    void convertToLAB(RowSource const& source, ImageCPU& working);
    template <class Pixel, class Convert>
    void convertRows(RowSource const& source, ImageCPU& working, Convert const& convert);

    ImagePointer constructDownsampled3DGrid(ImageCPU const& working) const;
    ImagePointer constructDownsampled3DGridLAB(ImageCPU const& working) const;
    template <class Pixel, class Summand>
    ImagePointer constructGrid(ImageCPU const& working, Summand const& summandOf) const;
    ImagePointer makeGrid(ImageCPU const& working) const;
    template <class Pixel>
    ImagePointer blurGrid(ImagePointer const& spGrid) const;

    void sliceGridAndLumaImage(ImageCPU& grid, ImageCPU& working) const;
    void sliceGridAndLABImage(ImageCPU& grid, ImageCPU& working) const;
    template <class Pixel, class Store>
    void sliceGrid(ImageCPU& grid, ImageCPU& working, Store const& store) const;

    ImagePointer applyBruteForceFilterLuminance(ImageCPU const& working) const;
    ImagePointer applyBruteForceFilterLAB(ImageCPU const& working) const;
    /// What both share: `average` makes a pixel of the result from its centre and a function that visits the
    /// taps around it, each with the square of its distance.
    template <class Pixel, class Average>
    ImagePointer filterDirectly(ImageCPU const& working, Average const& average) const;

    void writeLuminanceImage(ImageCPU const& working, ImageWriteAccessor& destination) const;
    void convertToRGB(ImageCPU const& working, ImageWriteAccessor& destination) const;

    std::size_t cellIndex(std::size_t x, std::size_t y, std::size_t z) const {
        return (y * nGridDepth_ + z) * nGridWidth_ + x;
    }

    float fPaddingXY_;
    float fPaddingZ_;
    float fGridOffset_;
    std::size_t nGridHeight_;
    std::size_t nGridWidth_;
    std::size_t nGridDepth_;
    bool (*pfnCallback_)(void*);
    void* pCallbackData_;
    float fRangeSigma_;
    float fSigmaX_;
    float fSigmaY_;
    bool bColorize_;
    float fValueMin_;
    float fValueExtent_;
};

} // namespace ORVO::ImageFlow::bilateral
