#include "orvo/ogl/TextureRECT.h"

#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/TextureAllocation.h"

namespace ORVO::OGL {

TextureRECT::TextureRECT(InternalFormat format, std::size_t width, std::size_t height, void* pClientMemory)
    : Texture2(GL_TEXTURE_RECTANGLE, format, {width, height, 1}, false), pClientMemory_(pClientMemory) {
    if (!isSupported())
        ORVO_OGL_FAIL("Rectangle textures are not supported", GL_INVALID_ENUM);
    Internal::TextureAllocation const allocation(*this, levels());
    glTexImage2D(target(), 0, allocation.internalFormat(), static_cast<GLsizei>(width),
                 static_cast<GLsizei>(height), 0, allocation.format(), allocation.type(), pClientMemory);
    ORVO_OGL_THROW_ON_ERROR("The texture could not be allocated");
}

TextureRECT::~TextureRECT() = default;

bool TextureRECT::isSupported() {
    return ExtensionManager::Instance()->isSupported(EXTENSION_ARB_TEXTURE_RECTANGLE);
}

} // namespace ORVO::OGL
