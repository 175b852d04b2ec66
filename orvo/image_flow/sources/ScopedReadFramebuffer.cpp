#include "orvo/image_flow/sources/ScopedReadFramebuffer.h"

#include "orvo/ogl/ExceptionOGL.h"
#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/FunctionTable.h"
#include "orvo/ogl/Texture2.h"
#include "orvo/ogl/TokenName.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/GL.h"
#include "orvo/ogl/internal/Scopes.h"

#include <string>

namespace ORVO {

namespace {

void bind(unsigned nTarget, unsigned nName) {
    OGL::ExtensionManager::Instance()->table()->glBindFramebuffer(nTarget, nName);
}

/// Whether drawing and reading have bindings of their own; with the first extension they had one in common.
bool hasSeparateBindings() {
    ORVO_OGL_REQUIRE_CONTEXT();
    return OGL::ExtensionManager::Instance()->isSupported(OGL::EXTENSION_ARB_FRAMEBUFFER_OBJECT);
}

} // namespace

ScopedReadFramebuffer::Bindings::Bindings()
    : bSeparate_(hasSeparateBindings()),
      nDraw_(static_cast<unsigned>(OGL::Internal::integerState(GL_FRAMEBUFFER_BINDING))),
      nRead_(bSeparate_ ? static_cast<unsigned>(OGL::Internal::integerState(GL_READ_FRAMEBUFFER_BINDING))
                        : nDraw_) {}

ScopedReadFramebuffer::Bindings::~Bindings() {
    if (bSeparate_) {
        bind(GL_DRAW_FRAMEBUFFER, nDraw_);
        bind(GL_READ_FRAMEBUFFER, nRead_);
    } else {
        bind(GL_FRAMEBUFFER, nDraw_);
    }
}

ScopedReadFramebuffer::ScopedReadFramebuffer(OGL::Texture2& texture) : texture_(texture) {
    oFramebuffer_.bind();
    oFramebuffer_.attach(&texture_, 0, 0);
    ORVO_OGL_THROW_ON_ERROR("The texture could not be attached for reading");
    unsigned nStatus = 0;
    if (!oFramebuffer_.statusOkay(&nStatus)) {
        ORVO_OGL_FAIL(std::string("Framebuffer attachment error: ") + OGL::TokenName(nStatus), nStatus);
    }
}

ScopedReadFramebuffer::~ScopedReadFramebuffer() {
    try {
        oFramebuffer_.detach(&texture_, 0);
    } catch (...) { // The framebuffer goes in any case, and its attachment with it.
    }
}

} // namespace ORVO
