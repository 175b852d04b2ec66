#pragma once

namespace ORVO::OGL::Internal {

/// What is bound for drawing and for reading, bound again at the end of a scope.
///
/// Threads: construct and destroy with the same context current.
class ScopedFramebufferBindings {
public:
    /// Throws ExceptionOGL "No OpenGL context is current".
    ScopedFramebufferBindings();
    ~ScopedFramebufferBindings();
    ScopedFramebufferBindings(ScopedFramebufferBindings const&) = delete;
    ScopedFramebufferBindings& operator=(ScopedFramebufferBindings const&) = delete;

private:
    bool bSeparate_;
    unsigned nDraw_;
    unsigned nRead_;
};

} // namespace ORVO::OGL::Internal
