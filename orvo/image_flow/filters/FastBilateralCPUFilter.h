#pragma once

#include "orvo/core/Export.h"

#include <cstddef>

namespace ORVO {

class ImageReadAccessor;
class ImageWriteAccessor;

namespace ImageFlow::bilateral {
class BandRunner;
}

/// An edge-preserving smoother by the bilateral grid: the image is splatted into a coarse grid of x, y and
/// intensity (one cell a sigma), the grid is blurred with a small separable kernel, and every pixel reads its
/// result back by linear interpolation. (The method is that of Chen, Paris and Durand, "Real-time edge-aware
/// image processing with the bilateral grid", 2007, with homogeneous cells as in Paris and Durand, 2006.) A
/// direct filter, pixel by pixel, takes over where the grid would be too large or the sigmas too small for
/// it.
///
/// In colorize mode the work is done in the scaled Lab space (see lab/LabTransform.h), with L as the
/// intensity; else the image is reduced to its luminance 0.39 r + 0.5 g + 0.11 b and the result is grey.
/// Colours are premultiplied by alpha before the work and divided by it at the end, where it is not 0.
///
/// The intensity axis is 0..1 for images whose intensities all lie there, and is fitted to the image
/// otherwise. Where all intensities are equal and outside 0..1 there is nothing to smooth: the working image
/// is written as it is. Intensities that are NaN fall into the outermost cell and stay NaN; they do not
/// disturb other pixels.
///
/// The library's own accessors are recognised and read and written row by row; any other accessor is asked
/// pixel by pixel, on the calling thread alone.
///
/// Results do not depend on the number of threads: each row of the grid is summed up by one thread, in order.
///
/// Threads: an object serves one call at a time, since its fields hold the state of the call.
class ORVO_API FastBilateralCPUFilter {
public:
    FastBilateralCPUFilter();
    FastBilateralCPUFilter(FastBilateralCPUFilter const& other) = default;
    FastBilateralCPUFilter& operator=(FastBilateralCPUFilter const& other) = default;
    virtual ~FastBilateralCPUFilter();

    /// Fills every pixel of the destination's rectangle, on the calling thread. Pixels outside the source's
    /// rectangle count as transparent black. Source and destination may be the same image: all is read before
    /// any is written.
    /// @param source the image to smooth. Borrowed for the call.
    /// @param destination where the result goes. Borrowed for the call.
    /// @param rangeSigma in units of intensity. At or below 0.05, or NaN, the image passes unsmoothed.
    /// @param sigmaX, sigmaY in pixels. Where 2.146 sigma is at most 1 and the direct filter runs, or where a
    /// sigma is NaN or negative, the image passes unsmoothed. The direct filter reaches no further than 4096
    /// pixels.
    /// @param colorize true to smooth L, a and b; false for a grey result.
    /// @return true, or false if the callback stopped the work; rows written by then stay written.
    /// @throws InternalException "Enforce source != NULL", "Enforce destination != NULL", and "Invalid input
    /// image type" where an accessor of the library stands on a format that it does not serve;
    /// ParameterException where a channel of the destination in floats takes 4 GiB or more. Nothing was
    /// written then. std::bad_alloc; exceptions of a caller's own accessor pass through.
    bool applyFilter(ImageReadAccessor* source, ImageWriteAccessor* destination, float rangeSigma,
                     float sigmaX, float sigmaY, bool colorize);

    /// As above, with bands of rows handed to a runner, which may work on them on several threads at once.
    /// While a callback is registered, or for accessors that are not the library's, all work stays on the
    /// calling thread.
    /// @param runner borrowed for the call.
    /// @return false also if the runner was stopped before it had run all bands.
    bool applyFilter(ImageReadAccessor* source, ImageWriteAccessor* destination, float rangeSigma,
                     float sigmaX, float sigmaY, bool colorize, ImageFlow::bilateral::BandRunner& runner);

    /// Registers a function that is asked on the calling thread after each row, in order: after the rows of
    /// the conversion, of the filling of the grid, of each of the three blurs (rows of the grid for the
    /// first, columns of the grid for the other two) and of the direct filter. Reading back and writing ask
    /// nobody. Answering false ends the work. Without colorize the grid road counts the rows of the
    /// conversion twice.
    /// @param callback replaces the one before; null as resetProcessingCallback(). @param data its argument,
    /// not owned.
    void registerProcessingCallback(bool (*callback)(void*), void* data);
    void resetProcessingCallback();

private:
    struct Call;

    void applyByRows(Call& call);
    bool gridServes() const;
    /// Runs rows in bands and asks the callback as often as told after each; without a callback the runner
    /// runs them.
    template <class Body, class Asks>
    void runRows(ImageFlow::bilateral::BandRunner& runner, std::size_t nRows, std::size_t nRowsPerBand,
                 std::size_t nPixelsPerRow, Body const& body, Asks const& asks) const;
    void askCallback(std::size_t nTimes) const;

    void convertToLuminance(Call& call);
    void convertToLAB(Call& call);
    template <class ConvertRow>
    void convertRows(Call& call, ConvertRow const& convertRow);
    void layOutGrid(Call& call) const;
    void constructDownsampled3DGrid(Call& call) const;
    void blurGridAlongY(Call& call) const;
    void sliceGridRow(Call const& call, std::size_t row, float* pBlended, float* const* apResults) const;
    void applyBruteForceFilter(Call& call) const;
    void writeImage(Call& call, bool bSlice) const;

    float fPaddingXY_;
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

} // namespace ORVO
