#pragma once

#include <memory>

namespace ORVO::OGL::Internal {

/// The contexts that share objects with the one in which an object was made. Objects ask it before they
/// delete their name: in a foreign context the same number is somebody else's object.
///
/// Threads: any.
class ShareGroup {
public:
    /// The group of the calling thread's current context, the same one for all objects that are alive in it.
    /// Throws ExceptionOGL if its sync object cannot be made.
    static std::shared_ptr<ShareGroup const> current();

    /// Takes over a sync object of the group; null where the driver has none, and all contexts pass for one
    /// group.
    explicit ShareGroup(void* pSync) noexcept;
    /// Deletes the sync object if a context of the group is current, else leaves it to the group's end.
    ~ShareGroup();
    ShareGroup(ShareGroup const&) = delete;
    ShareGroup& operator=(ShareGroup const&) = delete;

    /// Whether a context of the group is current on the calling thread.
    bool isCurrent() const noexcept;

private:
    void* pSync_;
};

} // namespace ORVO::OGL::Internal
