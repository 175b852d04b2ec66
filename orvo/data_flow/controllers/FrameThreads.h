#pragma once

#include <condition_variable>
#include <cstddef>
#include <deque>
#include <functional>
#include <mutex>
#include <thread>
#include <vector>

namespace ORVO::DataFlow::internal {

/// The threads that asynchronous frames run on: a small process-wide pool that grows when no thread is idle
/// and is joined when the data-flow library is terminated.
///
/// Frames have threads of their own, instead of the scheduler's workers, so that a frame always makes
/// progress: also when the host waits for it inside a task, and on a machine with one processor. Their slices
/// use all workers.
///
/// Threads: run() from any; join() from one that is not of the pool.
class FrameThreads {
public:
    /// The pool of the process.
    static FrameThreads& instance();

    FrameThreads() = default;
    FrameThreads(FrameThreads const&) = delete;
    FrameThreads& operator=(FrameThreads const&) = delete;
    ~FrameThreads();

    /// Runs a job on an idle thread, or on a new one. The job must not throw.
    /// Throws std::system_error or std::bad_alloc if there is no thread to run it; the job will then not run.
    void run(std::function<void()> job);

    /// Lets the jobs that were handed over run to their end and joins all threads. The pool can be used
    /// again.
    void join();

    /// Whether the calling thread belongs to the pool.
    static bool isFrameThread();

    /// Number of threads, idle ones included.
    std::size_t size() const;

private:
    void serve();

    mutable std::mutex oLock_;
    std::condition_variable oWork_;
    std::deque<std::function<void()>> aJobs_;
    std::vector<std::thread> aThreads_;
    std::size_t nIdle_ = 0;
    bool bStop_ = false;
};

} // namespace ORVO::DataFlow::internal
