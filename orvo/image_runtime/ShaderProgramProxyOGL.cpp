#include "orvo/image_runtime/ShaderProgramProxyOGL.h"

#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/image_runtime/ShaderManagerOGL.h"
#include "orvo/ogl/Program.h"

namespace ORVO {

namespace {

/// The manager of the current context, or null: on a foreign context, and before and after the library's
/// time.
ShaderManagerOGL* managerIfAny() noexcept {
    try {
        return ShaderManagerOGL::Instance();
    } catch (...) {
        return nullptr;
    }
}

} // namespace

ShaderProgramProxyOGL::ShaderProgramProxyOGL()
    : p_ProgramObject(nullptr), n_LockCount(0), dTimeStamp_(0.0), pManager_(nullptr) {}

ShaderProgramProxyOGL::~ShaderProgramProxyOGL() {
    try {
        // The manager that it is registered with, whichever context is current here.
        if (ShaderManagerOGL* const pManager = pManager_ ? pManager_ : managerIfAny()) {
            pManager->UnRegisterShaderProgram(this);
        }
    } catch (...) {
        // A destructor lets nothing out.
        pManager_ = nullptr;
    }
    trackedDelete(p_ProgramObject);
}

void ShaderProgramProxyOGL::add(FragmentShaderSourceOGL const& oSource) {
    discardProgram();
    vFragmentSources_.push_back(oSource);
}

void ShaderProgramProxyOGL::add(VertexShaderSourceOGL const& oSource) {
    discardProgram();
    vVertexSources_.push_back(oSource);
}

void ShaderProgramProxyOGL::discardProgram() {
    if (!p_ProgramObject) {
        return;
    }
    if (pManager_) {
        pManager_->clearProgram(this);
        return;
    }
    // Linked by a manager that died while the proxy was locked: none counts it.
    ORVO_CHECK(n_LockCount == 0, "pProxy->n_LockCount == 0");
    trackedDelete(p_ProgramObject);
    p_ProgramObject = nullptr;
}

void ShaderProgramProxyOGL::removeAllShaders() {
    vVertexSources_.clear();
    vFragmentSources_.clear();
}

OGL::Program* ShaderProgramProxyOGL::LockOglProgram() {
    ShaderManagerOGL* const pManager = ShaderManagerOGL::Instance();
    if (pManager && pManager != pManager_) {
        // A program of another group of contexts means nothing in this one.
        discardProgram();
    }
    if (!p_ProgramObject && pManager) {
        pManager->RegisterShaderProgram(this);
    }
    ORVO_CHECK(p_ProgramObject && pManager, "The progam shader cannot be initialized.");
    ++n_LockCount;
    pManager->SetTimeStamp(this);
    return p_ProgramObject;
}

void ShaderProgramProxyOGL::UnlockOglProgram() noexcept { n_LockCount = 0; }

} // namespace ORVO
