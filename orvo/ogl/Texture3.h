#pragma once

#include "orvo/ogl/Texture.h"

namespace ORVO::OGL {

/// Operations of textures with three dimensions.
///
/// Threads: as Object.
class ORVO_API Texture3 : public Texture {
public:
    ~Texture3() override;

    /// Wrap modes of the bound texture.
    void setWrap(WrapMode s, WrapMode t, WrapMode r);

    /// Uploads a box of w by h by d pixels into the bound texture at (x, y, z). The pixels lie in memory as
    /// the parameters say, slices without gaps; while a pixel unpack buffer is bound, pPixels is an offset
    /// into it. Throws ParameterException "The level does not exist", "The rectangle lies outside the
    /// texture", InternalException "isBound()". Leaves the pixel store as it was.
    void subImage(int level, int x, int y, int z, std::size_t w, std::size_t h, std::size_t d, Format format,
                  Type type, void const* pPixels, PixelUnpackParameters const& parameters);

protected:
    using Texture::Texture;
};

} // namespace ORVO::OGL
