#include "orvo/ogl/internal/Failure.h"

#include <atomic>
#include <cstdint>

#include "orvo/ogl/ExceptionOGL.h"
#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/TokenName.h"
#include "orvo/ogl/internal/GL.h"

namespace ORVO::OGL::Internal {

namespace {

/// Bound of the loop that clears the error state: a driver that is gone may answer with an error for ever.
constexpr int nMaximumErrors = 64;

std::atomic<char const*> pMissingEntryPoint{nullptr};
epoxy_resolver_failure_handler_t pFormerHandler = nullptr;

/// Stands in for an absent entry point: takes anything, returns zero.
std::uintptr_t absentEntryPoint() { return 0; }

/// A function of no signature, as the loader takes it.
using EntryPoint = void (*)();

EntryPoint onAbsentEntryPoint(char const* name) {
    pMissingEntryPoint.store(name, std::memory_order_release);
    return reinterpret_cast<EntryPoint>(&absentEntryPoint);
}

} // namespace

void throwPlatform(char const* file, int line, char const* message, PlatformFailure const& failure) {
    std::string text(message);
    if (failure.pName_[0] != '\0')
        text.append(" (").append(failure.pName_).append(")");
    throw ExceptionOGL(file, static_cast<unsigned>(line), text.c_str(), failure.nError_);
}

void throwOGL(char const* file, int line, std::string const& message, unsigned glError) {
    throw ExceptionOGL(file, static_cast<unsigned>(line), message.c_str(), glError);
}

void requireContext(char const* file, int line) {
    if (NativeContext::currentHandle() == nullptr)
        throwOGL(file, line, "No OpenGL context is current", 0);
}

void clearErrors() noexcept {
    for (int i = 0; i < nMaximumErrors && glGetError() != GL_NO_ERROR; ++i) {
    }
}

void throwOnError(char const* file, int line, char const* message) {
    GLenum const first = glGetError();
    if (first != GL_NO_ERROR)
        clearErrors();
    if (char const* const pMissing = pMissingEntryPoint.exchange(nullptr, std::memory_order_acq_rel))
        throwOGL(file, line, std::string(message) + " (no entry point " + pMissing + ")",
                 GL_INVALID_OPERATION);
    if (first != GL_NO_ERROR)
        throwOGL(file, line, std::string(message) + " (" + TokenName(first) + ")", first);
}

void installResolverFailureHandler() noexcept {
    pFormerHandler = epoxy_set_resolver_failure_handler(&onAbsentEntryPoint);
}

void removeResolverFailureHandler() noexcept {
    epoxy_set_resolver_failure_handler(pFormerHandler);
    pFormerHandler = nullptr;
}

} // namespace ORVO::OGL::Internal
