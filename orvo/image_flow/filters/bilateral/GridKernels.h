#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_runtime/kernels/InstructionSet.h"

#include <cstddef>
#include <cstdint>

/// The inner loops of the fast bilateral filter. They work on planes of floats, one a channel: the channels
/// that are smoothed (luminance alone, or L, a, b), the first of which is the intensity, and alpha.
///
/// Of the grid, only levels that pixels can fall into or be interpolated from are kept behind the blur along
/// the intensity axis: the levels kFirstLevel .. depth - 3. A row of the grid holds a plane for each channel
/// and one for the weight; a plane holds, column by column, nLevels floats, of which the levels in use are
/// the first.
namespace ORVO::ImageFlow::bilateral {

/// Padding of the intensity axis: the level of the lowest intensity.
constexpr std::size_t kFirstLevel = 4;

/// Floats that a buffer given to a kernel has to hold beyond what its description says: kernels may read that
/// far.
constexpr std::size_t kSlack = 16;

/// The intensity axis and the layout of the grid.
struct GridLayout {
    float fValueMin;
    float fValueExtent;
    float fRangeStep;      ///< range sigma / value extent
    std::size_t nChannels; ///< 1 or 3, without the weight
    std::size_t nWidth;    ///< columns
    std::size_t nDepth;    ///< levels of the whole intensity axis, at least 8
    std::size_t nUsed;     ///< levels in use: nDepth - 6
    std::size_t nLevels;   ///< floats a column and plane: nUsed rounded up to a multiple of 8
};

/// Floats of a column and channel in the buffer that pixels are summed up in: a lead of 4 zeros, the whole
/// intensity axis, and zeros beyond it.
constexpr std::size_t splatStride(GridLayout const& layout) {
    return (4 + layout.nDepth + 12 + 15) / 16 * 16;
}
/// Floats of that buffer.
constexpr std::size_t splatFloats(GridLayout const& layout) {
    return layout.nWidth * (layout.nChannels + 1) * splatStride(layout) + kSlack;
}
/// Floats of the buffer between the blurs along the intensity axis and x: planes with 3 further columns at
/// either end.
constexpr std::size_t levelFloats(GridLayout const& layout) {
    return (layout.nWidth + 6) * (layout.nChannels + 1) * layout.nLevels + kSlack;
}
/// Floats of a plane of a row of the grid, and of a whole row.
constexpr std::size_t planeFloats(GridLayout const& layout) { return layout.nWidth * layout.nLevels; }
constexpr std::size_t rowFloats(GridLayout const& layout) {
    return planeFloats(layout) * (layout.nChannels + 1);
}

/// Summing up the pixels of the image rows nFirstRow .. nEndRow-1 into one row of the grid.
struct SplatJob {
    GridLayout const* pLayout;
    float const* apPlanes[3];
    std::size_t nPitch; ///< floats between the rows of a plane
    std::size_t nFirstRow;
    std::size_t nEndRow;
    std::size_t nColumns;          ///< pixels in a row
    std::uint32_t const* pColumns; ///< the grid column of each pixel of a row, ascending
    float* pCells;                 ///< splatFloats(), zeroed before the call
};

/// The blurs of one row of the grid along the intensity axis and x.
struct BlurJob {
    GridLayout const* pLayout;
    float const* pCells; ///< as filled by `splat`
    float* pLevels;      ///< levelFloats(), its outer columns zeroed before the call
    float* pRow;         ///< receives rowFloats()
};

/// The blur of one row of the grid along y, and the division of the channels by the weight.
struct DivideJob {
    GridLayout const* pLayout;
    float const* apRows[7]; ///< the rows y-3 .. y+3; null where there are no pixels
    float* pResult;         ///< receives a plane a channel, without the weight; 0 where the weight is 0
};

/// Reading back one row of pixels. The result must not overlap what is read.
struct SliceJob {
    GridLayout const* pLayout;
    float const* pUpper; ///< the divided rows of the grid above and below the pixels
    float const* pLower;
    float fFraction; ///< how far the pixels are from the upper row
    float* pBlended; ///< room for nChannels planes and kSlack
    std::size_t nPixels;
    std::int32_t const*
        pLevels; ///< of each pixel, where its left column begins in a plane; the right one follows
    std::uint32_t const* pEnds; ///< of each pixel, the first pixel behind those between the same columns
    float const* pFractions;    ///< of each pixel, how far it is from the left column
    float const* pIntensities;
    float* apResults[3]; ///< a row of each channel
};

/// One row of the direct filter.
struct DirectJob {
    float const* apPlanes[3];
    std::size_t nChannels;
    std::size_t nPixels; ///< of the whole image
    std::size_t nWidth;
    std::size_t nRow;
    int nRadiusX;
    int nRadiusY;
    float fRangeFactor;           ///< 1 / (2 rangeSigma^2)
    float const* pSpatialWeights; ///< at |dy| * (nRadiusX + 1) + |dx|
    float* apResults[3];          ///< a row of each plane
};

/// The lowest and highest intensity seen; NaN counts for neither.
struct ValueBounds {
    float fLowest;
    float fHighest;
};

/// How pixels are stored. Streaming bypasses the caches, where the row is aligned to 64 bytes.
struct StoreStyle {
    bool bClamp; ///< to 0..1; NaN stays
    bool bStream;
};

/// The kernels of one instruction set.
///
/// Threads: free of state; any thread.
struct GridKernels {
    /// Rows of n interleaved RGBA pixels, premultiplied and reduced to luminance and alpha; widens the
    /// bounds. Answers whether alpha is 1 throughout.
    bool (*luminanceFromRGBA)(float const* pRGBA, float* pLuminance, float* pAlpha, std::size_t n,
                              ValueBounds* pBounds);
    /// The same to L, a, b (apPlanes[0..2]) and alpha (apPlanes[3]).
    bool (*labFromRGBA)(float const* pRGBA, float* const* apPlanes, std::size_t n, ValueBounds* pBounds);
    void (*splat)(SplatJob const& job);
    void (*blur)(BlurJob const& job);
    void (*divide)(DivideJob const& job);
    void (*slice)(SliceJob const& job);
    void (*direct)(DirectJob const& job);
    /// Luminance, divided by alpha where that is not 0, to grey RGBA pixels.
    void (*greyFromLuminance)(float const* pLuminance, float const* pAlpha, float* pRGBA, std::size_t n,
                              StoreStyle style);
    /// The same for L, a, b and alpha.
    void (*rgbaFromLab)(float const* const* apPlanes, float* pRGBA, std::size_t n, StoreStyle style);
};

/// The kernels of a set other than PLAIN, for which PlainBilateralFilter stands.
/// @throws ParameterException "isSupported(eInstructionSet)" if the processor lacks the set, and
///         "eInstructionSet != InstructionSet::PLAIN".
ORVO_API GridKernels const& gridKernels(ImageRuntime::InstructionSet eInstructionSet);

} // namespace ORVO::ImageFlow::bilateral
