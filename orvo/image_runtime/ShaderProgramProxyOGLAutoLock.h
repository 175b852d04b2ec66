#pragma once

#include "orvo/core/Export.h"

namespace ORVO {

namespace OGL {
class Program;
}
class ShaderProgramProxyOGL;

/// Locks a proxy's program for a scope. Scopes of one proxy do not nest: the end of the first one unlocks it.
///
/// Threads: as ShaderProgramProxyOGL.
class ORVO_API ShaderProgramProxyOGLAutoLock {
public:
    /// Locks; throws what ShaderProgramProxyOGL::LockOglProgram() throws. The proxy has to outlive the scope.
    explicit ShaderProgramProxyOGLAutoLock(ShaderProgramProxyOGL& oProxy);
    ShaderProgramProxyOGLAutoLock(ShaderProgramProxyOGLAutoLock const&) = delete;
    ShaderProgramProxyOGLAutoLock& operator=(ShaderProgramProxyOGLAutoLock const&) = delete;
    ~ShaderProgramProxyOGLAutoLock();

    /// The locked program; the proxy's.
    OGL::Program* getProgram() const noexcept { return pProgram_; }

private:
    ShaderProgramProxyOGL* pProxy_;
    OGL::Program* pProgram_;
};

} // namespace ORVO
