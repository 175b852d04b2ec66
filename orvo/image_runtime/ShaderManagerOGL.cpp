#include "orvo/image_runtime/ShaderManagerOGL.h"

#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/ScopedPtr.h"
#include "orvo/image_runtime/ImageRuntimeLibrary.h"
#include "orvo/image_runtime/ShaderProgramProxyOGL.h"
#include "orvo/ogl/Program.h"

#include <algorithm>
#include <chrono>
#include <cmath>
#include <vector>

namespace ORVO {

namespace {

/// Seconds of a monotonic clock.
double now() {
    return std::chrono::duration<double>(std::chrono::steady_clock::now().time_since_epoch()).count();
}

/// The texts in order. They are the sources' own.
template <typename Source>
std::vector<char const*> textsOf(std::vector<Source> const& vSources) {
    std::vector<char const*> vpTexts;
    vpTexts.reserve(vSources.size());
    for (Source const& source : vSources) {
        vpTexts.push_back(source.c_str());
    }
    return vpTexts;
}

/// Compiles the sources of both stages, each as one list, and links them.
ScopedPtr<OGL::Program> linkProgram(std::vector<VertexShaderSourceOGL> const& vVertexSources,
                                    std::vector<FragmentShaderSourceOGL> const& vFragmentSources) {
    ScopedPtr<OGL::Program> pProgram(ORVO_NEW OGL::Program);
    if (!vVertexSources.empty()) {
        std::vector<char const*> vpTexts = textsOf(vVertexSources);
        pProgram->loadVertexShader(static_cast<unsigned>(vpTexts.size()), vpTexts.data(), nullptr);
    }
    if (!vFragmentSources.empty()) {
        std::vector<char const*> vpTexts = textsOf(vFragmentSources);
        pProgram->loadFragmentShader(static_cast<unsigned>(vpTexts.size()), vpTexts.data(), nullptr);
    }
    pProgram->link(true);
    return pProgram;
}

} // namespace

ShaderManagerOGL* ShaderManagerOGL::Instance() { return ImageRuntime::Library::shaderManager(); }

ShaderManagerOGL::ShaderManagerOGL()
    : nMaxNumShaders_(128), nShaderThreshold_(98), nNumShaders_(0), dMaxShaderAge_(60.0) {}

ShaderManagerOGL::~ShaderManagerOGL() {
    for (ShaderProgramProxyOGL* pProxy : oProxies_) {
        if (pProxy->n_LockCount == 0) {
            clearProgram(pProxy);
        }
        pProxy->pManager_ = nullptr;
    }
}

void ShaderManagerOGL::RegisterShaderProgram(ShaderProgramProxyOGL* pProxy) {
    ORVO_ENFORCE(pProxy);
    RemoveOldShaders();
    ORVO_CHECK(!pProxy->p_ProgramObject);
    ScopedPtr<OGL::Program> pProgram = linkProgram(pProxy->vVertexSources_, pProxy->vFragmentSources_);
    if (pProxy->pManager_ != this) {
        oProxies_.push_back(pProxy);
        // A proxy is on one list only: it could not leave the other one when it dies in this one's context.
        if (pProxy->pManager_) {
            pProxy->pManager_->forget(pProxy);
        }
        pProxy->pManager_ = this;
    }
    pProxy->p_ProgramObject = pProgram.release();
    pProxy->n_LockCount = 0;
    ++nNumShaders_;
}

void ShaderManagerOGL::RemoveOldShaders() {
    if (nNumShaders_ < nMaxNumShaders_) {
        return;
    }
    double const dNow = now();
    for (ShaderProgramProxyOGL* pProxy : oProxies_) {
        bool const bRemovable = pProxy->n_LockCount == 0 && pProxy->p_ProgramObject;
        if (!bRemovable || std::abs(dNow - pProxy->dTimeStamp_) < dMaxShaderAge_) {
            continue;
        }
        clearProgram(pProxy);
        if (nNumShaders_ <= nShaderThreshold_) {
            return;
        }
    }
}

void ShaderManagerOGL::clearAll() {
    for (ShaderProgramProxyOGL* pProxy : oProxies_) {
        if (pProxy->n_LockCount == 0) {
            clearProgram(pProxy);
        }
    }
}

void ShaderManagerOGL::SetTimeStamp(ShaderProgramProxyOGL* pProxy) {
    ORVO_ENFORCE(pProxy);
    pProxy->dTimeStamp_ = now();
}

void ShaderManagerOGL::clearProgram(ShaderProgramProxyOGL* pProxy) {
    ORVO_ENFORCE(pProxy);
    ORVO_CHECK(pProxy->n_LockCount == 0);
    if (!pProxy->p_ProgramObject) {
        return;
    }
    trackedDelete(pProxy->p_ProgramObject);
    pProxy->p_ProgramObject = nullptr;
    pProxy->n_LockCount = 0;
    --nNumShaders_;
}

void ShaderManagerOGL::UnRegisterShaderProgram(ShaderProgramProxyOGL* pProxy) {
    ORVO_ENFORCE(pProxy);
    trackedDelete(pProxy->p_ProgramObject);
    pProxy->p_ProgramObject = nullptr;
    pProxy->n_LockCount = 0;
    forget(pProxy);
    --nNumShaders_;
}

void ShaderManagerOGL::forget(ShaderProgramProxyOGL* pProxy) noexcept {
    oProxies_.remove(pProxy);
    if (pProxy->pManager_ == this) {
        pProxy->pManager_ = nullptr;
    }
}

} // namespace ORVO
