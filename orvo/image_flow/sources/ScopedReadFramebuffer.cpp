#include "orvo/image_flow/sources/ScopedReadFramebuffer.h"

#include "orvo/ogl/ExceptionOGL.h"
#include "orvo/ogl/Texture2.h"
#include "orvo/ogl/TokenName.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/GL.h"

#include <string>

namespace ORVO {

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
