#include "orvo/ogl/internal/ShareGroup.h"

#include <algorithm>
#include <mutex>
#include <vector>

#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/GL.h"
#include "orvo/ogl/internal/Sentinel.h"

namespace ORVO::OGL::Internal {

namespace {

struct KnownGroups {
    std::mutex oLock_;
    std::vector<std::weak_ptr<ShareGroup const>> aGroups_;
};

/// Never destroyed: objects of a host's static storage may be made and die late.
KnownGroups& knownGroups() {
    static auto* const pKnown = new KnownGroups;
    return *pKnown;
}

} // namespace

std::shared_ptr<ShareGroup const> ShareGroup::current() {
    ORVO_OGL_REQUIRE_CONTEXT();
    KnownGroups& known = knownGroups();
    // A group that ends here does so after the lock is given back.
    std::vector<std::shared_ptr<ShareGroup const>> aAlive;
    std::lock_guard const guard(known.oLock_);
    auto const isGone = [](std::weak_ptr<ShareGroup const> const& wp) { return wp.expired(); };
    known.aGroups_.erase(std::remove_if(known.aGroups_.begin(), known.aGroups_.end(), isGone),
                         known.aGroups_.end());
    for (auto const& wpGroup : known.aGroups_) {
        auto spGroup = wpGroup.lock();
        if (spGroup != nullptr && spGroup->isCurrent()) {
            spGroup->deleteWaiting();
            return spGroup;
        }
        aAlive.push_back(std::move(spGroup));
    }
    known.aGroups_.reserve(known.aGroups_.size() + 1);
    auto pSync = std::unique_ptr<void, void (*)(void*)>(Sentinel::create(), &Sentinel::destroy);
    auto spGroup = std::make_shared<ShareGroup const>(pSync.get());
    pSync.release();
    known.aGroups_.push_back(spGroup);
    return spGroup;
}

ShareGroup::ShareGroup(void* pSync) noexcept : pSync_(pSync) {}

ShareGroup::~ShareGroup() {
    if (!isCurrent())
        return;
    deleteWaiting();
    Sentinel::destroy(pSync_);
}

bool ShareGroup::isCurrent() const noexcept {
    return NativeContext::currentHandle() != nullptr && (pSync_ == nullptr || Sentinel::isAlive(pSync_));
}

void ShareGroup::deleteName(Name const& name) noexcept {
    switch (name.eKind_) {
    case Kind::buffer:
        epoxy_glDeleteBuffers(1, &name.nName_);
        break;
    case Kind::program:
        glDeleteProgram(name.nName_);
        break;
    case Kind::shader:
        glDeleteShader(name.nName_);
        break;
    case Kind::texture:
        glDeleteTextures(1, &name.nName_);
        break;
    }
}

void ShareGroup::destroy(Kind eKind, unsigned nName) const noexcept {
    if (isCurrent()) {
        deleteName({eKind, nName});
        return;
    }
    // Without a sync object the next context that is current may be a stranger's, and the number his object.
    if (pSync_ == nullptr)
        return;
    try {
        std::lock_guard const guard(oLock_);
        aWaiting_.push_back({eKind, nName});
        bAnyWaiting_.store(true, std::memory_order_release);
    } catch (...) {
        // It goes with the group.
    }
}

void ShareGroup::deleteWaiting() const noexcept {
    if (!bAnyWaiting_.load(std::memory_order_acquire) || !isCurrent())
        return;
    std::vector<Name> aNames;
    {
        std::lock_guard const guard(oLock_);
        aNames.swap(aWaiting_);
        bAnyWaiting_.store(false, std::memory_order_release);
    }
    std::for_each(aNames.begin(), aNames.end(), &deleteName);
}

} // namespace ORVO::OGL::Internal
