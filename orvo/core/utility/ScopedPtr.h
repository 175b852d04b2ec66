#pragma once

#include <utility>

#include "orvo/core/memory/TrackedNew.h"

namespace ORVO {

/// Sole owner of an object of tracked (or plain) new, for one scope. Movable, not copyable.
///
/// Threads: as a plain pointer.
template <typename T>
class ScopedPtr {
public:
    ScopedPtr() noexcept = default;
    /// Takes ownership; null is allowed.
    explicit ScopedPtr(T* pObject) noexcept : pObject_(pObject) {}
    ScopedPtr(ScopedPtr&& other) noexcept : pObject_(other.release()) {}
    ScopedPtr& operator=(ScopedPtr&& other) noexcept {
        reset(other.release());
        return *this;
    }
    ScopedPtr(ScopedPtr const&) = delete;
    ScopedPtr& operator=(ScopedPtr const&) = delete;
    ~ScopedPtr() { trackedDelete(pObject_); }

    /// Destroys the object that is held and takes the new one, which may be null. Resetting to the object
    /// that is held does nothing.
    void reset(T* pObject = nullptr) {
        if (pObject != pObject_)
            trackedDelete(std::exchange(pObject_, pObject));
    }

    /// Gives the object up to the caller.
    [[nodiscard]] T* release() noexcept { return std::exchange(pObject_, nullptr); }

    T* get() const noexcept { return pObject_; }
    T& operator*() const noexcept { return *pObject_; }
    T* operator->() const noexcept { return pObject_; }
    explicit operator bool() const noexcept { return pObject_ != nullptr; }
    void swap(ScopedPtr& other) noexcept { std::swap(pObject_, other.pObject_); }

private:
    T* pObject_ = nullptr;
};

} // namespace ORVO
