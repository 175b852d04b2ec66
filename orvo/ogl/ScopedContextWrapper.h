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
    /// Restores. If the driver refuses, because the context was destroyed meanwhile, none is current
    /// afterwards: what comes next is refused, and does not go to a context that it was not meant for.
    virtual ~ScopedContextWrapper();
    ScopedContextWrapper(ScopedContextWrapper const&) = delete;
    ScopedContextWrapper& operator=(ScopedContextWrapper const&) = delete;

    /// Restores before the end, for code that goes on in the former context and has to know whether it is
    /// there. Throws ExceptionOGL if the driver refuses; the end then tries once more.
    void restore();

private:
    NativeContext oSaved_;
};

} // namespace ORVO::OGL
