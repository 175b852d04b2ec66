#include "orvo/ogl/internal/EGLPlatform.h"

#include <dlfcn.h>
#include <epoxy/egl.h>

#include <array>
#include <atomic>
#include <cstring>
#include <mutex>
#include <string>
#include <vector>

namespace ORVO::OGL::Internal::EGLPlatform {

namespace {

/// Whether the EGL library is in the process. Asked again until it is; it is never unloaded after that.
bool isLoaded() noexcept {
    static std::atomic<bool> bLoaded{false};
    if (bLoaded.load(std::memory_order_acquire))
        return true;
    // The handle is kept: what was seen once stays loaded.
    if (dlopen("libEGL.so.1", RTLD_LAZY | RTLD_NOLOAD) == nullptr)
        return false;
    bLoaded.store(true, std::memory_order_release);
    return true;
}

PlatformFailure lastFailure() noexcept {
    static constexpr std::array<char const*, 15> aNames{
        "EGL_SUCCESS",       "EGL_NOT_INITIALIZED", "EGL_BAD_ACCESS",        "EGL_BAD_ALLOC",
        "EGL_BAD_ATTRIBUTE", "EGL_BAD_CONFIG",      "EGL_BAD_CONTEXT",       "EGL_BAD_CURRENT_SURFACE",
        "EGL_BAD_DISPLAY",   "EGL_BAD_MATCH",       "EGL_BAD_NATIVE_PIXMAP", "EGL_BAD_NATIVE_WINDOW",
        "EGL_BAD_PARAMETER", "EGL_BAD_SURFACE",     "EGL_CONTEXT_LOST"};
    auto const nError = static_cast<unsigned>(eglGetError());
    unsigned const nIndex = nError - EGL_SUCCESS;
    return {nError, nIndex > 0 && nIndex < aNames.size() ? aNames[nIndex] : ""};
}

EGLSurface surfaceOf(std::uintptr_t nSurface) noexcept { return reinterpret_cast<EGLSurface>(nSurface); }
std::uintptr_t handleOf(EGLSurface surface) noexcept { return reinterpret_cast<std::uintptr_t>(surface); }

/// Whether a list of extensions, separated by spaces, has the given one.
bool hasWord(char const* pList, char const* pWord) noexcept {
    if (pList == nullptr)
        return false;
    std::size_t const nLength = std::strlen(pWord);
    for (char const* p = std::strstr(pList, pWord); p != nullptr; p = std::strstr(p + nLength, pWord))
        if ((p == pList || p[-1] == ' ') && (p[nLength] == ' ' || p[nLength] == '\0'))
            return true;
    return false;
}

bool displayHas(EGLDisplay display, char const* pExtension) noexcept {
    return hasWord(eglQueryString(display, EGL_EXTENSIONS), pExtension);
}

/// Displays of devices that are hardware. The device queries are asked for by name: they are extensions of
/// the client side, which need no display.
void appendHardwareDisplays(std::vector<EGLDisplay>& aDisplays, PFNEGLGETPLATFORMDISPLAYEXTPROC getDisplay) {
    auto const queryDevices =
        reinterpret_cast<PFNEGLQUERYDEVICESEXTPROC>(eglGetProcAddress("eglQueryDevicesEXT"));
    auto const queryDeviceString =
        reinterpret_cast<PFNEGLQUERYDEVICESTRINGEXTPROC>(eglGetProcAddress("eglQueryDeviceStringEXT"));
    if (queryDevices == nullptr || queryDeviceString == nullptr)
        return;
    std::array<EGLDeviceEXT, 16> aDevices{};
    EGLint nDevices = 0;
    if (queryDevices(static_cast<EGLint>(aDevices.size()), aDevices.data(), &nDevices) == EGL_FALSE)
        return;
    for (EGLint i = 0; i < nDevices; ++i)
        if (!hasWord(queryDeviceString(aDevices[static_cast<std::size_t>(i)], EGL_EXTENSIONS),
                     "EGL_MESA_device_software"))
            aDisplays.push_back(
                getDisplay(EGL_PLATFORM_DEVICE_EXT, aDevices[static_cast<std::size_t>(i)], nullptr));
}

/// Displays for headless work, the preferred one first.
std::vector<EGLDisplay> headlessDisplays() {
    std::vector<EGLDisplay> aDisplays;
    char const* const pClient = eglQueryString(EGL_NO_DISPLAY, EGL_EXTENSIONS);
    if (hasWord(pClient, "EGL_EXT_platform_base")) {
        auto const getDisplay =
            reinterpret_cast<PFNEGLGETPLATFORMDISPLAYEXTPROC>(eglGetProcAddress("eglGetPlatformDisplayEXT"));
        if (hasWord(pClient, "EGL_EXT_platform_device"))
            appendHardwareDisplays(aDisplays, getDisplay);
        if (hasWord(pClient, "EGL_MESA_platform_surfaceless"))
            aDisplays.push_back(getDisplay(EGL_PLATFORM_SURFACELESS_MESA,
                                           reinterpret_cast<void*>(EGL_DEFAULT_DISPLAY), nullptr));
    }
    aDisplays.push_back(eglGetDisplay(EGL_DEFAULT_DISPLAY));
    return aDisplays;
}

/// The display of all headless contexts, initialised on first use and for the rest of the process: ending it
/// would end the contexts of others on the same display, and drivers keep memory for each that is opened.
/// Null if no driver offers one.
EGLDisplay headlessDisplay() {
    static std::mutex oLock;
    static EGLDisplay display = EGL_NO_DISPLAY;
    std::lock_guard const guard(oLock);
    if (display != EGL_NO_DISPLAY)
        return display;
    if (dlopen("libEGL.so.1", RTLD_LAZY | RTLD_LOCAL) == nullptr)
        return EGL_NO_DISPLAY;
    for (EGLDisplay candidate : headlessDisplays())
        if (candidate != EGL_NO_DISPLAY && eglInitialize(candidate, nullptr, nullptr) == EGL_TRUE &&
            eglBindAPI(EGL_OPENGL_API) == EGL_TRUE) {
            display = candidate;
            break;
        }
    return display;
}

/// A configuration with the given attributes; null (no configuration) if there is none.
EGLConfig chooseConfig(EGLDisplay display, std::vector<EGLint> aAttributes) noexcept {
    aAttributes.push_back(EGL_NONE);
    EGLConfig config = nullptr;
    EGLint nConfigs = 0;
    if (eglChooseConfig(display, aAttributes.data(), &config, 1, &nConfigs) == EGL_FALSE || nConfigs == 0)
        return nullptr;
    return config;
}

EGLConfig headlessConfig(EGLDisplay display) noexcept {
    if (displayHas(display, "EGL_KHR_surfaceless_context") &&
        displayHas(display, "EGL_KHR_no_config_context"))
        return nullptr;
    return chooseConfig(display, {EGL_SURFACE_TYPE, EGL_PBUFFER_BIT, EGL_RENDERABLE_TYPE, EGL_OPENGL_BIT});
}

/// The configuration of an existing context; null if it was made without one.
EGLConfig configOf(NativeContext const& record) noexcept {
    EGLint nConfig = 0;
    if (eglQueryContext(record.pDisplay_, record.pContext_, EGL_CONFIG_ID, &nConfig) == EGL_FALSE ||
        nConfig == 0)
        return nullptr;
    return chooseConfig(record.pDisplay_, {EGL_CONFIG_ID, nConfig});
}

NativeContext create(EGLDisplay display, EGLConfig config, EGLContext share) {
    // The bound interface belongs to the thread: without this a thread that is new to EGL would get a context
    // of another kind, silently.
    if (eglBindAPI(EGL_OPENGL_API) == EGL_FALSE)
        throwPlatform(__FILE__, __LINE__, "OpenGL contexts are not available", lastFailure());
    static constexpr EGLint aNoAttributes[] = {EGL_NONE};
    NativeContext record;
    record.eAPI_ = ContextAPI::egl;
    record.pDisplay_ = display;
    record.pContext_ = eglCreateContext(display, config, share, aNoAttributes);
    if (record.pContext_ == EGL_NO_CONTEXT)
        throwPlatform(__FILE__, __LINE__, "The OpenGL context could not be created", lastFailure());
    if (displayHas(display, "EGL_KHR_surfaceless_context"))
        return record;
    static constexpr EGLint aSize[] = {EGL_WIDTH, 1, EGL_HEIGHT, 1, EGL_NONE};
    EGLSurface surface = eglCreatePbufferSurface(display, config, aSize);
    if (surface == EGL_NO_SURFACE) {
        PlatformFailure const failure = lastFailure();
        eglDestroyContext(display, record.pContext_);
        throwPlatform(__FILE__, __LINE__, "The surface of the OpenGL context could not be created", failure);
    }
    record.nDraw_ = record.nRead_ = handleOf(surface);
    return record;
}

} // namespace

void* currentHandle() noexcept { return isLoaded() ? eglGetCurrentContext() : nullptr; }

NativeContext current() noexcept {
    NativeContext record;
    if (!isLoaded())
        return record;
    EGLContext context = eglGetCurrentContext();
    if (context == EGL_NO_CONTEXT)
        return record;
    record.eAPI_ = ContextAPI::egl;
    record.pDisplay_ = eglGetCurrentDisplay();
    record.pContext_ = context;
    record.nDraw_ = handleOf(eglGetCurrentSurface(EGL_DRAW));
    record.nRead_ = handleOf(eglGetCurrentSurface(EGL_READ));
    return record;
}

bool makeCurrent(NativeContext const& record, PlatformFailure& failure) noexcept {
    eglBindAPI(EGL_OPENGL_API);
    if (eglMakeCurrent(record.pDisplay_, surfaceOf(record.nDraw_), surfaceOf(record.nRead_),
                       record.pContext_) == EGL_TRUE)
        return true;
    failure = lastFailure();
    return false;
}

bool release(NativeContext const& record, PlatformFailure& failure) noexcept {
    eglBindAPI(EGL_OPENGL_API);
    if (eglMakeCurrent(record.pDisplay_, EGL_NO_SURFACE, EGL_NO_SURFACE, EGL_NO_CONTEXT) == EGL_TRUE)
        return true;
    failure = lastFailure();
    return false;
}

NativeContext createSharing(NativeContext const& shareWith) {
    return create(shareWith.pDisplay_, configOf(shareWith), shareWith.pContext_);
}

NativeContext createHeadless() {
    EGLDisplay display = headlessDisplay();
    if (display == EGL_NO_DISPLAY)
        throwPlatform(__FILE__, __LINE__, "No OpenGL driver is available", {});
    return create(display, headlessConfig(display), EGL_NO_CONTEXT);
}

void destroy(NativeContext const& record) noexcept {
    eglDestroyContext(record.pDisplay_, record.pContext_);
    if (record.nDraw_ != 0)
        eglDestroySurface(record.pDisplay_, surfaceOf(record.nDraw_));
}

} // namespace ORVO::OGL::Internal::EGLPlatform
