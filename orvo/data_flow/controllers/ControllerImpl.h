#pragma once

#include "orvo/data_flow/controllers/FrameLatch.h"

#include <tbb/task_arena.h>
#include <tbb/task_group.h>

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <mutex>

namespace ORVO {
class ExceptionBase;
}

namespace ORVO::DataFlow {

namespace internal {

class processSliceHelper;

/// What a Controller holds of the scheduler: the group that its slices belong to, the root that its frames
/// hang on, and the arena that bounds its threads. Keeps every TBB type out of the header of Controller.
///
/// Threads: cancelProcess(), isCancelled() and root() from any thread; the rest from the frame's thread, or
/// from the owner's while no frame runs.
class ControllerImpl {
public:
    /// Takes and releases the scheduler lock; the number of threads is not used beyond that.
    explicit ControllerImpl(std::size_t nThreads);
    ~ControllerImpl();
    ControllerImpl(ControllerImpl const&) = delete;
    ControllerImpl& operator=(ControllerImpl const&) = delete;

    /// Takes and releases the lock that serialises scheduler set-up across controllers. Always true.
    static bool initializeScheduler(std::size_t nThreads);
    /// Does nothing: nothing was set up.
    static void terminateScheduler();

    /// Keeps slices that have not started from starting, until resetIfCancelled(). Other controllers go on.
    void cancelProcess();
    /// Whether the group was cancelled and not reset since.
    bool isCancelled();
    /// Makes a cancelled group ready for the next frame. No slice may be running.
    void resetIfCancelled();

    /// Where frames are counted. Null only if a test took it away.
    FrameLatch* root() const { return pRoot_.get(); }

    /// Runs the body over the items [0, nItems) in pieces of `nGrain` items, at least half of it, on at most
    /// `nThreads` threads, and returns when all pieces are done, or skipped after a cancel.
    void forEachSlice(std::size_t nItems, std::size_t nGrain, std::size_t nThreads,
                      processSliceHelper const& body);

    /// The failure that is reported when memory has run out even for a copy of the real one.
    std::shared_ptr<ExceptionBase> const& reserveException() const { return spReserveException_; }

    /// The completion callback as it was at the launch: the owner may set another one while the end of an old
    /// frame is still on its way to it.
    struct Completion {
        bool (*pfnCompleted)(void*) = nullptr;
        void* pData = nullptr;
    };
    Completion oLaunchedCompletion_;

    /// Number of asynchronous launches, and the number of the last launch whose completion was notified.
    std::atomic<std::uint64_t> nLaunches_{0};
    std::atomic<std::uint64_t> iNotified_{0};

private:
    friend struct TestAccess;

    std::shared_ptr<tbb::task_arena> arenaFor(std::size_t nThreads);
    void runAlone(std::size_t nItems, std::size_t nGrain, processSliceHelper const& body);
    void runParallel(std::size_t nItems, std::size_t nGrain, processSliceHelper const& body);

    tbb::task_group_context oGroup_;
    std::unique_ptr<FrameLatch> pRoot_;
    // Made when fewer threads are wanted than the scheduler offers, and again when their number changes.
    std::mutex oArenaLock_;
    std::shared_ptr<tbb::task_arena> spArena_;
    std::size_t nArenaThreads_ = 0;
    std::shared_ptr<ExceptionBase> spReserveException_;
};

} // namespace internal
} // namespace ORVO::DataFlow
