/// GLX contexts. The library is never loaded from here: a GLX context can only be current where a host has
/// loaded it.
#pragma once

#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/internal/Failure.h"

namespace ORVO::OGL::Internal::GLXPlatform {

/// What is current on the calling thread; an empty record if nothing is.
NativeContext current() noexcept;
/// The context alone: every question to the interface may cost a system call, and this asks one.
void* currentHandle() noexcept;

/// Makes the record current; false with the reason if GLX refuses. An X error that comes with a refusal is
/// caught, so that it does not end the process.
bool makeCurrent(NativeContext const& record, PlatformFailure& failure) noexcept;

/// Releases the calling thread's context, which is the given one.
bool release(NativeContext const& record, PlatformFailure& failure) noexcept;

/// A new context that shares with the given one, with the same frame buffer configuration and a pixel buffer
/// of 1 by 1, on the same display. Throws ExceptionOGL.
NativeContext createSharing(NativeContext const& shareWith);

/// Destroys a context of createSharing with its surface, while the display is still open.
void destroy(NativeContext const& record) noexcept;

} // namespace ORVO::OGL::Internal::GLXPlatform
