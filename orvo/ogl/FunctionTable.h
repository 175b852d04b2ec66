#pragma once

#include <cstddef>

namespace ORVO::OGL {

/// OpenGL entry points beyond those of version 1.1. Each forwards to the loader, which resolves it in the
/// context that is current at its first call.
///
/// glTestObjectAPPLE and glFinishObjectAPPLE are never null: where the driver lacks them, a texture's client
/// memory is copied at upload, so that every object has finished (1 is returned) and there is nothing to wait
/// for.
///
/// Threads: any thread with a current context.
struct FunctionTable {
    void (*glActiveTexture)(unsigned texture);
    void (*glMultiTexCoord2f)(unsigned target, float s, float t);
    void (*glMultiTexCoord2fv)(unsigned target, float const* pCoordinates);
    void (*glGenQueries)(int n, unsigned* pNames);
    void (*glDeleteQueries)(int n, unsigned const* pNames);
    unsigned char (*glIsQuery)(unsigned name);
    void (*glBeginQuery)(unsigned target, unsigned name);
    void (*glEndQuery)(unsigned target);
    void (*glGetQueryObjectuiv)(unsigned name, unsigned what, unsigned* pResult);
    void (*glGenBuffers)(int n, unsigned* pNames);
    void (*glDeleteBuffers)(int n, unsigned const* pNames);
    void (*glBindBuffer)(unsigned target, unsigned name);
    void (*glBufferData)(unsigned target, std::ptrdiff_t bytes, void const* pData, unsigned usage);
    void (*glGenFramebuffers)(int n, unsigned* pNames);
    void (*glBindFramebuffer)(unsigned target, unsigned name);
    unsigned char (*glTestObjectAPPLE)(unsigned object, unsigned name);
    void (*glFinishObjectAPPLE)(unsigned object, int name);
};

} // namespace ORVO::OGL
