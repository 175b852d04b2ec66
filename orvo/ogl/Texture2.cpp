#include "orvo/ogl/Texture2.h"

#include <cstdint>

#include "orvo/ogl/Buffer.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/Scopes.h"
#include "orvo/ogl/internal/TextureRange.h"

namespace ORVO::OGL {

Texture2::~Texture2() = default;

void Texture2::setWrap(WrapMode s, WrapMode t) {
    auto const nS = static_cast<GLint>(WrapMode2GL(s));
    auto const nT = static_cast<GLint>(WrapMode2GL(t));
    requireBound();
    glTexParameteri(target(), GL_TEXTURE_WRAP_S, nS);
    glTexParameteri(target(), GL_TEXTURE_WRAP_T, nT);
}

void Texture2::subImage(int level, int x, int y, std::size_t w, std::size_t h, Format format, Type type,
                        void const* pPixels, PixelUnpackParameters const& parameters) {
    requireLevel(level);
    Internal::requireRange(x, w, width(static_cast<unsigned>(level)));
    Internal::requireRange(y, h, height(static_cast<unsigned>(level)));
    unsigned const nFormat = Format2GL(format);
    unsigned const nType = Type2GL(type);
    requireBound();
    if (w == 0 || h == 0)
        return;
    Internal::ScopedPixelStore const restore;
    parameters.apply();
    glTexSubImage2D(target(), level, x, y, static_cast<GLsizei>(w), static_cast<GLsizei>(h), nFormat, nType,
                    pPixels);
}

void Texture2::subImage(int level, int x, int y, std::size_t w, std::size_t h, Format format, Type type,
                        Buffer* pBuffer, std::size_t offset, PixelUnpackParameters const& parameters) {
    ORVO_ENFORCE(pBuffer);
    ORVO_OGL_REQUIRE_CONTEXT();
    Internal::ScopedBufferBinding const binding(GL_PIXEL_UNPACK_BUFFER, pBuffer->objectID());
    subImage(level, x, y, w, h, format, type,
             reinterpret_cast<void const*>(static_cast<std::uintptr_t>(offset)), parameters);
}

void Texture2::copyTexSubImage(int level, int x, int y, int sourceX, int sourceY, std::size_t w,
                               std::size_t h) {
    requireLevel(level);
    Internal::requireRange(x, w, width(static_cast<unsigned>(level)));
    Internal::requireRange(y, h, height(static_cast<unsigned>(level)));
    requireBound();
    if (w == 0 || h == 0)
        return;
    Internal::ScopedPlainPixelTransfer const transfer;
    glCopyTexSubImage2D(target(), level, x, y, sourceX, sourceY, static_cast<GLsizei>(w),
                        static_cast<GLsizei>(h));
}

void Texture2::getPixelData(void* pPixels, int level, Format format, Type type, unsigned alignment) const {
    requireLevel(level);
    ORVO_CHECK_PARAMETER(alignment == 1 || alignment == 2 || alignment == 4 || alignment == 8,
                         "alignment is 1, 2, 4 or 8");
    unsigned const nFormat = Format2GL(format);
    unsigned const nType = Type2GL(type);
    requireBound();
    if (width(static_cast<unsigned>(level)) == 0 || height(static_cast<unsigned>(level)) == 0)
        return;
    Internal::ScopedPixelStore const restore;
    glPixelStorei(GL_PACK_ALIGNMENT, static_cast<GLint>(alignment));
    glPixelStorei(GL_PACK_ROW_LENGTH, 0);
    glPixelStorei(GL_PACK_SKIP_PIXELS, 0);
    glPixelStorei(GL_PACK_SKIP_ROWS, 0);
    glPixelStorei(GL_PACK_SWAP_BYTES, GL_FALSE);
    glPixelStorei(GL_PACK_LSB_FIRST, GL_FALSE);
    glGetTexImage(target(), level, nFormat, nType, pPixels);
    ORVO_OGL_THROW_ON_ERROR("The texture could not be read");
}

} // namespace ORVO::OGL
