/// EGL contexts. The library itself is loaded only by createHeadless; until somebody has loaded it, nothing
/// can be current.
#pragma once

#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/internal/Failure.h"

namespace ORVO::OGL::Internal::EGLPlatform {

/// What is current on the calling thread; an empty record if nothing is.
NativeContext current() noexcept;
/// The context alone: every question to the interface may cost a system call, and this asks one.
void* currentHandle() noexcept;

/// Makes the record current; false with the reason if EGL refuses.
bool makeCurrent(NativeContext const& record, PlatformFailure& failure) noexcept;

/// Releases the calling thread's context, which is the given one.
bool release(NativeContext const& record, PlatformFailure& failure) noexcept;

/// A new context that shares with the given one, without a surface or with a pixel buffer of 1 by 1, on the
/// same display. Throws ExceptionOGL.
NativeContext createSharing(NativeContext const& shareWith);

/// A new context that shares with none, on the process's display for headless work: that of the first device
/// with hardware, else the driver's surfaceless one, else the default. Throws ExceptionOGL.
NativeContext createHeadless();

/// Destroys a context of createSharing or createHeadless with its surface.
void destroy(NativeContext const& record) noexcept;

} // namespace ORVO::OGL::Internal::EGLPlatform
