#include "orvo/data_flow/controllers/ProcessFrameTask.h"

#include "orvo/core/memory/TrackedNew.h"
#include "orvo/data_flow/controllers/Controller.h"
#include "orvo/data_flow/controllers/ControllerImpl.h"
#include "orvo/data_flow/controllers/SchedulingHooks.h"

#include <new>

namespace ORVO::DataFlow::internal {

ProcessFrameTask* ProcessFrameTask::create(Controller& controller, std::uint64_t iLaunch) {
    try {
        return ORVO_NEW ProcessFrameTask(controller, iLaunch);
    } catch (std::bad_alloc const&) {
        return nullptr;
    }
}

void ProcessFrameTask::run(ProcessFrameTask* pTask) noexcept {
    FrameLatch& root = *pTask->pController_->pImpl_->root();
    {
        FrameLatch::ThreadMark const mark(root);
        pTask->execute();
        trackedDelete(pTask);
    }
    root.release();
}

void ProcessFrameTask::execute() noexcept {
    try {
        SchedulingHooks::atFrame();
        if (pController_->pImpl_->isCancelled()) {
            pController_->notifyOfCompletion();
        } else {
            pController_->processFrameFunction();
        }
    } catch (...) {
        // An override failed outside of what the base catches.
        pController_->saveCurrentException();
        notifyOnce();
    }
}

void ProcessFrameTask::notifyOnce() noexcept {
    if (pController_->pImpl_->iNotified_.load(std::memory_order_acquire) >= iLaunch_) {
        return;
    }
    try {
        pController_->notifyOfCompletion();
    } catch (...) {
        pController_->saveCurrentException();
    }
}

} // namespace ORVO::DataFlow::internal
