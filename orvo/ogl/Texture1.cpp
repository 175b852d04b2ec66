#include "orvo/ogl/Texture1.h"

#include "orvo/ogl/internal/Scopes.h"
#include "orvo/ogl/internal/TextureRange.h"

namespace ORVO::OGL {

Texture1::~Texture1() = default;

void Texture1::setWrap(WrapMode s) {
    auto const nS = static_cast<GLint>(WrapMode2GL(s));
    requireBound();
    glTexParameteri(target(), GL_TEXTURE_WRAP_S, nS);
}

void Texture1::subImage(int level, int x, std::size_t w, Format format, Type type, void const* pPixels,
                        PixelUnpackParameters const& parameters) {
    requireLevel(level);
    Internal::requireRange(x, w, width(static_cast<unsigned>(level)));
    unsigned const nFormat = Format2GL(format);
    unsigned const nType = Type2GL(type);
    requireBound();
    if (w == 0)
        return;
    Internal::ScopedPixelStore const restore;
    parameters.apply();
    glTexSubImage1D(target(), level, x, static_cast<GLsizei>(w), nFormat, nType, pPixels);
}

} // namespace ORVO::OGL
