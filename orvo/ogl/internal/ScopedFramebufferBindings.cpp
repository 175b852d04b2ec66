#include "orvo/ogl/internal/ScopedFramebufferBindings.h"

#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/GL.h"
#include "orvo/ogl/internal/Scopes.h"

namespace ORVO::OGL::Internal {

namespace {

/// Whether drawing and reading have bindings of their own; with the first extension they had one in common.
bool hasSeparateFramebufferBindings() {
    ORVO_OGL_REQUIRE_CONTEXT();
    return ExtensionManager::Instance()->isSupported(EXTENSION_ARB_FRAMEBUFFER_OBJECT);
}

} // namespace

ScopedFramebufferBindings::ScopedFramebufferBindings()
    : bSeparate_(hasSeparateFramebufferBindings()),
      nDraw_(static_cast<unsigned>(integerState(GL_FRAMEBUFFER_BINDING))),
      nRead_(bSeparate_ ? static_cast<unsigned>(integerState(GL_READ_FRAMEBUFFER_BINDING)) : nDraw_) {}

ScopedFramebufferBindings::~ScopedFramebufferBindings() {
    if (bSeparate_) {
        epoxy_glBindFramebuffer(GL_DRAW_FRAMEBUFFER, nDraw_);
        epoxy_glBindFramebuffer(GL_READ_FRAMEBUFFER, nRead_);
    } else {
        epoxy_glBindFramebuffer(GL_FRAMEBUFFER, nDraw_);
    }
}

} // namespace ORVO::OGL::Internal
