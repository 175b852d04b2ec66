/// Names of objects that contexts do not share, such as framebuffers: each is valid in one context only, and
/// can be deleted only while that context is current.
#pragma once

namespace ORVO::OGL::Internal {

/// One framebuffer's name in one context. The sentinel tells the context from a later one at the same
/// address.
struct ContextName {
    void* pContext_ = nullptr;
    void* pSync_ = nullptr;
    unsigned nName_ = 0;

    /// Whether its context is the current one.
    bool isOfCurrentContext() const noexcept;
};

namespace ContextNames {

/// A new framebuffer name in the current context. Throws ExceptionOGL.
ContextName createFramebuffer();

/// Deletes the framebuffer if its context is current; else keeps it until it is. Threads: any.
void destroyFramebuffer(ContextName const& name) noexcept;

/// Deletes what was kept for the current context. Threads: any.
void deleteOrphans() noexcept;

/// Forgets what was kept for a context that is being destroyed: its names die with it. Threads: any.
void forgetContext(void const* pContext) noexcept;

} // namespace ContextNames
} // namespace ORVO::OGL::Internal
