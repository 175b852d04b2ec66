#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_runtime/images/ImageCPU.h"

namespace ORVO::ImageRuntime {

/// A new image of 32-bit floats in the SIMD-optimised layout, with storage and rows on 64-byte boundaries.
/// Its capacity is at least the width rounded up to four pixels, so that a vector loop may run over a whole
/// group of four past the last pixel. The pixels are not cleared. The caller owns the image and frees it with
/// ORVODeleter<ImageCPU>.
/// @param channels 1 gives luminance, 2 luminance and alpha, 3 RGB, 4 RGBA.
/// @param extent width and height in pixels.
/// @param pixelExtent the world size of one pixel.
/// @param position the top-left pixel, in pixel space.
/// @throws InternalException "false" for any other number of channels.
/// @throws as the constructor of ImageCPU: ParameterException for negative and for too large extents.
/// Threads: may be called from any thread.
ORVO_API ImageCPU* getBlankSIMDOptimized32FFormat(int channels, ExtentInPixelSpace const& extent,
                                                  PixelExtentInWorldSpace const& pixelExtent,
                                                  PositionInPixelSpace const& position);

/// The same with the channels of a format.
/// @throws InternalException as nChannels() does.
ORVO_API ImageCPU* getBlankSIMDOptimized32FFormat(ImageCPU::tePixelFormat ePixelFormat,
                                                  ExtentInPixelSpace const& extent,
                                                  PixelExtentInWorldSpace const& pixelExtent,
                                                  PositionInPixelSpace const& position);

/// The same with the channels, extent, pixel extent and position of an image.
ORVO_API ImageCPU* getBlankSIMDOptimized32FFormat(ImageCPU const& image);

} // namespace ORVO::ImageRuntime
