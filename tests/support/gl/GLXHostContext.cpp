#include <X11/Xlib.h>
#include <epoxy/egl.h>
#include <epoxy/glx.h>

#include <stdexcept>

#include "tests/support/gl/GLHooks.h"
#include "tests/support/gl/HostContext.h"
#include "tests/support/gl/XServer.h"

namespace ORVO::Test {

namespace {

void require(bool bDone, char const* pWhat) {
    if (!bDone)
        throw std::runtime_error(pWhat);
}

/// One connection for the process: the driver keeps memory for each that is opened.
Display* hostDisplay() {
    static Display* const pDisplay = XOpenDisplay(XServer::display().c_str());
    require(pDisplay != nullptr, "no X display");
    return pDisplay;
}

GLXFBConfig hostConfig() {
    static GLXFBConfig config = [] {
        int const aAttributes[] = {GLX_DRAWABLE_TYPE,
                                   GLX_WINDOW_BIT | GLX_PBUFFER_BIT,
                                   GLX_RENDER_TYPE,
                                   GLX_RGBA_BIT,
                                   GLX_X_RENDERABLE,
                                   True,
                                   None};
        int nConfigs = 0;
        GLXFBConfig* const pConfigs =
            glXChooseFBConfig(hostDisplay(), DefaultScreen(hostDisplay()), aAttributes, &nConfigs);
        require(pConfigs != nullptr && nConfigs > 0, "no GLX configuration");
        GLXFBConfig chosen = pConfigs[0];
        XFree(pConfigs);
        return chosen;
    }();
    return config;
}

class GLXHostContext final : public HostContext {
public:
    explicit GLXHostContext(GLXContext share) {
        Display* const pDisplay = hostDisplay();
        XVisualInfo* const pVisual = glXGetVisualFromFBConfig(pDisplay, hostConfig());
        require(pVisual != nullptr, "no visual");
        Window const root = RootWindow(pDisplay, pVisual->screen);
        XSetWindowAttributes attributes{};
        nColours_ = XCreateColormap(pDisplay, root, pVisual->visual, AllocNone);
        attributes.colormap = nColours_;
        nWindow_ = XCreateWindow(pDisplay, root, 0, 0, 64, 48, 0, pVisual->depth, InputOutput,
                                 pVisual->visual, CWColormap | CWBorderPixel, &attributes);
        XFree(pVisual);
        context_ = glXCreateNewContext(pDisplay, hostConfig(), GLX_RGBA_TYPE, share, True);
        require(context_ != nullptr, "no GLX context");
    }
    ~GLXHostContext() override {
        destroyContext();
        XDestroyWindow(hostDisplay(), nWindow_);
        XFreeColormap(hostDisplay(), nColours_);
        XSync(hostDisplay(), False);
    }

    void makeCurrent() override {
        require(glXMakeContextCurrent(hostDisplay(), nWindow_, nWindow_, context_) == True,
                "glXMakeContextCurrent");
    }
    void release() override {
        require(glXMakeContextCurrent(hostDisplay(), 0, 0, nullptr) == True, "glXMakeContextCurrent");
    }
    void* handle() const override { return context_; }
    std::unique_ptr<HostContext> another(bool bSharing) override {
        return std::make_unique<GLXHostContext>(bSharing ? context_ : nullptr);
    }
    void destroyContext() override {
        if (context_ == nullptr)
            return;
        if (glXGetCurrentContext() == context_)
            release();
        glXDestroyContext(hostDisplay(), context_);
        context_ = nullptr;
    }

private:
    Colormap nColours_ = 0;
    Window nWindow_ = 0;
    GLXContext context_ = nullptr;
};

} // namespace

std::unique_ptr<HostContext> HostContext::createGLX() {
    hostDisplay();
    // Functions of the driver are taken from EGL's resolver, which serves both interfaces.
    createEGL().reset();
    GLHooks::installGLX();
    return std::make_unique<GLXHostContext>(nullptr);
}

} // namespace ORVO::Test
