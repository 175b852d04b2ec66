#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_runtime/FragmentShaderSourceOGL.h"
#include "orvo/image_runtime/VertexShaderSourceOGL.h"

#include <cstdint>
#include <vector>

namespace ORVO {

namespace OGL {
class Program;
}
class ShaderManagerOGL;

/// What a filter holds of its program: the sources, from which the manager of the current context links the
/// program when it is first locked, and again after it was discarded.
///
///     ShaderProgramProxyOGL oProgram_;
///     oProgram_.add(FragmentShaderSourceOGL("void main() { gl_FragColor = vec4(1.0); }"));
///     ...
///     ShaderProgramProxyOGLAutoLock const lock(oProgram_);
///     lock.getProgram()->enable();
///
/// A program is absent, linked (the manager may discard it), or locked.
///
/// Threads: one at a time, with a context current that the image runtime was started with, or that shares
/// with one.
class ORVO_API ShaderProgramProxyOGL {
public:
    ShaderProgramProxyOGL();
    ShaderProgramProxyOGL(ShaderProgramProxyOGL const&) = delete;
    ShaderProgramProxyOGL& operator=(ShaderProgramProxyOGL const&) = delete;
    /// Discards the program, whatever its state, and leaves the manager. No exception leaves it, also on a
    /// foreign context or after the image runtime's end.
    virtual ~ShaderProgramProxyOGL();

    /// Appends a part of a stage, copied. A program that exists is discarded, so that the next lock links
    /// anew.
    /// @throws InternalException "pProxy->n_LockCount == 0" while the program is locked; nothing is appended.
    void add(FragmentShaderSourceOGL const& oSource);
    void add(VertexShaderSourceOGL const& oSource);

    /// Forgets the sources of both stages. A program that exists stays.
    void removeAllShaders();

    /// The program, linked if need be, and locked: it is not discarded before it is unlocked. The proxy keeps
    /// it. A program that was linked on a context of another group is discarded first.
    /// @throws InternalException "The progam shader cannot be initialized." if there is no manager (without
    ///         OpenGL), or as ShaderManagerOGL::Instance() on a foreign context.
    /// @throws OGL::ExceptionOGL if the sources do not compile or link.
    OGL::Program* LockOglProgram();

    /// Unlocks the program, however often it was locked.
    void UnlockOglProgram() noexcept;

private:
    friend class ShaderManagerOGL;

    void discardProgram();

    std::vector<VertexShaderSourceOGL> vVertexSources_;
    std::vector<FragmentShaderSourceOGL> vFragmentSources_;
    OGL::Program* p_ProgramObject;
    std::uint32_t n_LockCount;
    double dTimeStamp_;
    /// Whose list this proxy is on; null if none. It dies in any context, and must leave that list.
    ShaderManagerOGL* pManager_;
};

} // namespace ORVO
