#include "orvo/ogl/internal/Scopes.h"

namespace ORVO::OGL::Internal {

namespace {

/// A number that pixels are changed by on their way, and the one by which they are not.
struct Transfer {
    GLenum nName_;
    float fPlain_;
};

constexpr std::array<Transfer, 8> aTransfers{{{GL_RED_SCALE, 1.0F},
                                              {GL_GREEN_SCALE, 1.0F},
                                              {GL_BLUE_SCALE, 1.0F},
                                              {GL_ALPHA_SCALE, 1.0F},
                                              {GL_RED_BIAS, 0.0F},
                                              {GL_GREEN_BIAS, 0.0F},
                                              {GL_BLUE_BIAS, 0.0F},
                                              {GL_ALPHA_BIAS, 0.0F}}};

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

void clampNoFloats() noexcept {
    glClampColor(GL_CLAMP_VERTEX_COLOR, GL_FALSE);
    glClampColor(GL_CLAMP_FRAGMENT_COLOR, GL_FIXED_ONLY);
    glClampColor(GL_CLAMP_READ_COLOR, GL_FIXED_ONLY);
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

ScopedPlainPixelTransfer::ScopedPlainPixelTransfer() noexcept : nMapsColors_(integerState(GL_MAP_COLOR)) {
    bChanged_ = nMapsColors_ != 0;
    for (std::size_t i = 0; i < nNumbers_; ++i) {
        glGetFloatv(aTransfers[i].nName_, &aSaved_[i]);
        bChanged_ = bChanged_ || aSaved_[i] < aTransfers[i].fPlain_ || aSaved_[i] > aTransfers[i].fPlain_;
    }
    if (!bChanged_)
        return;
    glPixelTransferi(GL_MAP_COLOR, GL_FALSE);
    for (Transfer const& transfer : aTransfers)
        glPixelTransferf(transfer.nName_, transfer.fPlain_);
}

ScopedPlainPixelTransfer::~ScopedPlainPixelTransfer() {
    if (!bChanged_)
        return;
    glPixelTransferi(GL_MAP_COLOR, nMapsColors_);
    for (std::size_t i = 0; i < nNumbers_; ++i)
        glPixelTransferf(aTransfers[i].nName_, aSaved_[i]);
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
