#pragma once

#include "orvo/ogl/Texture.h"

#include <cstddef>

namespace ORVO {

/// Bytes of a pixel in memory: the format's channels times the size of the type. Throws InternalException
/// "pixelDataSize: Unknown type <name>" for types that are neither bytes, shorts, halves nor floats,
/// ExceptionOGL for a format that is none. Threads: any.
std::size_t pixelDataSize(OGL::Texture::Format format, OGL::Texture::Type type);

} // namespace ORVO
