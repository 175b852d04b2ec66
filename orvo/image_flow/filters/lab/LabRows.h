#pragma once

#include "orvo/core/Export.h"

#include <cstddef>

namespace ORVO {
class ImageCPU;
class PositionExtentInPixelSpace;
} // namespace ORVO

namespace ORVO::ImageFlow::lab {

/// One of LabKernels.
using RowKernel = void (*)(float* pOutput, float const* pInput, std::size_t n);

/// Converts rows begin up to, but not including, end of a region from one image into another, which holds all
/// of the region. Pixels are matched by their pixel-space positions; those outside the input are transparent
/// black.
/// @param region in pixel space; rows are counted from its top.
/// @throws InternalException "Invalid input image type" for formats that accessors do not serve.
///
/// Threads: disjoint rows may be converted by several threads at once.
ORVO_API void convertRows(RowKernel pfnKernel, ImageCPU const& input, ImageCPU& output,
                          PositionExtentInPixelSpace const& region, std::size_t begin, std::size_t end);

} // namespace ORVO::ImageFlow::lab
