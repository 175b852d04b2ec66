#include "orvo/data_flow/controllers/FrameLatch.h"

namespace ORVO::DataFlow::internal {

namespace {
thread_local FrameLatch::ThreadMark const* pInnermostMark = nullptr;
} // namespace

FrameLatch::ThreadMark::ThreadMark(FrameLatch const& latch) noexcept
    : pLatch_(&latch), pOuter_(pInnermostMark) {
    pInnermostMark = this;
}

FrameLatch::ThreadMark::~ThreadMark() { pInnermostMark = pOuter_; }

void FrameLatch::add() {
    std::lock_guard const lock(oLock_);
    ++nCount_;
}

void FrameLatch::release() {
    std::lock_guard const lock(oLock_);
    --nCount_;
    // Under the lock: a waiter cannot return, and destroy the latch, before this call has left it.
    oIdle_.notify_all();
}

void FrameLatch::wait() {
    std::size_t const nOwn = framesOfThisThread();
    std::unique_lock lock(oLock_);
    oIdle_.wait(lock, [this, nOwn] { return nCount_ <= 1 + nOwn; });
}

std::size_t FrameLatch::count() const {
    std::lock_guard const lock(oLock_);
    return nCount_;
}

std::size_t FrameLatch::framesOfThisThread() const {
    std::size_t nFrames = 0;
    for (ThreadMark const* pMark = pInnermostMark; pMark != nullptr; pMark = pMark->pOuter_) {
        if (pMark->pLatch_ == this) {
            ++nFrames;
        }
    }
    return nFrames;
}

} // namespace ORVO::DataFlow::internal
