#include "orvo/ogl/Texture3D.h"

#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/TextureAllocation.h"

namespace ORVO::OGL {

Texture3D::Texture3D(InternalFormat format, std::size_t width, std::size_t height, std::size_t depth,
                     bool bMipmaps)
    : Texture3(GL_TEXTURE_3D, format, {width, height, depth}, bMipmaps) {
    Internal::TextureAllocation const allocation(*this, levels());
    for (unsigned level = 0; level < levels(); ++level)
        glTexImage3D(target(), static_cast<GLint>(level), allocation.internalFormat(),
                     static_cast<GLsizei>(this->width(level)), static_cast<GLsizei>(this->height(level)),
                     static_cast<GLsizei>(this->depth(level)), 0, allocation.format(), allocation.type(),
                     nullptr);
    ORVO_OGL_THROW_ON_ERROR("The texture could not be allocated");
}

Texture3D::~Texture3D() = default;

} // namespace ORVO::OGL
