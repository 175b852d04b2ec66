#include "orvo/ogl/Texture2D.h"

#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/TextureAllocation.h"

namespace ORVO::OGL {

Texture2D::Texture2D(InternalFormat format, std::size_t width, std::size_t height, bool bMipmaps, void* pData)
    : Texture2(GL_TEXTURE_2D, format, {width, height, 1}, bMipmaps) {
    Internal::TextureAllocation const allocation(*this, levels());
    for (unsigned level = 0; level < levels(); ++level)
        glTexImage2D(target(), static_cast<GLint>(level), allocation.internalFormat(),
                     static_cast<GLsizei>(this->width(level)), static_cast<GLsizei>(this->height(level)), 0,
                     allocation.format(), allocation.type(), level == 0 ? pData : nullptr);
    ORVO_OGL_THROW_ON_ERROR("The texture could not be allocated");
}

Texture2D::~Texture2D() = default;

} // namespace ORVO::OGL
