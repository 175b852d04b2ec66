#pragma once

#include "orvo/core/Export.h"

namespace ORVO {
class ImageCPU;
class ImageReadAccessor;
class ImageWriteAccessor;
} // namespace ORVO

/// Whole rows of pixels as RGBA floats: what the pixel accessors give and take, a row at a time.
///
/// All coordinates are pixel-space coordinates, `endX` exclusive; a buffer holds four floats a pixel, R, G,
/// B, A, of the pixels beginX .. endX-1, with no demand on its alignment. No bounds are tested; an empty
/// range does nothing. The results equal those of the accessors pixel by pixel, bit for bit.
///
/// Threads: free of state; any rows may be read, and disjoint rows written, by several threads at once.
namespace ORVO::ImageRuntime {

/// Reads from an image, as ImageCPUReadAccessor does.
/// @throws InternalException "Invalid input image type" for formats that accessors do not serve.
ORVO_API void readRowAsRGBAFloat(ImageCPU const& image, int y, int beginX, int endX, float* pRGBA);

/// Reads through an accessor. An ImageCPUReadAccessor is recognised and its image read row by row; any other
/// accessor, also a class derived from it, is asked for each pixel, from left to right.
/// @throws what the accessor throws.
ORVO_API void readRowAsRGBAFloat(ImageReadAccessor const& accessor, int y, int beginX, int endX,
                                 float* pRGBA);

/// Writes to an image, as ImageCPUWriteAccessor does.
/// @throws InternalException "Invalid input image type" for formats that accessors do not serve.
ORVO_API void writeRowFromRGBAFloat(ImageCPU& image, int y, int beginX, int endX, float const* pRGBA);

/// Writes through an accessor. An ImageCPUWriteAccessor is recognised and its image written row by row; any
/// other accessor, also a class derived from it, is given each pixel, from left to right.
/// @throws what the accessor throws.
ORVO_API void writeRowFromRGBAFloat(ImageWriteAccessor& accessor, int y, int beginX, int endX,
                                    float const* pRGBA);

/// The image behind an accessor if it is an ImageCPUReadAccessor itself, else null. Not owned.
ORVO_API ImageCPU const* imageBehind(ImageReadAccessor const& accessor);

/// The image behind an accessor if it is an ImageCPUWriteAccessor itself, else null. Not owned.
ORVO_API ImageCPU* imageBehind(ImageWriteAccessor& accessor);

} // namespace ORVO::ImageRuntime
