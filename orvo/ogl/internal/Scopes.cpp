#include "orvo/ogl/internal/Scopes.h"

namespace ORVO::OGL::Internal {

namespace {

bool hasPixelBuffers() noexcept {
    return epoxy_gl_version() >= 21 || epoxy_has_gl_extension("GL_ARB_pixel_buffer_object") ||
           epoxy_has_gl_extension("GL_EXT_pixel_buffer_object");
}

unsigned bufferBindingOf(unsigned nTarget) noexcept {
    switch (nTarget) {
    case GL_PIXEL_UNPACK_BUFFER:
        return GL_PIXEL_UNPACK_BUFFER_BINDING;
    case GL_PIXEL_PACK_BUFFER:
        return GL_PIXEL_PACK_BUFFER_BINDING;
    case GL_ELEMENT_ARRAY_BUFFER:
        return GL_ELEMENT_ARRAY_BUFFER_BINDING;
    default:
        return GL_ARRAY_BUFFER_BINDING;
    }
}

unsigned textureBindingOf(unsigned nTarget) noexcept {
    switch (nTarget) {
    case GL_TEXTURE_1D:
        return GL_TEXTURE_BINDING_1D;
    case GL_TEXTURE_3D:
        return GL_TEXTURE_BINDING_3D;
    case GL_TEXTURE_RECTANGLE:
        return GL_TEXTURE_BINDING_RECTANGLE;
    default:
        return GL_TEXTURE_BINDING_2D;
    }
}

} // namespace

int integerState(unsigned nName) noexcept {
    GLint value = 0;
    glGetIntegerv(nName, &value);
    return value;
}

unsigned boundBuffer(unsigned nTarget) noexcept {
    bool const bPixels = nTarget == GL_PIXEL_UNPACK_BUFFER || nTarget == GL_PIXEL_PACK_BUFFER;
    if (bPixels && !hasPixelBuffers())
        return 0;
    return static_cast<unsigned>(integerState(bufferBindingOf(nTarget)));
}

unsigned boundTexture(unsigned nTarget) noexcept {
    return static_cast<unsigned>(integerState(textureBindingOf(nTarget)));
}

ScopedPixelStore::ScopedPixelStore() noexcept { glPushClientAttrib(GL_CLIENT_PIXEL_STORE_BIT); }
ScopedPixelStore::~ScopedPixelStore() { glPopClientAttrib(); }

ScopedBufferBinding::ScopedBufferBinding(unsigned nTarget, unsigned nName) noexcept
    : nTarget_(nTarget), nSaved_(boundBuffer(nTarget)), bChanged_(nSaved_ != nName) {
    if (bChanged_)
        epoxy_glBindBuffer(nTarget, nName);
}

ScopedBufferBinding::~ScopedBufferBinding() {
    if (bChanged_)
        epoxy_glBindBuffer(nTarget_, nSaved_);
}

ScopedTextureBinding::ScopedTextureBinding(unsigned nTarget, unsigned nName) noexcept
    : nTarget_(nTarget), nSaved_(boundTexture(nTarget)) {
    glBindTexture(nTarget, nName);
}

ScopedTextureBinding::~ScopedTextureBinding() { glBindTexture(nTarget_, nSaved_); }

} // namespace ORVO::OGL::Internal
