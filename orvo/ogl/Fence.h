#pragma once

#include "orvo/core/Export.h"

namespace ORVO::OGL {

/// A point in the commands of one context for which the other contexts of its share group can wait: what one
/// of them draws is not there yet when another one, given its commands later, reads it.
///
/// Threads: each call with a context current, made and used on different threads if need be.
class ORVO_API Fence {
public:
    /// Marks all commands that the current context was given so far, and sends them to the driver. Where the
    /// driver has no sync objects, waits until they are done. Throws ExceptionOGL.
    Fence();
    /// Frees the point if a context of the group is current; otherwise it goes with the group.
    ~Fence();
    Fence(Fence const&) = delete;
    Fence& operator=(Fence const&) = delete;

    /// Lets the commands that the current context is given from now on run after the marked ones. The calling
    /// thread does not wait. Does nothing in a context of another group.
    void wait() const noexcept;

private:
    void* pSync_;
};

/// Waits until everything that the current context was given is done; returns at once if none is current.
ORVO_API void finishCurrentContext() noexcept;

} // namespace ORVO::OGL
