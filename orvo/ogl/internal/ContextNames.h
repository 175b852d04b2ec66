/// Names of objects that contexts do not share, such as framebuffers and queries: each is valid in one
/// context only, and can be deleted only while that context is current.
#pragma once

#include <array>
#include <cstddef>

namespace ORVO::OGL::Internal {

/// Names that were made together in one context, all of one kind. The sentinel tells the context from a later
/// one at the same address.
struct ContextName {
    enum class Kind { framebuffer, query, texture };
    static constexpr std::size_t nMaximum_ = 16;

    Kind eKind_ = Kind::framebuffer;
    void* pContext_ = nullptr;
    void* pSync_ = nullptr;
    /// How many names there are; the rest are 0.
    std::size_t nNames_ = 0;
    std::array<unsigned, nMaximum_> aNames_{};

    unsigned name() const noexcept { return aNames_[0]; }

    /// Whether its context is the current one.
    bool isOfCurrentContext() const noexcept;
};

namespace ContextNames {

/// New names in the current context, at most ContextName::nMaximum_. Throws ExceptionOGL.
ContextName create(ContextName::Kind eKind, std::size_t nNames);

/// Deletes the names if their context is current; else keeps them until it is. Threads: any.
void destroy(ContextName const& name) noexcept;

/// Deletes what was kept for the current context. Threads: any.
void deleteOrphans() noexcept;

/// Forgets what was kept for a context that is being destroyed: its names die with it. Threads: any.
void forgetContext(void const* pContext) noexcept;

} // namespace ContextNames
} // namespace ORVO::OGL::Internal
