#include "orvo/ogl/internal/Sentinel.h"

#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/GL.h"

namespace ORVO::OGL::Internal::Sentinel {

void* create() {
    if (epoxy_gl_version() < 32 && !epoxy_has_gl_extension("GL_ARB_sync"))
        return nullptr;
    GLsync sync = glFenceSync(GL_SYNC_GPU_COMMANDS_COMPLETE, 0);
    if (sync == nullptr) {
        clearErrors();
        ORVO_OGL_FAIL("The context's sync object could not be created", GL_OUT_OF_MEMORY);
    }
    return sync;
}

bool isAlive(void* pSync) noexcept {
    return pSync != nullptr && glIsSync(static_cast<GLsync>(pSync)) == GL_TRUE;
}

void destroy(void* pSync) noexcept {
    if (pSync != nullptr)
        glDeleteSync(static_cast<GLsync>(pSync));
}

} // namespace ORVO::OGL::Internal::Sentinel
