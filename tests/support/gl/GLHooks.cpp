#include "tests/support/gl/GLHooks.h"

#include <gtest/gtest.h>

// After gtest: the X headers define macros such as None.
#include <epoxy/egl.h>
#include <epoxy/gl.h>
#include <epoxy/glx.h>

#include <atomic>
#include <mutex>
#include <set>
#include <tuple>
#include <type_traits>

namespace ORVO::Test {

namespace {

struct State {
    std::recursive_mutex oLock_;
    bool bInstalled_ = false;
    bool bGLXInstalled_ = false;
    std::map<std::string, std::multiset<std::uintptr_t>> aObjects_;
    std::map<std::string, std::uint64_t> aCalls_;
    // The failure that is armed.
    bool bArmed_ = false;
    std::string sOnly_;
    std::uint64_t nCountdown_ = 0;
    std::string sFired_;
    GLenum nPendingError_ = GL_NO_ERROR;
};

State& state() {
    static auto* const pState = new State;
    return *pState;
}

/// Counts a call; whether it is to fail.
bool enter(char const* pName, bool bCanFail) {
    State& s = state();
    std::lock_guard const guard(s.oLock_);
    ++s.aCalls_[pName];
    if (!bCanFail || !s.bArmed_ || !s.sFired_.empty() || (!s.sOnly_.empty() && s.sOnly_ != pName))
        return false;
    if (--s.nCountdown_ != 0)
        return false;
    s.sFired_ = pName;
    if (pName[0] == 'g' && pName[2] != 'X') // glX and egl report by their results
        s.nPendingError_ = GL_OUT_OF_MEMORY;
    return true;
}

void made(char const* pKind, std::uintptr_t nName) {
    State& s = state();
    std::lock_guard const guard(s.oLock_);
    if (nName != 0)
        s.aObjects_[pKind].insert(nName);
}

void gone(char const* pKind, std::uintptr_t nName) {
    State& s = state();
    std::lock_guard const guard(s.oLock_);
    auto& aNames = s.aObjects_[pKind];
    auto const known = aNames.find(nName);
    if (known != aNames.end())
        aNames.erase(known);
}

template <typename T>
std::uintptr_t handleOf(T value) {
    if constexpr (std::is_pointer_v<T>)
        return reinterpret_cast<std::uintptr_t>(value);
    else
        return static_cast<std::uintptr_t>(value);
}

/// What a hook does beside counting the call.
enum class Role { plain, creates, deletes, generatesNames, deletesNames };

/// One hooked entry point: the loader's pointer, its name, its role and the kind of object that it is about.
template <auto* pSlot, typename Signature = std::remove_pointer_t<decltype(pSlot)>>
struct Hook;

template <auto* pSlot, typename Result, typename... Arguments>
struct Hook<pSlot, Result (*)(Arguments...)> {
    static inline Result (*pOriginal)(Arguments...) = nullptr;
    static inline char const* pName = nullptr;
    static inline char const* pKind = nullptr;
    static inline Role eRole = Role::plain;
    static inline bool bCanFail = false;

    static Result call(Arguments... arguments) {
        if (enter(pName, bCanFail)) {
            if constexpr (!std::is_void_v<Result>)
                return Result{};
            else
                return;
        }
        forget(arguments...);
        if constexpr (std::is_void_v<Result>) {
            pOriginal(arguments...);
            remember(arguments...);
        } else {
            Result const result = pOriginal(arguments...);
            if (eRole == Role::creates)
                made(pKind, handleOf(result));
            return result;
        }
    }

    /// glGen...(n, names)
    static void remember(Arguments... arguments) {
        if constexpr (std::is_invocable_v<void (*)(GLsizei, GLuint*), Arguments...>)
            if (eRole == Role::generatesNames)
                [](GLsizei n, GLuint* pNames) {
                    for (GLsizei i = 0; i < n; ++i)
                        made(pKind, pNames[i]);
                }(arguments...);
    }

