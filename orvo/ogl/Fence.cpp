#include "orvo/ogl/Fence.h"

#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/GL.h"
#include "orvo/ogl/internal/Sentinel.h"

namespace ORVO::OGL {

Fence::Fence() {
    ORVO_OGL_REQUIRE_CONTEXT();
    pSync_ = Internal::Sentinel::create();
    if (pSync_ != nullptr)
        glFlush();
    else
        glFinish();
}

Fence::~Fence() {
    if (NativeContext::currentHandle() != nullptr && Internal::Sentinel::isAlive(pSync_))
        Internal::Sentinel::destroy(pSync_);
}

void Fence::wait() const noexcept {
    if (NativeContext::currentHandle() != nullptr && Internal::Sentinel::isAlive(pSync_))
        glWaitSync(static_cast<GLsync>(pSync_), 0, GL_TIMEOUT_IGNORED);
}

void finishCurrentContext() noexcept {
    if (NativeContext::currentHandle() != nullptr)
        glFinish();
}

} // namespace ORVO::OGL
