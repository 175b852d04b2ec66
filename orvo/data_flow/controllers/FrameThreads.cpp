#include "orvo/data_flow/controllers/FrameThreads.h"

#include <utility>

namespace ORVO::DataFlow::internal {

namespace {
thread_local bool bFrameThread = false;
} // namespace

FrameThreads& FrameThreads::instance() {
    static FrameThreads threads;
    return threads;
}

FrameThreads::~FrameThreads() { join(); }

void FrameThreads::run(std::function<void()> job) {
    std::lock_guard const lock(oLock_);
    // A job never waits behind another frame: that frame may be waiting for this one.
    if (nIdle_ <= aJobs_.size()) {
        aJobs_.push_back(std::move(job));
        try {
            aThreads_.emplace_back([this] { serve(); });
        } catch (...) {
            aJobs_.pop_back();
            throw;
        }
        ++nIdle_; // counted for it until it takes its first job
    } else {
        aJobs_.push_back(std::move(job));
    }
    oWork_.notify_one();
}

void FrameThreads::serve() {
    bFrameThread = true;
    std::unique_lock lock(oLock_);
    for (;;) {
        oWork_.wait(lock, [this] { return bStop_ || !aJobs_.empty(); });
        if (aJobs_.empty()) {
            --nIdle_;
            return;
        }
        std::function<void()> job = std::move(aJobs_.front());
        aJobs_.pop_front();
        --nIdle_;
        lock.unlock();
        job();
        job = nullptr;
        lock.lock();
        ++nIdle_;
    }
}

void FrameThreads::join() {
    std::unique_lock lock(oLock_);
    bStop_ = true;
    oWork_.notify_all();
    // A job may start further threads while its own is being joined.
    while (!aThreads_.empty()) {
        std::vector<std::thread> threads;
        threads.swap(aThreads_);
        lock.unlock();
        for (std::thread& thread : threads) {
            thread.join();
        }
        lock.lock();
    }
    bStop_ = false;
}

bool FrameThreads::isFrameThread() { return bFrameThread; }

std::size_t FrameThreads::size() const {
    std::lock_guard const lock(oLock_);
    return aThreads_.size();
}

} // namespace ORVO::DataFlow::internal
