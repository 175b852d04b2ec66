#include "orvo/ogl/NativeContext.h"

#include "orvo/ogl/internal/EGLPlatform.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/GLXPlatform.h"

namespace ORVO::OGL {

namespace {

/// Makes a non-empty record current, with what the interface says of a refusal.
bool tryMakeCurrent(NativeContext const& record, Internal::PlatformFailure& failure) noexcept {
    return record.eAPI_ == ContextAPI::egl ? Internal::EGLPlatform::makeCurrent(record, failure)
                                           : Internal::GLXPlatform::makeCurrent(record, failure);
}

bool tryRelease(NativeContext const& record, Internal::PlatformFailure& failure) noexcept {
    return record.eAPI_ == ContextAPI::egl ? Internal::EGLPlatform::release(record, failure)
                                           : Internal::GLXPlatform::release(record, failure);
}

} // namespace

NativeContext NativeContext::current() noexcept {
    NativeContext const egl = Internal::EGLPlatform::current();
    return egl.pContext_ != nullptr ? egl : Internal::GLXPlatform::current();
}

void* NativeContext::currentHandle() noexcept {
    void* const pContext = Internal::EGLPlatform::currentHandle();
    return pContext != nullptr ? pContext : Internal::GLXPlatform::currentHandle();
}

void NativeContext::makeCurrent() const {
    NativeContext const before = current();
    if (before == *this)
        return;
    Internal::PlatformFailure failure;
    if (before.pContext_ != nullptr && before.eAPI_ != eAPI_ && !tryRelease(before, failure))
        Internal::throwPlatform(__FILE__, __LINE__, "The current OpenGL context could not be released",
                                failure);
    if (pContext_ == nullptr || tryMakeCurrent(*this, failure))
        return;
    // What was released above, or by the refusal itself, comes back if it can.
    Internal::PlatformFailure ignored;
    if (before.pContext_ != nullptr && current() != before)
        tryMakeCurrent(before, ignored);
    Internal::throwPlatform(__FILE__, __LINE__, "The OpenGL context could not be made current", failure);
}

bool NativeContext::isSameContext(NativeContext const& other) const noexcept {
    return eAPI_ == other.eAPI_ && pDisplay_ == other.pDisplay_ && pContext_ == other.pContext_;
}

bool operator==(NativeContext const& a, NativeContext const& b) noexcept {
    return a.isSameContext(b) && a.nDraw_ == b.nDraw_ && a.nRead_ == b.nRead_;
}

bool operator!=(NativeContext const& a, NativeContext const& b) noexcept { return !(a == b); }

} // namespace ORVO::OGL
