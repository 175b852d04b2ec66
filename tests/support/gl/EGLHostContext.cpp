#include <epoxy/egl.h>

#include <stdexcept>

#include "tests/support/gl/GLHooks.h"
#include "tests/support/gl/HostContext.h"

namespace ORVO::Test {

namespace {

void require(bool bDone, char const* pWhat) {
    if (!bDone)
        throw std::runtime_error(pWhat);
}

/// One display for the process, never ended: the driver keeps memory for each that is opened. The host has
/// its driver's surfaceless display, on a machine without that the default one.
EGLDisplay hostDisplay() {
    static EGLDisplay display = [] {
        EGLDisplay opened = eglGetPlatformDisplayEXT(EGL_PLATFORM_SURFACELESS_MESA,
                                                     reinterpret_cast<void*>(EGL_DEFAULT_DISPLAY), nullptr);
        if (opened == EGL_NO_DISPLAY || eglInitialize(opened, nullptr, nullptr) == EGL_FALSE) {
            opened = eglGetDisplay(EGL_DEFAULT_DISPLAY);
            require(eglInitialize(opened, nullptr, nullptr) == EGL_TRUE, "no EGL display");
        }
        return opened;
    }();
    return display;
}

class EGLHostContext final : public HostContext {
public:
    explicit EGLHostContext(EGLContext share) {
        require(eglBindAPI(EGL_OPENGL_API) == EGL_TRUE, "no OpenGL in EGL");
        EGLint const aAttributes[] = {EGL_NONE};
        context_ = eglCreateContext(hostDisplay(), EGL_NO_CONFIG_KHR, share, aAttributes);
        require(context_ != EGL_NO_CONTEXT, "no EGL context");
    }
    ~EGLHostContext() override { destroyContext(); }

    void makeCurrent() override {
        eglBindAPI(EGL_OPENGL_API);
        require(eglMakeCurrent(hostDisplay(), EGL_NO_SURFACE, EGL_NO_SURFACE, context_) == EGL_TRUE,
                "eglMakeCurrent");
    }
    void release() override {
        require(eglMakeCurrent(hostDisplay(), EGL_NO_SURFACE, EGL_NO_SURFACE, EGL_NO_CONTEXT) == EGL_TRUE,
                "eglMakeCurrent");
    }
    void* handle() const override { return context_; }
    std::unique_ptr<HostContext> another(bool bSharing) override {
        return std::make_unique<EGLHostContext>(bSharing ? context_ : EGL_NO_CONTEXT);
    }
    void destroyContext() override {
        if (context_ == EGL_NO_CONTEXT)
            return;
        if (eglGetCurrentContext() == context_)
            release();
        eglDestroyContext(hostDisplay(), context_);
        context_ = EGL_NO_CONTEXT;
    }

private:
    EGLContext context_ = EGL_NO_CONTEXT;
};

} // namespace

std::unique_ptr<HostContext> HostContext::createEGL() {
    hostDisplay();
    GLHooks::install();
    return std::make_unique<EGLHostContext>(EGL_NO_CONTEXT);
}

} // namespace ORVO::Test
