#include "orvo/ogl/Texture3.h"

#include "orvo/ogl/internal/Scopes.h"
#include "orvo/ogl/internal/TextureRange.h"

namespace ORVO::OGL {

Texture3::~Texture3() = default;

void Texture3::setWrap(WrapMode s, WrapMode t, WrapMode r) {
    auto const nS = static_cast<GLint>(WrapMode2GL(s));
    auto const nT = static_cast<GLint>(WrapMode2GL(t));
    auto const nR = static_cast<GLint>(WrapMode2GL(r));
    requireBound();
    glTexParameteri(target(), GL_TEXTURE_WRAP_S, nS);
    glTexParameteri(target(), GL_TEXTURE_WRAP_T, nT);
    glTexParameteri(target(), GL_TEXTURE_WRAP_R, nR);
}

void Texture3::subImage(int level, int x, int y, int z, std::size_t w, std::size_t h, std::size_t d,
                        Format format, Type type, void const* pPixels,
                        PixelUnpackParameters const& parameters) {
    requireLevel(level);
    Internal::requireRange(x, w, width(static_cast<unsigned>(level)));
    Internal::requireRange(y, h, height(static_cast<unsigned>(level)));
    Internal::requireRange(z, d, depth(static_cast<unsigned>(level)));
    unsigned const nFormat = Format2GL(format);
    unsigned const nType = Type2GL(type);
    requireBound();
    if (w == 0 || h == 0 || d == 0)
        return;
    Internal::ScopedPixelStore const restore;
    parameters.apply();
    glTexSubImage3D(target(), level, x, y, z, static_cast<GLsizei>(w), static_cast<GLsizei>(h),
                    static_cast<GLsizei>(d), nFormat, nType, pPixels);
}

} // namespace ORVO::OGL
