#pragma once

#include <atomic>
#include <memory>
#include <mutex>
#include <vector>

namespace ORVO::OGL::Internal {

/// The contexts that share objects with the one in which an object was made. Objects ask it before they
/// delete their name: in a foreign context the same number is somebody else's object.
///
/// Threads: any.
class ShareGroup {
public:
    /// What a name stands for: each kind is deleted by a call of its own.
    enum class Kind { buffer, program, shader, texture };

    /// The group of the calling thread's current context, the same one for all objects and contexts of the
    /// library that are alive in it; what waits to be deleted in it is. Throws ExceptionOGL if its sync
    /// object cannot be made.
    static std::shared_ptr<ShareGroup const> current();

    /// Takes over a sync object of the group; null where the driver has none, and all contexts pass for one
    /// group.
    explicit ShareGroup(void* pSync) noexcept;
    /// Deletes the sync object and what waits if a context of the group is current, else leaves them to the
    /// group's end.
    ~ShareGroup();
    ShareGroup(ShareGroup const&) = delete;
    ShareGroup& operator=(ShareGroup const&) = delete;

    /// Whether a context of the group is current on the calling thread.
    bool isCurrent() const noexcept;

    /// Deletes a name of the group: at once if a context of the group is current, else when deleteWaiting is
    /// called in one. Without memory to remember it, or without a sync object to know the group by, the name
    /// lives as long as the group.
    void destroy(Kind eKind, unsigned nName) const noexcept;

    /// Deletes what waits, if a context of the group is current.
    void deleteWaiting() const noexcept;

private:
    struct Name {
        Kind eKind_;
        unsigned nName_;
    };

    static void deleteName(Name const& name) noexcept;

    void* pSync_;
    mutable std::mutex oLock_;
    mutable std::vector<Name> aWaiting_;
    /// Lets the common case, in which nothing waits, pass without the lock.
    mutable std::atomic<bool> bAnyWaiting_{false};
};

} // namespace ORVO::OGL::Internal
