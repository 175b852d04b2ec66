#pragma once

#include <cstdint>
#include <memory>

namespace ORVO::DataFlow {

class Controller;

namespace internal {

/// One asynchronous frame, as a job for a frame thread.
///
/// Threads: made by the launching thread, executed and destroyed by the frame's.
class ProcessFrameTask {
public:
    /// A frame of the controller, which is not owned, launched as number `iLaunch`.
    ProcessFrameTask(Controller& controller, std::uint64_t iLaunch)
        : pController_(&controller), iLaunch_(iLaunch) {}

    /// A tracked object, or null if there is no memory for it.
    static ProcessFrameTask* create(Controller& controller, std::uint64_t iLaunch);

    /// Executes and frees a task of create(), and then releases the controller's root, after which neither is
    /// touched.
    static void run(ProcessFrameTask* pTask) noexcept;

private:
    /// Runs the frame. One that was cancelled before it started only has its completion notified.
    void execute() noexcept;
    void notifyOnce() noexcept;

    Controller* pController_;
    std::uint64_t iLaunch_;
};

} // namespace internal
} // namespace ORVO::DataFlow
