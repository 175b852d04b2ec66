#include "orvo/ogl/internal/ContextNames.h"

#include <algorithm>
#include <atomic>
#include <mutex>
#include <vector>

#include "orvo/core/Check.h"
#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/GL.h"
#include "orvo/ogl/internal/Sentinel.h"

namespace ORVO::OGL::Internal {

namespace {

struct Orphans {
    std::mutex oLock_;
    std::vector<ContextName> aNames_;
    /// Lets the common case, in which nothing is kept, pass without the lock.
    std::atomic<bool> bAny_{false};
};

/// Never destroyed: objects of a host's static storage may die later than ours.
Orphans& orphans() {
    static auto* const pOrphans = new Orphans;
    return *pOrphans;
}

using Kind = ContextName::Kind;

void generate(ContextName& name) noexcept {
    auto const nNames = static_cast<GLsizei>(name.nNames_);
    switch (name.eKind_) {
    case Kind::framebuffer:
        epoxy_glGenFramebuffers(nNames, name.aNames_.data());
        break;
    case Kind::query:
        epoxy_glGenQueries(nNames, name.aNames_.data());
        break;
    case Kind::texture:
        glGenTextures(nNames, name.aNames_.data());
        break;
    }
}

void deleteHere(ContextName const& name) noexcept {
    auto const nNames = static_cast<GLsizei>(name.nNames_);
    switch (name.eKind_) {
    case Kind::framebuffer:
        glDeleteFramebuffers(nNames, name.aNames_.data());
        break;
    case Kind::query:
        epoxy_glDeleteQueries(nNames, name.aNames_.data());
        break;
    case Kind::texture:
        glDeleteTextures(nNames, name.aNames_.data());
        break;
    }
    Sentinel::destroy(name.pSync_);
}

char const* failureOf(Kind eKind) noexcept {
    switch (eKind) {
    case Kind::query:
        return "The queries could not be created";
    case Kind::texture:
        return "The texture names could not be created";
    case Kind::framebuffer:
        break;
    }
    return "The framebuffer could not be created";
}

/// Takes the names out that are kept for the given context.
std::vector<ContextName> takeOrphansOf(void const* pContext) {
    Orphans& kept = orphans();
    std::lock_guard const guard(kept.oLock_);
    auto const isOther = [pContext](ContextName const& name) { return name.pContext_ != pContext; };
    auto const middle = std::partition(kept.aNames_.begin(), kept.aNames_.end(), isOther);
    std::vector<ContextName> aTaken(middle, kept.aNames_.end());
    kept.aNames_.erase(middle, kept.aNames_.end());
    kept.bAny_.store(!kept.aNames_.empty(), std::memory_order_release);
    return aTaken;
}

} // namespace

bool ContextName::isOfCurrentContext() const noexcept {
    return NativeContext::currentHandle() == pContext_ && (pSync_ == nullptr || Sentinel::isAlive(pSync_));
}

ContextName ContextNames::create(Kind eKind, std::size_t nNames) {
    ORVO_CHECK(nNames <= ContextName::nMaximum_);
    ORVO_OGL_REQUIRE_CONTEXT();
    deleteOrphans();
    ContextName name;
    name.eKind_ = eKind;
    name.nNames_ = nNames;
    name.pContext_ = NativeContext::currentHandle();
    name.pSync_ = Sentinel::create();
    generate(name);
    if (name.name() == 0) {
        clearErrors();
        Sentinel::destroy(name.pSync_);
        ORVO_OGL_FAIL(failureOf(eKind), GL_OUT_OF_MEMORY);
    }
    return name;
}

void ContextNames::destroy(ContextName const& name) noexcept {
    if (name.isOfCurrentContext()) {
        deleteHere(name);
        return;
    }
    try {
        Orphans& kept = orphans();
        std::lock_guard const guard(kept.oLock_);
        kept.aNames_.push_back(name);
        kept.bAny_.store(true, std::memory_order_release);
    } catch (...) {
        // Without memory to remember it the name lives as long as its context.
    }
}

void ContextNames::deleteOrphans() noexcept {
    if (!orphans().bAny_.load(std::memory_order_acquire))
        return;
    void* const pContext = NativeContext::currentHandle();
    if (pContext == nullptr)
        return;
    try {
        // A sentinel that is not known here belonged to an earlier context at the same address: its names are
        // gone with it, and the same numbers may be somebody else's now.
        for (ContextName const& name : takeOrphansOf(pContext))
            if (name.isOfCurrentContext())
                deleteHere(name);
    } catch (...) {
        // Without memory for the list it is done the next time.
    }
}

void ContextNames::forgetContext(void const* pContext) noexcept {
    if (!orphans().bAny_.load(std::memory_order_acquire))
        return;
    try {
        takeOrphansOf(pContext);
    } catch (...) {
        // The sentinels keep what is left from being deleted elsewhere.
    }
}

} // namespace ORVO::OGL::Internal
