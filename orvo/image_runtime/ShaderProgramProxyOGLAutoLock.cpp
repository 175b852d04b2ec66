#include "orvo/image_runtime/ShaderProgramProxyOGLAutoLock.h"

#include "orvo/image_runtime/ShaderProgramProxyOGL.h"

namespace ORVO {

ShaderProgramProxyOGLAutoLock::ShaderProgramProxyOGLAutoLock(ShaderProgramProxyOGL& oProxy)
    : pProxy_(&oProxy), pProgram_(oProxy.LockOglProgram()) {}

ShaderProgramProxyOGLAutoLock::~ShaderProgramProxyOGLAutoLock() { pProxy_->UnlockOglProgram(); }

} // namespace ORVO
