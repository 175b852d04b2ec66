#pragma once

#include "orvo/ogl/Texture.h"

namespace ORVO::OGL {

/// Operations of textures with one dimension.
///
/// Threads: as Object.
class ORVO_API Texture1 : public Texture {
public:
    ~Texture1() override;

    /// Wrap mode of the bound texture.
    void setWrap(WrapMode s);

    /// Uploads w pixels into the bound texture from x on. The pixels lie in memory as the parameters say;
    /// while a pixel unpack buffer is bound, pPixels is an offset into it. Throws ParameterException "The
    /// level does not exist", "The rectangle lies outside the texture", InternalException "isBound()".
    void subImage(int level, int x, std::size_t w, Format format, Type type, void const* pPixels,
                  PixelUnpackParameters const& parameters);

protected:
    using Texture::Texture;
};

} // namespace ORVO::OGL
