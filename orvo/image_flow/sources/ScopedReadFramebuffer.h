#pragma once

#include "orvo/ogl/Framebuffer.h"
#include "orvo/ogl/internal/ScopedFramebufferBindings.h"

namespace ORVO {

namespace OGL {
class Texture2;
}

/// A framebuffer of its own that reads from a texture, for a scope. What was bound for drawing and for
/// reading before is bound again at its end.
///
/// Threads: construct, use and destroy with the same context current.
class ScopedReadFramebuffer {
public:
    /// The texture stays the caller's. Throws `OGL::ExceptionOGL` where there is no framebuffer to be had or
    /// where the driver cannot read textures of this format.
    explicit ScopedReadFramebuffer(OGL::Texture2& texture);
    ~ScopedReadFramebuffer();
    ScopedReadFramebuffer(ScopedReadFramebuffer const&) = delete;
    ScopedReadFramebuffer& operator=(ScopedReadFramebuffer const&) = delete;

private:
    /// Put back after the framebuffer is gone.
    OGL::Internal::ScopedFramebufferBindings oBindings_;
    OGL::Framebuffer oFramebuffer_;
    OGL::Texture2& texture_;
};

} // namespace ORVO
