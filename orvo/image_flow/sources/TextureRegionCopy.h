#pragma once

#include "orvo/core/spaces/PositionExtentInPixelSpace.h"

namespace ORVO {

class ImageGPU;

/// Copies the pixels of `region` (pixels) that both images hold from texture to texture, pixel (x, y) to
/// pixel (x, y), and converts the channel type on the way. An image is not copied onto its own texture.
/// Throws `ParameterException` "Source and bound output image differ in their channels" unless both have the
/// same channels, and `OGL::ExceptionOGL` where OpenGL refuses.
///
/// Threads: any, with a current context that shares with one of the image runtime's.
void copyTextureRegion(ImageGPU const& source, ImageGPU& target, PositionExtentInPixelSpace const& region);

} // namespace ORVO
