#pragma once

#include <condition_variable>
#include <cstddef>
#include <mutex>

namespace ORVO::DataFlow::internal {

/// Counts the frames of one controller: 1 when none is out, one more for each frame that is.
///
/// The last thing that a frame touches of its controller is this latch, and of the latch the notification,
/// under the lock: a thread that returns from wait() may destroy both.
///
/// Threads: any.
class FrameLatch {
public:
    /// Marks the calling thread, for the time of a scope, as one that runs a frame which is counted.
    class ThreadMark {
    public:
        explicit ThreadMark(FrameLatch const& latch) noexcept;
        ThreadMark(ThreadMark const&) = delete;
        ThreadMark& operator=(ThreadMark const&) = delete;
        ~ThreadMark();

    private:
        friend class FrameLatch;
        FrameLatch const* pLatch_;
        ThreadMark const* pOuter_;
    };

    /// One more frame is out. A frame counts from its launch on, so that a wait right after the launch does
    /// not miss it.
    void add();

    /// The frame has ended. Called by the frame as its very last step.
    void release();

    /// Waits until no frame is out but those that the calling thread itself runs.
    void wait();

    /// The count: 1 if no frame is out.
    std::size_t count() const;

    /// Whether the calling thread runs a frame of this latch.
    bool isOnFrameThread() const { return framesOfThisThread() > 0; }

private:
    std::size_t framesOfThisThread() const;

    mutable std::mutex oLock_;
    std::condition_variable oIdle_;
    std::size_t nCount_ = 1;
};

} // namespace ORVO::DataFlow::internal
