/// Deleters that a std::shared_ptr is given when it takes an object: they decide who owns it.
#pragma once

#include "orvo/core/memory/TrackedNew.h"

namespace ORVO {

/// Destroys the object and frees it in the category it was allocated in. Objects of plain new are as welcome.
///
/// Threads: any, if the object's destructor allows it.
template <typename T>
struct ORVODeleter {
    void operator()(T* pObject) const { trackedDelete(pObject); }
};

/// As ORVODeleter, until release() is called: from then on the object is left alone, so that a shared pointer
/// can give its object up. Found in a shared pointer by std::get_deleter.
///
/// Threads: not synchronised; release() is for the thread that holds the pointer alone.
template <typename T>
class ReleasableDeleter {
public:
    void operator()(T* pObject) const {
        if (!bReleased_)
            trackedDelete(pObject);
    }

    /// The object survives its last holder.
    void release() noexcept { bReleased_ = true; }
    bool isReleased() const noexcept { return bReleased_; }

private:
    bool bReleased_ = false;
};

/// Does nothing: the object belongs to somebody else.
struct NullDeleter {
    void operator()(void const*) const noexcept {}
};

} // namespace ORVO
