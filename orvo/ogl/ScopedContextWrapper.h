#pragma once

#include "orvo/core/Export.h"
#include "orvo/ogl/NativeContext.h"

namespace ORVO::OGL {

/// Saves the calling thread's current context and its surfaces, and makes them current again at its end.
/// Entered with no context current it leaves none current. Works without a driver and without a display.
///
/// Threads: construct and destroy on one thread.
class ORVO_API ScopedContextWrapper {
public:
    ScopedContextWrapper() noexcept;
    /// Restores. If the driver refuses, because the context was destroyed meanwhile, what is current stays
    /// so.
    virtual ~ScopedContextWrapper();
    ScopedContextWrapper(ScopedContextWrapper const&) = delete;
    ScopedContextWrapper& operator=(ScopedContextWrapper const&) = delete;

private:
    NativeContext oSaved_;
};

} // namespace ORVO::OGL
