#pragma once

#include "orvo/core/Export.h"

#include <atomic>

namespace ORVO::DataFlow::internal {

/// The two places where a test can add delays to make interleavings likely that are rare otherwise: the
/// beginning of every slice, and the beginning of every asynchronous frame on its thread. Costs one load each
/// when unset.
///
/// Threads: any. A hook that was replaced may still be running when the setter returns.
class ORVO_API SchedulingHooks {
public:
    using Hook = void (*)();

    /// Null removes the hook.
    static void setSliceHook(Hook pfnHook) noexcept;
    static void setFrameHook(Hook pfnHook) noexcept;

    static void atSlice();
    static void atFrame();

private:
    static std::atomic<Hook> pfnSliceHook_;
    static std::atomic<Hook> pfnFrameHook_;
};

} // namespace ORVO::DataFlow::internal
