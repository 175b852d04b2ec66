#include "orvo/ogl/internal/GLXPlatform.h"

#include <dlfcn.h>
#include <epoxy/glx.h>

#include <atomic>
#include <memory>
#include <mutex>

namespace ORVO::OGL::Internal::GLXPlatform {

namespace {

/// The few functions of the X library that are needed, taken from the one that the host has loaded: the
/// engine itself has no need of a window system.
struct XLibrary {
    decltype(&XSetErrorHandler) pSetErrorHandler_ = nullptr;
    decltype(&XSync) pSync_ = nullptr;
    decltype(&XFree) pFree_ = nullptr;

    bool isComplete() const noexcept {
        return pSetErrorHandler_ != nullptr && pSync_ != nullptr && pFree_ != nullptr;
    }
};

XLibrary loadXLibrary() noexcept {
    XLibrary x;
    if (void* const pLibrary = dlopen("libX11.so.6", RTLD_LAZY | RTLD_NOLOAD)) {
        x.pSetErrorHandler_ =
            reinterpret_cast<decltype(x.pSetErrorHandler_)>(dlsym(pLibrary, "XSetErrorHandler"));
        x.pSync_ = reinterpret_cast<decltype(x.pSync_)>(dlsym(pLibrary, "XSync"));
        x.pFree_ = reinterpret_cast<decltype(x.pFree_)>(dlsym(pLibrary, "XFree"));
    }
    return x;
}

/// Only used where a GLX context exists, so the X library is loaded by then.
XLibrary const& xLibrary() noexcept {
    static XLibrary const x = loadXLibrary();
    return x;
}

/// Whether a GLX library and its X library are in the process. Asked again until they are.
bool isLoaded() noexcept {
    static std::atomic<bool> bLoaded{false};
    if (bLoaded.load(std::memory_order_acquire))
        return true;
    // The handles are kept: what was seen once stays loaded.
    if (dlopen("libX11.so.6", RTLD_LAZY | RTLD_NOLOAD) == nullptr ||
        (dlopen("libGLX.so.0", RTLD_LAZY | RTLD_NOLOAD) == nullptr &&
         dlopen("libGL.so.1", RTLD_LAZY | RTLD_NOLOAD) == nullptr))
        return false;
    bool const bComplete = xLibrary().isComplete();
    bLoaded.store(bComplete, std::memory_order_release);
    return bComplete;
}

/// While one lives, X errors of its display are kept instead of ending the process, which is what the X
/// library does by default. Errors of other displays go to the host's handler. The handler is one for the
/// process, so only one trap lives at a time.
class ErrorTrap {
public:
    explicit ErrorTrap(Display* pDisplay) noexcept : oGuard_(oLock) {
        pTrapped = pDisplay;
        nError = 0;
        pFormerHandler = xLibrary().pSetErrorHandler_(&ErrorTrap::onError);
    }
    ~ErrorTrap() {
        xLibrary().pSetErrorHandler_(pFormerHandler);
        pTrapped = nullptr;
    }
    ErrorTrap(ErrorTrap const&) = delete;
    ErrorTrap& operator=(ErrorTrap const&) = delete;

    /// The X error that was caught, 0 if none.
    static PlatformFailure failure() noexcept { return {nError, nError != 0 ? "X error" : ""}; }

private:
    static int onError(Display* pDisplay, XErrorEvent* pEvent) {
        if (pDisplay != pTrapped)
            return pFormerHandler != nullptr ? pFormerHandler(pDisplay, pEvent) : 0;
        nError = pEvent->error_code;
        return 0;
    }

