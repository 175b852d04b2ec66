#include "orvo/image_flow/filters/bilateral/GPUScopes.h"

#include "orvo/image_runtime/images/ImageGPU.h"
#include "orvo/ogl/ExceptionOGL.h"
#include "orvo/ogl/Framebuffer.h"
#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/Program.h"
#include "orvo/ogl/Texture2D.h"
#include "orvo/ogl/TextureState.h"
#include "orvo/ogl/TokenName.h"
#include "orvo/ogl/internal/GL.h"

#include <array>
#include <string>

namespace ORVO::ImageFlow::bilateral {

namespace {

/// Runs what a scope undoes, which may find that its context is gone.
template <typename Undo>
void undoInContext(Undo const& code) noexcept {
    if (OGL::NativeContext::currentHandle() == nullptr) {
        return;
    }
    try {
        code();
    } catch (...) {
        // Another context is current than the one in which the scope began.
        return;
    }
}

OGL::TextureUnit::Environment currentEnvironment() {
    GLint nMode = GL_MODULATE;
    glGetTexEnviv(GL_TEXTURE_ENV, GL_TEXTURE_ENV_MODE, &nMode);
    return OGL::TextureUnit::GL2Environment(static_cast<unsigned>(nMode));
}

} // namespace

ScopedTarget::ScopedTarget(OGL::Framebuffer& framebuffer, OGL::Texture2* pTexture)
    : oFramebuffer_(framebuffer), pTexture_(pTexture) {
    oFramebuffer_.bind();
    try {
        oFramebuffer_.attach(pTexture_, 0, 0);
        unsigned nStatus = 0;
        if (!oFramebuffer_.statusOkay(&nStatus)) {
            std::string const sMessage =
                std::string("Framebuffer attachment error: ") + OGL::TokenName(nStatus);
            throw OGL::ExceptionOGL(__FILE__, __LINE__, sMessage.c_str(), nStatus);
        }
    } catch (...) {
        undoInContext([this] {
            oFramebuffer_.detach(pTexture_, 0);
            oFramebuffer_.unbind();
        });
        throw;
    }
}

ScopedTarget::~ScopedTarget() {
    undoInContext([this] {
        if (oFramebuffer_.isBound()) {
            oFramebuffer_.detach(pTexture_, 0);
            oFramebuffer_.unbind();
        }
    });
}

ScopedProgram::ScopedProgram(ShaderProgramProxyOGL& oProxy) : oLock_(oProxy) {
    oLock_.getProgram()->enable();
}

ScopedProgram::~ScopedProgram() {
    undoInContext([this] { oLock_.getProgram()->disable(); });
}

ScopedInput::ScopedInput(ImageGPU const& image)
    : oImage_(image), eEnvironment_(OGL::TextureUnit::ENVIRONMENT_MODULATE) {
    static constexpr std::array<float, 4> aTransparentBlack{};
    OGL::TextureState::setActiveTextureUnit(0);
    eEnvironment_ = currentEnvironment();
    oImage_.bind(0);
    try {
        oImage_.setEnvironment(OGL::TextureUnit::ENVIRONMENT_REPLACE);
        oImage_.setFilter(GL_NEAREST, GL_NEAREST);
        oImage_.setWrap(GL_CLAMP_TO_BORDER, GL_CLAMP_TO_BORDER);
        oImage_.setBorderColor(aTransparentBlack.data());
    } catch (...) {
        undoInContext([this] { oImage_.bindDefault(); });
        throw;
    }
}

ScopedInput::~ScopedInput() {
    undoInContext([this] {
        OGL::TextureUnit::Unit(0).setEnv(eEnvironment_);
        oImage_.bindDefault();
    });
}

} // namespace ORVO::ImageFlow::bilateral
