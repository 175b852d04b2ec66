#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_runtime/images/ImageCPU.h"
#include "orvo/image_runtime/images/ImageGPU.h"
#include "orvo/ogl/Texture.h"

namespace ORVO {

/// How an image in host memory goes up into a texture: the texture's format, and the channels and the channel
/// type of the pixels in memory. 16-bit integers of four channels pass as the bits of 16-bit floats. Throws
/// `InternalException` "Not implemented: pixelFormat in CPU2GPU::internaProcess()" for the other formats of
/// 16-bit integers and for numbers that are no format, "!\"PIXEL_FORMAT_UNDEFINED\"" for the undefined one;
/// the results are then untouched.
///
/// Threads: any.
ORVO_API void MapImageCPUToGPU(ImageCPU::tePixelFormat formatCPU, ImageGPU::tePixelFormat& formatGPU,
                               OGL::Texture::Format& format, OGL::Texture::Type& type);

/// The same with OpenGL's tokens, and for other formats: all of 16-bit integers pass as the bits of 16-bit
/// floats, and those of 16-bit floats are refused.
ORVO_API void MapImageCPUToGPU(ImageCPU::tePixelFormat formatCPU, ImageGPU::tePixelFormat& formatGPU,
                               unsigned& format, unsigned& type);

} // namespace ORVO