    static std::mutex oLock;
    static Display* pTrapped;
    static XErrorHandler pFormerHandler;
    static unsigned nError;
    std::lock_guard<std::mutex> oGuard_;
};

std::mutex ErrorTrap::oLock;
Display* ErrorTrap::pTrapped = nullptr;
XErrorHandler ErrorTrap::pFormerHandler = nullptr;
unsigned ErrorTrap::nError = 0;

Display* displayOf(NativeContext const& record) noexcept { return static_cast<Display*>(record.pDisplay_); }
GLXContext contextOf(NativeContext const& record) noexcept {
    return static_cast<GLXContext>(record.pContext_);
}

bool setCurrent(Display* pDisplay, std::uintptr_t nDraw, std::uintptr_t nRead, GLXContext context,
                PlatformFailure& failure) noexcept {
    ErrorTrap const trap(pDisplay);
    Bool const bDone = glXMakeContextCurrent(pDisplay, nDraw, nRead, context);
    failure = ErrorTrap::failure();
    return bDone != False && failure.nError_ == 0;
}

/// The frame buffer configuration of an existing context; null if it cannot be told.
GLXFBConfig configOf(Display* pDisplay, GLXContext context) noexcept {
    int nConfig = 0;
    int nScreen = 0;
    if (glXQueryContext(pDisplay, context, GLX_FBCONFIG_ID, &nConfig) != Success ||
        glXQueryContext(pDisplay, context, GLX_SCREEN, &nScreen) != Success)
        return nullptr;
    int const aAttributes[] = {GLX_FBCONFIG_ID, nConfig, None};
    int nConfigs = 0;
    std::unique_ptr<GLXFBConfig, decltype(&XFree)> const pConfigs(
        glXChooseFBConfig(pDisplay, nScreen, aAttributes, &nConfigs), xLibrary().pFree_);
    return pConfigs != nullptr && nConfigs > 0 ? *pConfigs : nullptr;
}

void destroyParts(Display* pDisplay, GLXContext context, GLXPbuffer surface) noexcept {
    if (context != nullptr)
        glXDestroyContext(pDisplay, context);
    if (surface != 0)
        glXDestroyPbuffer(pDisplay, surface);
}

} // namespace

void* currentHandle() noexcept { return isLoaded() ? glXGetCurrentContext() : nullptr; }

NativeContext current() noexcept {
    NativeContext record;
    if (!isLoaded())
        return record;
    GLXContext context = glXGetCurrentContext();
    if (context == nullptr)
        return record;
    record.eAPI_ = ContextAPI::glx;
    record.pDisplay_ = glXGetCurrentDisplay();
    record.pContext_ = context;
    record.nDraw_ = glXGetCurrentDrawable();
    record.nRead_ = glXGetCurrentReadDrawable();
    return record;
}

bool makeCurrent(NativeContext const& record, PlatformFailure& failure) noexcept {
    return setCurrent(displayOf(record), record.nDraw_, record.nRead_, contextOf(record), failure);
}

bool release(NativeContext const& record, PlatformFailure& failure) noexcept {
    return setCurrent(displayOf(record), 0, 0, nullptr, failure);
}

NativeContext createSharing(NativeContext const& shareWith) {
    Display* const pDisplay = displayOf(shareWith);
    GLXContext context = nullptr;
    GLXPbuffer surface = 0;
    PlatformFailure failure;
    {
        ErrorTrap const trap(pDisplay);
        if (GLXFBConfig config = configOf(pDisplay, contextOf(shareWith))) {
            context = glXCreateNewContext(pDisplay, config, GLX_RGBA_TYPE, contextOf(shareWith), True);
            int const aSize[] = {GLX_PBUFFER_WIDTH, 1, GLX_PBUFFER_HEIGHT, 1, None};
            surface = context != nullptr ? glXCreatePbuffer(pDisplay, config, aSize) : 0;
        }
        // Errors of the server come with a delay.
        xLibrary().pSync_(pDisplay, False);
        failure = ErrorTrap::failure();
        if (failure.nError_ != 0 || surface == 0) {
            destroyParts(pDisplay, context, surface);
            xLibrary().pSync_(pDisplay, False);
            context = nullptr;
        }
    }
    if (context == nullptr)
        throwPlatform(__FILE__, __LINE__, "The OpenGL context could not be created", failure);
    return {ContextAPI::glx, pDisplay, context, surface, surface};
}

void destroy(NativeContext const& record) noexcept {
    ErrorTrap const trap(displayOf(record));
    destroyParts(displayOf(record), contextOf(record), record.nDraw_);
    xLibrary().pSync_(displayOf(record), False);
}

} // namespace ORVO::OGL::Internal::GLXPlatform
