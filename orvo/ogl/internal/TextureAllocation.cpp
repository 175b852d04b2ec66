#include "orvo/ogl/internal/TextureAllocation.h"

namespace ORVO::OGL::Internal {

TextureAllocation::TextureAllocation(Texture const& texture, unsigned nLevels)
    : nInternalFormat_(static_cast<int>(Texture::InternalFormat2GL(texture.format()))),
      nFormat_(Texture::Format2GL(naturalPixels(texture.format()).eFormat_)),
      nType_(Texture::Type2GL(naturalPixels(texture.format()).eType_)),
      oTexture_(texture.target(), texture.objectID()),
      oUnpackBuffer_(GL_PIXEL_UNPACK_BUFFER, 0) {
    PixelUnpackParameters().apply();
    glTexParameteri(texture.target(), GL_TEXTURE_MIN_FILTER,
                    nLevels > 1 ? GL_LINEAR_MIPMAP_LINEAR : GL_LINEAR);
    glTexParameteri(texture.target(), GL_TEXTURE_MAG_FILTER, GL_LINEAR);
    if (texture.target() != GL_TEXTURE_RECTANGLE)
        glTexParameteri(texture.target(), GL_TEXTURE_MAX_LEVEL, static_cast<GLint>(nLevels - 1));
}

} // namespace ORVO::OGL::Internal
