#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_runtime/images/PixelStructures.h"

#include <cstddef>
#include <memory>

namespace ORVO {
class ImageCPU;
class ImageReadAccessor;
class ImageWriteAccessor;
} // namespace ORVO

namespace ORVO::ImageFlow::bilateral {

/// The fast bilateral filter written down plainly: scalar floats, one thread, pixel by pixel through the
/// accessors. It defines the results of FastBilateralCPUFilter, runs in its place where the portable
/// instruction set was chosen, and is what tests and benchmarks compare with.
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

    void runPhases(ImageReadAccessor const& source, ImageWriteAccessor& destination);
    bool gridServes() const;
    void askCallback() const;
    void finishValueRange(float lowest, float highest);

    void convertToLuminance(ImageReadAccessor const& source, ImageCPU& working);
    void convertToLAB(ImageReadAccessor const& source, ImageCPU& working);

    ImagePointer constructDownsampled3DGrid(ImageCPU const& working) const;
    ImagePointer constructDownsampled3DGridLAB(ImageCPU const& working) const;
    ImagePointer makeGrid(ImageCPU const& working) const;
    template <class Pixel>
    ImagePointer blurGrid(ImagePointer const& spGrid) const;
    template <class Pixel>
    void blurLine(ImageCPU const& source, ImageCPU& destination, std::size_t first, std::size_t step,
                  std::size_t count) const;

    void sliceGridAndLumaImage(ImageCPU const& grid, ImageCPU& working) const;
    void sliceGridAndLABImage(ImageCPU const& grid, ImageCPU& working) const;
    template <class Pixel>
    Pixel sampleCube(ImageCPU const& grid, std::size_t px, std::size_t py, float value) const;

    ImagePointer applyBruteForceFilterLuminance(ImageCPU const& working) const;
    ImagePointer applyBruteForceFilterLAB(ImageCPU const& working) const;
    /// What both share: `average` makes a pixel of the result from its centre and a function that visits the
    /// taps around it, each with the square of its distance.
    template <class Pixel, class Average>
    ImagePointer filterDirectly(ImageCPU const& working, Average const& average) const;

    void writeLuminanceImage(ImageCPU const& working, ImageWriteAccessor& destination) const;
    void convertToRGB(ImageCPU const& working, ImageWriteAccessor& destination) const;

    std::size_t cellIndex(std::size_t x, std::size_t y, std::size_t z) const;
    std::size_t cellX(std::size_t px) const;
    std::size_t cellY(std::size_t py) const;
    std::size_t cellZ(float value) const;
    float rangeStep() const;
    PixelLuminanceAlpha32F sample3DGrid(PixelLuminanceAlpha32F const* pGrid, std::size_t index) const;
    PixelRGBA32F sample3DGrid(PixelRGBA32F const* pGrid, std::size_t index) const;
    PixelLuminanceAlpha32F sample3DGridAndDivide(PixelLuminanceAlpha32F const* pGrid,
                                                 std::size_t index) const;
    PixelRGBA32F sample3DGridAndDivide(PixelRGBA32F const* pGrid, std::size_t index) const;
    void setResultInGrid(PixelLuminanceAlpha32F* pGrid, std::size_t index,
                         PixelLuminanceAlpha32F const& result) const;
    void setResultInGrid(PixelRGBA32F* pGrid, std::size_t index, PixelRGBA32F const& result) const;

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
