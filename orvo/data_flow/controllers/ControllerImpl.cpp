#include "orvo/data_flow/controllers/ControllerImpl.h"

#include "orvo/core/exceptions/CPURuntimeException.h"
#include "orvo/core/utility/SharedPtr.h"
#include "orvo/data_flow/controllers/processSliceHelper.h"

#include <tbb/parallel_for.h>
#include <tbb/partitioner.h>

#include <algorithm>
#include <mutex>

namespace ORVO::DataFlow::internal {

namespace {

using Range = tbb::blocked_range<std::size_t>;

/// Pieces into which a single thread cuts its work, between which it looks for a cancel.
constexpr std::size_t nPiecesAlone = 16;

std::mutex& schedulerLock() {
    static std::mutex oLock;
    return oLock;
}

} // namespace

ControllerImpl::ControllerImpl(std::size_t nThreads)
    : oGroup_(tbb::task_group_context::isolated, tbb::task_group_context::default_traits) {
    initializeScheduler(nThreads);
    pRoot_ = std::make_unique<FrameLatch>();
    spReserveException_.reset(new CPURuntimeException(CPURuntimeException::CONDITION_UNKNOWN));
}

ControllerImpl::~ControllerImpl() = default;

bool ControllerImpl::initializeScheduler(std::size_t) {
    std::lock_guard const lock(schedulerLock());
    return true;
}

void ControllerImpl::terminateScheduler() {}

void ControllerImpl::cancelProcess() { oGroup_.cancel_group_execution(); }

bool ControllerImpl::isCancelled() { return oGroup_.is_group_execution_cancelled(); }

void ControllerImpl::resetIfCancelled() {
    if (isCancelled()) {
        oGroup_.reset();
    }
}

void ControllerImpl::forEachSlice(std::size_t nItems, std::size_t nGrain, std::size_t nThreads,
                                  processSliceHelper const& body) {
    if (nThreads <= 1) {
        runAlone(nItems, nGrain, body);
    } else if (nItems <= nGrain) {
        // One piece needs no scheduler.
        runAlone(nItems, nItems, body);
    } else if (nThreads >= static_cast<std::size_t>(tbb::this_task_arena::max_concurrency())) {
        // While this thread waits for its last slices it must not take up work of the host's that waits
        // around here: that may need the lock of the very node that is running.
        tbb::this_task_arena::isolate([&] { runParallel(nItems, nGrain, body); });
    } else {
        arenaFor(nThreads)->execute([&] { runParallel(nItems, nGrain, body); });
    }
}

std::shared_ptr<tbb::task_arena> ControllerImpl::arenaFor(std::size_t nThreads) {
    std::lock_guard const lock(oArenaLock_);
    if (!spArena_ || nArenaThreads_ != nThreads) {
        spArena_ = std::make_shared<tbb::task_arena>(static_cast<int>(nThreads));
        nArenaThreads_ = nThreads;
    }
    return spArena_;
}

void ControllerImpl::runAlone(std::size_t nItems, std::size_t nGrain, processSliceHelper const& body) {
    std::size_t const nPiece = std::max(nGrain, (nItems + nPiecesAlone - 1) / nPiecesAlone);
    for (std::size_t iBegin = 0; iBegin < nItems && !isCancelled();) {
        std::size_t const nSlice = std::min(nPiece, nItems - iBegin);
        body(Range(iBegin, iBegin + nSlice));
        iBegin += nSlice;
    }
}

void ControllerImpl::runParallel(std::size_t nItems, std::size_t nGrain, processSliceHelper const& body) {
    tbb::affinity_partitioner partitioner;
    tbb::parallel_for(Range(0, nItems, nGrain), body, partitioner, oGroup_);
}

} // namespace ORVO::DataFlow::internal
