#pragma once

#include "orvo/core/Export.h"

#include <cstdint>
#include <list>

namespace ORVO {

class ShaderProgramProxyOGL;

/// Links programs for proxies on demand, and takes the oldest away again when too many exist. There is one
/// for each context that the image runtime was started with, made and owned by its library.
///
/// The proxy's identity is the only key: sources are never compared, and two proxies with equal text link two
/// programs. What makes programs go is reaching the maximum number: then every unlocked program whose last
/// lock is at least the maximum age ago is discarded, the longest-registered first, until as many as the
/// threshold are left. Younger programs survive, so that the number is a trigger and not a limit.
///
/// Threads: no lock; one thread at a time with a context of the group current.
class ORVO_API ShaderManagerOGL {
public:
    /// The manager of the calling thread's current context; null where there is none (without OpenGL).
    /// @throws InternalException as ImageRuntime::Library::shaderManager().
    static ShaderManagerOGL* Instance();

    ShaderManagerOGL();
    ShaderManagerOGL(ShaderManagerOGL const&) = delete;
    ShaderManagerOGL& operator=(ShaderManagerOGL const&) = delete;
    /// Discards the programs of all proxies that are not locked and forgets the proxies, which live on: they
    /// register with another manager at their next lock.
    virtual ~ShaderManagerOGL();

    /// The number of programs from which on old ones are discarded; 128 at first.
    std::uint32_t GetMaxNumShaders() const noexcept { return nMaxNumShaders_; }
    void SetMaxNumShaders(std::uint32_t nMaxNumShaders) noexcept { nMaxNumShaders_ = nMaxNumShaders; }

    /// The seconds since its last lock after which a program may be discarded; 60.0 at first.
    double GetMaxShaderAge() const noexcept { return dMaxShaderAge_; }
    void SetMaxShaderAge(double dMaxShaderAge) noexcept { dMaxShaderAge_ = dMaxShaderAge; }

    /// The number of programs at which discarding stops; 98 at first.
    std::uint32_t GetShaderThreshold() const noexcept { return nShaderThreshold_; }
    /// Sets it: the name is the interface's.
    void GetShaderThreshold(std::uint32_t nShaderThreshold) noexcept { nShaderThreshold_ = nShaderThreshold; }

    /// The count of linked programs. A proxy that dies lowers it by one even if it had no program, so that it
    /// may fall behind the truth and, at 0, wrap around.
    std::uint32_t GetNumShaders() const noexcept { return nNumShaders_; }

    /// Discards old programs if there are too many, then compiles and links the proxy's sources, each stage
    /// as one list of texts. The proxy is unlocked afterwards, and on the manager's list from the first time
    /// on. It stays its owner's.
    /// @throws InternalException "Enforce pProxy != NULL", "!pProxy->p_ProgramObject" for a proxy that has
    ///         a program.
    /// @throws OGL::ExceptionOGL as OGL::Program for sources that do not compile or link; the proxy is
    ///         without a program then, and neither list nor count has changed but for what was discarded.
    void RegisterShaderProgram(ShaderProgramProxyOGL* pProxy);

    /// Discards the programs of all proxies that are not locked.
    void clearAll();

protected:
    friend class ShaderProgramProxyOGL;

    /// Sets the proxy's time of the last lock to now, in seconds of a monotonic clock.
    /// @throws InternalException "Enforce pProxy != NULL".
    void SetTimeStamp(ShaderProgramProxyOGL* pProxy);
    /// Discards the proxy's program, takes the proxy off the list, and lowers the count by one in any case.
    /// @throws InternalException "Enforce pProxy != NULL".
    void UnRegisterShaderProgram(ShaderProgramProxyOGL* pProxy);
    /// Discards the proxy's program if it has one. The proxy stays on the list.
    /// @throws InternalException "Enforce pProxy != NULL", "pProxy->n_LockCount == 0" for a locked proxy.
    void clearProgram(ShaderProgramProxyOGL* pProxy);

private:
    void RemoveOldShaders();
    void forget(ShaderProgramProxyOGL* pProxy) noexcept;

    std::uint32_t nMaxNumShaders_;
    std::uint32_t nShaderThreshold_;
    std::uint32_t nNumShaders_;
    double dMaxShaderAge_;
    std::list<ShaderProgramProxyOGL*> oProxies_;
};

} // namespace ORVO