    /// glDelete...(n, names), glDelete...(name), eglDestroy...(display, object)
    static void forget(Arguments... arguments) {
        if constexpr (std::is_invocable_v<void (*)(GLsizei, GLuint const*), Arguments...>) {
            if (eRole == Role::deletesNames)
                [](GLsizei n, GLuint const* pNames) {
                    for (GLsizei i = 0; i < n; ++i)
                        gone(pKind, pNames[i]);
                }(arguments...);
        } else if constexpr (sizeof...(Arguments) > 0) {
            if (eRole == Role::deletes)
                gone(pKind, handleOf(std::get<sizeof...(Arguments) - 1>(std::tie(arguments...))));
        }
    }
};

template <auto* pSlot>
void hook(char const* pName, bool bCanFail, Role eRole, char const* pKind) {
    using Hooked = Hook<pSlot>;
    Hooked::pName = pName;
    Hooked::bCanFail = bCanFail;
    Hooked::eRole = eRole;
    Hooked::pKind = pKind;
    // The loader's first pointer is a resolver that would call back through the slot.
    Hooked::pOriginal = reinterpret_cast<decltype(Hooked::pOriginal)>(eglGetProcAddress(pName));
    ASSERT_NE(nullptr, Hooked::pOriginal) << pName;
    *pSlot = &Hooked::call;
}

/// The same for entry points of EGL and GLX, which their own resolvers do not all give out.
template <auto* pSlot>
void hookPlatform(char const* pName, void* pOriginal, Role eRole, char const* pKind) {
    using Hooked = Hook<pSlot>;
    Hooked::pName = pName;
    Hooked::bCanFail = true;
    Hooked::eRole = eRole;
    Hooked::pKind = pKind;
    Hooked::pOriginal = reinterpret_cast<decltype(Hooked::pOriginal)>(pOriginal);
    ASSERT_NE(nullptr, Hooked::pOriginal) << pName;
    *pSlot = &Hooked::call;
}

GLenum (*pGetError)() = nullptr;

/// An error that was made up comes before the driver's own.
GLenum getError() {
    State& s = state();
    std::lock_guard const guard(s.oLock_);
    GLenum const nError = s.nPendingError_;
    s.nPendingError_ = GL_NO_ERROR;
    return nError != GL_NO_ERROR ? nError : pGetError();
}

#define HOOK_GENERATE(name, kind) hook<&epoxy_##name>(#name, true, Role::generatesNames, kind)
#define HOOK_DELETE_NAMES(name, kind) hook<&epoxy_##name>(#name, false, Role::deletesNames, kind)
#define HOOK_CREATE(name, kind) hook<&epoxy_##name>(#name, true, Role::creates, kind)
#define HOOK_DELETE(name, kind) hook<&epoxy_##name>(#name, false, Role::deletes, kind)
#define HOOK_CAN_FAIL(name) hook<&epoxy_##name>(#name, true, Role::plain, "")
#define HOOK_COUNT(name) hook<&epoxy_##name>(#name, false, Role::plain, "")

void hookObjects() {
    HOOK_GENERATE(glGenTextures, "texture");
    HOOK_DELETE_NAMES(glDeleteTextures, "texture");
    HOOK_GENERATE(glGenBuffers, "buffer");
    HOOK_DELETE_NAMES(glDeleteBuffers, "buffer");
    HOOK_GENERATE(glGenFramebuffers, "framebuffer");
    HOOK_DELETE_NAMES(glDeleteFramebuffers, "framebuffer");
    HOOK_GENERATE(glGenRenderbuffers, "renderbuffer");
    HOOK_DELETE_NAMES(glDeleteRenderbuffers, "renderbuffer");
    HOOK_GENERATE(glGenQueries, "query");
    HOOK_DELETE_NAMES(glDeleteQueries, "query");
    HOOK_CREATE(glCreateProgram, "program");
    HOOK_DELETE(glDeleteProgram, "program");
    HOOK_CREATE(glCreateShader, "shader");
    HOOK_DELETE(glDeleteShader, "shader");
    HOOK_CREATE(glFenceSync, "sync");
    HOOK_DELETE(glDeleteSync, "sync");
}

void hookCalls() {
    HOOK_CAN_FAIL(glTexImage1D);
    HOOK_CAN_FAIL(glTexImage2D);
    HOOK_CAN_FAIL(glTexImage3D);
    HOOK_CAN_FAIL(glTexSubImage1D);
    HOOK_CAN_FAIL(glTexSubImage2D);
    HOOK_CAN_FAIL(glTexSubImage3D);
    HOOK_CAN_FAIL(glCopyTexSubImage2D);
    HOOK_CAN_FAIL(glGetTexImage);
    HOOK_CAN_FAIL(glReadPixels);
    HOOK_CAN_FAIL(glBufferData);
    HOOK_CAN_FAIL(glMapBuffer);
    HOOK_CAN_FAIL(glUnmapBuffer);
    HOOK_CAN_FAIL(glCompileShader);
    HOOK_CAN_FAIL(glLinkProgram);
    HOOK_CAN_FAIL(glFramebufferTexture2D);
    HOOK_CAN_FAIL(glBeginQuery);
    HOOK_CAN_FAIL(glEndQuery);
    HOOK_CAN_FAIL(glFinish);
    // The rest of what the library calls beyond OpenGL 1.1, so that it never depends on the version that a
    // test plays whether the loader finds an entry point.
    HOOK_COUNT(glActiveTexture);
    HOOK_COUNT(glAttachShader);
    HOOK_COUNT(glBindBuffer);
    HOOK_COUNT(glBindFramebuffer);
    HOOK_COUNT(glBindTexture);
    HOOK_COUNT(glClampColor);
    HOOK_COUNT(glDetachShader);
    HOOK_COUNT(glGetActiveUniform);
    HOOK_COUNT(glGetFramebufferAttachmentParameteriv);
    HOOK_COUNT(glGetProgramInfoLog);
    HOOK_COUNT(glGetProgramiv);
    HOOK_COUNT(glGetShaderInfoLog);
    HOOK_COUNT(glGetShaderiv);
    HOOK_COUNT(glGetUniformLocation);
    HOOK_COUNT(glIsQuery);
    HOOK_COUNT(glIsSync);
    HOOK_COUNT(glShaderSource);
    HOOK_COUNT(glUniform1f);
    HOOK_COUNT(glUniform1i);
    HOOK_COUNT(glUniform2f);
    HOOK_COUNT(glUniform3f);
    HOOK_COUNT(glUniform4f);
    HOOK_COUNT(glUniformMatrix3fv);
    HOOK_COUNT(glUniformMatrix4fv);
    HOOK_COUNT(glUseProgram);
    HOOK_COUNT(glValidateProgram);
    HOOK_COUNT(glWaitSync);
}

#undef HOOK_GENERATE
#undef HOOK_DELETE_NAMES
#undef HOOK_CREATE
#undef HOOK_DELETE
#undef HOOK_CAN_FAIL
#undef HOOK_COUNT

GLenum (*pCheckStatus)(GLenum) = nullptr;

/// A framebuffer that fails its check is one that the driver does not support.
GLenum checkStatus(GLenum target) {
    if (!enter("glCheckFramebufferStatus", true))
        return pCheckStatus(target);
    State& s = state();
    std::lock_guard const guard(s.oLock_);
    s.nPendingError_ = GL_NO_ERROR;
    return GL_FRAMEBUFFER_UNSUPPORTED;
}

} // namespace

void GLHooks::install() {
    State& s = state();
    std::lock_guard const guard(s.oLock_);
    if (s.bInstalled_)
        return;
    s.bInstalled_ = true;
    hookObjects();
    hookCalls();
    pGetError = reinterpret_cast<decltype(pGetError)>(eglGetProcAddress("glGetError"));
    epoxy_glGetError = &getError;
    pCheckStatus = reinterpret_cast<decltype(pCheckStatus)>(eglGetProcAddress("glCheckFramebufferStatus"));
    epoxy_glCheckFramebufferStatus = &checkStatus;
    using Address = void*;
    hookPlatform<&epoxy_eglCreateContext>("eglCreateContext",
                                          reinterpret_cast<Address>(eglGetProcAddress("eglCreateContext")),
                                          Role::creates, "context");
    hookPlatform<&epoxy_eglDestroyContext>("eglDestroyContext",
                                           reinterpret_cast<Address>(eglGetProcAddress("eglDestroyContext")),
                                           Role::deletes, "context");
    hookPlatform<&epoxy_eglMakeCurrent>(
        "eglMakeCurrent", reinterpret_cast<Address>(eglGetProcAddress("eglMakeCurrent")), Role::plain, "");
    Hook<& epoxy_eglDestroyContext>::bCanFail = false;
}

void GLHooks::installGLX() {
    State& s = state();
    std::lock_guard const guard(s.oLock_);
    if (s.bGLXInstalled_)
        return;
    s.bGLXInstalled_ = true;
    auto const original = [](char const* pName) {
        return reinterpret_cast<void*>(glXGetProcAddressARB(reinterpret_cast<GLubyte const*>(pName)));
    };
    hookPlatform<&epoxy_glXCreateNewContext>("glXCreateNewContext", original("glXCreateNewContext"),
                                             Role::creates, "context");
    hookPlatform<&epoxy_glXDestroyContext>("glXDestroyContext", original("glXDestroyContext"), Role::deletes,
                                           "context");
    hookPlatform<&epoxy_glXMakeContextCurrent>("glXMakeContextCurrent", original("glXMakeContextCurrent"),
                                               Role::plain, "");
    hookPlatform<&epoxy_glXCreatePbuffer>("glXCreatePbuffer", original("glXCreatePbuffer"), Role::creates,
                                          "pixel buffer");
    hookPlatform<&epoxy_glXDestroyPbuffer>("glXDestroyPbuffer", original("glXDestroyPbuffer"), Role::deletes,
                                           "pixel buffer");
    Hook<& epoxy_glXDestroyContext>::bCanFail = false;
    Hook<& epoxy_glXDestroyPbuffer>::bCanFail = false;
}

ObjectCounts GLHooks::objects() {
    State& s = state();
    std::lock_guard const guard(s.oLock_);
    ObjectCounts counts;
    for (auto const& [sKind, aNames] : s.aObjects_)
        if (!aNames.empty())
            counts[sKind] = static_cast<long>(aNames.size());
    return counts;
}

void GLHooks::forgetObjects() {
    State& s = state();
    std::lock_guard const guard(s.oLock_);
    s.aObjects_.clear();
}

std::uint64_t GLHooks::calls(std::string const& sName) {
    State& s = state();
    std::lock_guard const guard(s.oLock_);
    auto const known = s.aCalls_.find(sName);
    return known != s.aCalls_.end() ? known->second : 0;
}

GLCallFailure::GLCallFailure(std::uint64_t n) : GLCallFailure(std::string(), n) {}

GLCallFailure::GLCallFailure(std::string const& sName, std::uint64_t n) {
    State& s = state();
    std::lock_guard const guard(s.oLock_);
    s.bArmed_ = true;
    s.sOnly_ = sName;
    s.nCountdown_ = n;
    s.sFired_.clear();
}

GLCallFailure::~GLCallFailure() {
    State& s = state();
    std::lock_guard const guard(s.oLock_);
    s.bArmed_ = false;
}

bool GLCallFailure::hasFired() const noexcept { return !state().sFired_.empty(); }
std::string GLCallFailure::name() const { return state().sFired_; }

} // namespace ORVO::Test
