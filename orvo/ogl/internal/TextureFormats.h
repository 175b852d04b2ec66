/// The tables behind the conversions of OGL::Texture.
#pragma once

#include "orvo/ogl/Texture.h"

namespace ORVO::OGL::Internal {

/// One internal format.
struct InternalFormatRow {
    unsigned nToken_;
    unsigned nChannels_;
    /// Nominal bits of a pixel.
    unsigned nBits_;
};

/// The row of a valid value; null for others.
InternalFormatRow const* rowOf(Texture::InternalFormat format) noexcept;

/// Format and type of the pixels in memory that come nearest to the texture: what initial data come in.
struct NaturalPixels {
    Texture::Format eFormat_;
    Texture::Type eType_;
};
NaturalPixels naturalPixels(Texture::InternalFormat format);

} // namespace ORVO::OGL::Internal
