#include "orvo/ogl/Texture1D.h"

#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/TextureAllocation.h"

namespace ORVO::OGL {

Texture1D::Texture1D(InternalFormat format, std::size_t width, bool bMipmaps)
    : Texture1(GL_TEXTURE_1D, format, {width, 1, 1}, bMipmaps) {
    Internal::TextureAllocation const allocation(*this, levels());
    for (unsigned level = 0; level < levels(); ++level)
        glTexImage1D(target(), static_cast<GLint>(level), allocation.internalFormat(),
                     static_cast<GLsizei>(this->width(level)), 0, allocation.format(), allocation.type(),
                     nullptr);
    ORVO_OGL_THROW_ON_ERROR("The texture could not be allocated");
}

Texture1D::~Texture1D() = default;

} // namespace ORVO::OGL
