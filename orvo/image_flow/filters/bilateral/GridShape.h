#pragma once

#include "orvo/core/Export.h"

#include <cstddef>

/// The geometry of the bilateral grid: how large it is, whether it serves, and into which cell a pixel falls.
/// One cell stands for one sigma.
///
/// Conversions from float saturate, and cells are clamped to the grid: numbers that are NaN or infinite never
/// point outside it.
///
/// Threads: free of state; any thread.
namespace ORVO::ImageFlow::bilateral {

/// exp(-d * d / 2) for a distance of d = 0, 1, 2, 3 cells.
constexpr float kBlurWeights[4] = {1.0F, 0.60653067F, 0.13533528F, 0.011108996F};

/// The radius of the direct filter is bounded, so that an infinite sigma does not keep it busy for ever.
constexpr int kMaximalRadius = 4096;

/// The intensity axis: its lowest value and its length.
struct ValueRange {
    float fMin;
    float fExtent;
};

/// 0 and 1 if all lies in 0..1, else fitted to the values.
ORVO_API ValueRange valueRange(float lowest, float highest);

/// trunc((size - 1) / sigma) + trunc(2 padding + offset): cells in x or y for a size in pixels of at least 1.
ORVO_API std::size_t cellsAlong(int size, float sigma, float padding, float offset);

/// trunc(1 / (rangeSigma / valueExtent)) + trunc(2 padding + offset): cells of the intensity axis.
ORVO_API std::size_t cellsInDepth(float rangeSigma, float valueExtent, float padding, float offset);

/// Whether the grid is small enough and the sigmas large enough for the grid; else the direct filter runs.
ORVO_API bool gridServesFor(std::size_t width, std::size_t height, std::size_t depth, float rangeSigma,
                            float sigmaX, float sigmaY);

/// A cell number brought to 0 .. count-1, truncated; NaN gives 0.
ORVO_API std::size_t clampedCell(float cell, std::size_t count);

/// The cell into which the pixel at an offset of `pixel` from the edge falls: the nearest one.
///
/// Worked out exactly, as `placeAlong` is, so that pixels a whole number of sigmas apart stand alike in their
/// cells: a picture computed in parts whose edges lie that far apart has no seams.
ORVO_API std::size_t cellAlong(std::size_t pixel, float sigma, float padding, float offset,
                               std::size_t count);

/// Where a pixel stands between the cells.
struct GridPlace {
    float fWhole;    ///< the cell at it or before it
    float fFraction; ///< how far it is from that cell towards the next, 0 to 1
};

/// The place of the pixel at an offset of `pixel` from the edge: pixel / sigma + offset + padding.
ORVO_API GridPlace placeAlong(std::size_t pixel, float sigma, float padding, float offset);

/// ceil(2.146 sigma), between 0 and kMaximalRadius: how far the direct filter reaches, in pixels.
ORVO_API int radiusOf(float sigma);

/// Whether the direct filter passes the image as it is: a range sigma of at most 0.05 or NaN, or a radius of
/// at most 1.
ORVO_API bool directFilterIsIdentity(float rangeSigma, float sigmaX, float sigmaY);

} // namespace ORVO::ImageFlow::bilateral
