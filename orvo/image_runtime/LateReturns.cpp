#include "orvo/image_runtime/LateReturns.h"

#include "orvo/core/memory/TrackedNew.h"
#include "orvo/ogl/Texture2D.h"

#include <algorithm>
#include <atomic>
#include <list>
#include <mutex>

namespace ORVO {

namespace {

struct Waiting {
    std::mutex oLock_;
    std::list<OGL::Texture2D*> vpTexture_;
    /// Lets the common case, in which nothing waits, pass without the lock.
    std::atomic<bool> bAny_{false};
};

/// Never destroyed: a host's static images may die later than our statics.
Waiting& waiting() {
    static auto* const pWaiting = new Waiting;
    return *pWaiting;
}

} // namespace

void LateReturns::add(OGL::Texture2D* pTexture) noexcept {
    try {
        Waiting& all = waiting();
        std::lock_guard const guard(all.oLock_);
        all.vpTexture_.push_back(pTexture);
        all.bAny_.store(true, std::memory_order_release);
    } catch (...) {
        trackedDelete(pTexture);
    }
}

OGL::Texture2D* LateReturns::takeOneOfCurrentContext() noexcept {
    Waiting& all = waiting();
    if (!all.bAny_.load(std::memory_order_acquire))
        return nullptr;
    std::lock_guard const guard(all.oLock_);
    auto const isOurs = [](OGL::Texture2D const* pTexture) { return pTexture->isShareGroupCurrent(); };
    auto const found = std::find_if(all.vpTexture_.begin(), all.vpTexture_.end(), isOurs);
    if (found == all.vpTexture_.end())
        return nullptr;
    OGL::Texture2D* const pTexture = *found;
    all.vpTexture_.erase(found);
    all.bAny_.store(!all.vpTexture_.empty(), std::memory_order_release);
    return pTexture;
}

void LateReturns::clear() noexcept {
    Waiting& all = waiting();
    std::lock_guard const guard(all.oLock_);
    for (OGL::Texture2D* pTexture : all.vpTexture_)
        trackedDelete(pTexture);
    all.vpTexture_.clear();
    all.bAny_.store(false, std::memory_order_release);
}

} // namespace ORVO
