#pragma once

#include <memory>

#include "orvo/core/Export.h"

namespace ORVO::OGL {

/// Abstract handle of an OpenGL context. Who hands one in keeps it alive as long as it is in use.
///
/// Threads: makeCurrent changes the calling thread's current context only; a context is current on one thread
/// at a time. Drivers differ in whether they refuse a second thread: rely on neither.
class ORVO_API Context {
public:
    Context() noexcept;
    Context(Context const&) = delete;
    Context& operator=(Context const&) = delete;
    virtual ~Context();

    /// A handle of the context that is current on the calling thread, whichever interface made it, with its
    /// present surfaces. It does not own the context: the host keeps that alive, and on destruction the
    /// handle only takes back the one sync object that it made in the context's share group. Throws
    /// ExceptionOGL "No OpenGL context is current".
    static std::unique_ptr<Context> adoptCurrent();

    /// Makes the context current on the calling thread. Throws ExceptionOGL if the driver refuses.
    virtual void makeCurrent() const = 0;

    /// Whether the calling thread's current context shares objects with this one; false if none is current or
    /// if it belongs to the other interface, true if it is this one.
    virtual bool isSharingWithCurrentContext() const = 0;
};

} // namespace ORVO::OGL
