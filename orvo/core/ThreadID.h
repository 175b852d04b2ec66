#pragma once

#include <iosfwd>
#include <thread>

#include "orvo/core/Export.h"

namespace ORVO {

/// The identity of the thread that constructed it. A copy keeps the identity of the original.
///
/// Threads: a plain value.
class ORVO_API ThreadID {
public:
    /// Takes the identity of the calling thread.
    ThreadID() noexcept;

    /// Whether the calling thread is the one whose identity this is.
    bool isCurrent() const noexcept;

    friend bool operator==(ThreadID const& a, ThreadID const& b) noexcept { return a.id_ == b.id_; }
    friend bool operator!=(ThreadID const& a, ThreadID const& b) noexcept { return a.id_ != b.id_; }
    ORVO_API friend std::ostream& operator<<(std::ostream& stream, ThreadID const& id);

private:
    std::thread::id id_;
};

} // namespace ORVO
