#pragma once

#include "orvo/core/Export.h"

namespace ORVO::OGL {

/// Abstract handle of an OpenGL context. Who hands one in keeps it alive as long as it is in use.
///
/// Threads: makeCurrent changes the calling thread's current context only; a context is current on one thread
/// at a time.
class ORVO_API Context {
public:
    Context() noexcept;
    Context(Context const&) = delete;
    Context& operator=(Context const&) = delete;
    virtual ~Context();

    /// Makes the context current on the calling thread.
    virtual void makeCurrent() const = 0;

    /// Whether the calling thread's current context shares objects with this one; false if none is current,
    /// true if it is this one.
    virtual bool isSharingWithCurrentContext() const = 0;
};

} // namespace ORVO::OGL
