#pragma once

#include <cstdint>

#include "orvo/core/Export.h"

namespace ORVO::OGL {

/// Which interface to the window system made a context.
enum class ContextAPI { none, egl, glx };

/// What is current on a thread: a context, its display and its surfaces, as the window system's interface
/// names them. A plain value: it owns nothing and may outlive what it names.
///
/// Works without a driver, a display or any OpenGL library: then nothing is ever current.
///
/// Threads: any; current and makeCurrent speak of the calling thread.
struct ORVO_API NativeContext {
    ContextAPI eAPI_ = ContextAPI::none;
    void* pDisplay_ = nullptr;
    void* pContext_ = nullptr;
    std::uintptr_t nDraw_ = 0;
    std::uintptr_t nRead_ = 0;

    /// What is current on the calling thread, an EGL context or else a GLX one; an empty record if none is.
    static NativeContext current() noexcept;

    /// The handle of the context that is current on the calling thread; null if none is.
    static void* currentHandle() noexcept;

    /// Makes the recorded context and surfaces current; an empty record releases what is current. Does
    /// nothing if they are current already. A context of the other interface is released first, since either
    /// interface refuses while the other one's context is current. Throws ExceptionOGL if the driver refuses;
    /// then what was current before is current again, where the driver allows.
    void makeCurrent() const;

    /// Whether both name the same context, with whatever surfaces; two empty records do.
    bool isSameContext(NativeContext const& other) const noexcept;
};

/// Whether all components agree.
ORVO_API bool operator==(NativeContext const& a, NativeContext const& b) noexcept;
ORVO_API bool operator!=(NativeContext const& a, NativeContext const& b) noexcept;

} // namespace ORVO::OGL
