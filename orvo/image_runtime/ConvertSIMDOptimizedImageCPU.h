#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_runtime/images/ImageCPU.h"

/// Conversions between any CPU format and the SIMD-optimised layout of 32-bit floats (see
/// ImageCPU::isInSIMDOptimizedFormat()). Channel order passes through untouched: BGR stays BGR. 8-bit
/// integers scale by 255, 16-bit integers by 32768, exactly at 0 and 1.0. The few channel values up to the
/// first 16-byte boundary of the float row, and those after the last whole group of four, are converted by
/// plain arithmetic that differs from that of the groups: see RowKernels.
///
/// Rectangles are in pixel-space coordinates, `end` exclusive. Every check comes before any work, and an
/// empty rectangle does nothing but be checked.
///
/// Threads: free of state; disjoint rows of one output image may be converted by several threads at once.
namespace ORVO::ImageRuntime {

/// A new image in the SIMD-optimised layout with the channels, rectangle and pixel extent of the input. The
/// caller owns it and frees it with ORVODeleter<ImageCPU>.
/// @throws InternalException as nChannels() and channelSizeBits() do. @throws std::bad_alloc.
ORVO_API ImageCPU* convertImageToSIMDOptimized32FFormat(ImageCPU const& inputImage);

/// Converts the whole rectangle of the output.
ORVO_API void convertImageToSIMDOptimized32FFormat(ImageCPU const& inputImage, ImageCPU* pOutputImage);

/// Converts a rectangle.
/// @param inputImage 8-bit or 16-bit integers or 32-bit floats.
/// @param pOutputImage 32-bit floats of the same number of channels, with storage on a 16-byte boundary and a
///        capacity of at least the width rounded up to four. Not owned.
/// @throws InternalException with the text of the check, if the rectangle leaves either image, or the output
///         is not of that kind.
ORVO_API void convertImageToSIMDOptimized32FFormat(ImageCPU const& inputImage, ImageCPU* pOutputImage,
                                                   int beginX, int endX, int beginY, int endY);

/// A new image of the given format with the rectangle, pixel extent and capacity of the input. The caller
/// owns it and frees it with ORVODeleter<ImageCPU>.
/// @throws InternalException as nChannels() and channelSizeBits() do, and if the channels differ.
/// @throws std::bad_alloc.
ORVO_API ImageCPU* convertImageFromSIMDOptimized32FFormat(ImageCPU const& inputImage,
                                                          ImageCPU::tePixelFormat ePixelFormat);

/// Converts the whole rectangle of the output.
ORVO_API void convertImageFromSIMDOptimized32FFormat(ImageCPU const& inputImage, ImageCPU* pOutputImage);

/// Converts a rectangle.
/// @param inputImage 32-bit floats; neither capacity nor alignment is checked.
/// @param pOutputImage 8-bit or 16-bit integers or 32-bit floats, of the same number of channels. Not owned.
/// @throws InternalException with the text of the check, if the rectangle leaves either image, or the images
///         do not fit.
ORVO_API void convertImageFromSIMDOptimized32FFormat(ImageCPU const& inputImage, ImageCPU* pOutputImage,
                                                     int beginX, int endX, int beginY, int endY);

} // namespace ORVO::ImageRuntime
