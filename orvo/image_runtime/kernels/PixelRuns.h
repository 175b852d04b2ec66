#pragma once

#include <cstddef>

namespace ORVO {
class ImageCPU;
}

/// What the pixel accessors and the functions over rows have in common: runs of pixels by their length, so
/// that a run may end at the last of all pixel coordinates.
///
/// Threads: free of state; any runs may be read, and disjoint runs written, by several threads at once.
namespace ORVO::ImageRuntime::Internal {

/// Reads the pixels x .. x + nPixels - 1 of a row, in pixel-space coordinates, as R, G, B, A. No bounds are
/// tested.
/// @throws InternalException "Invalid input image type" for formats that accessors do not serve.
void readPixelRun(ImageCPU const& image, int x, int y, std::size_t nPixels, float* pRGBA);

/// Clamps and writes the pixels x .. x + nPixels - 1 of a row.
/// @throws InternalException "Invalid input image type" for formats that accessors do not serve.
void writePixelRun(ImageCPU& image, int x, int y, std::size_t nPixels, float const* pRGBA);

} // namespace ORVO::ImageRuntime::Internal
