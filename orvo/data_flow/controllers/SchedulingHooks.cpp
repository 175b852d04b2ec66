#include "orvo/data_flow/controllers/SchedulingHooks.h"

namespace ORVO::DataFlow::internal {

std::atomic<SchedulingHooks::Hook> SchedulingHooks::pfnSliceHook_{nullptr};
std::atomic<SchedulingHooks::Hook> SchedulingHooks::pfnFrameHook_{nullptr};

namespace {

void call(std::atomic<SchedulingHooks::Hook> const& pfnHook) {
    if (SchedulingHooks::Hook const pfn = pfnHook.load(std::memory_order_acquire)) {
        pfn();
    }
}

} // namespace

void SchedulingHooks::setSliceHook(Hook pfnHook) noexcept {
    pfnSliceHook_.store(pfnHook, std::memory_order_release);
}

void SchedulingHooks::setFrameHook(Hook pfnHook) noexcept {
    pfnFrameHook_.store(pfnHook, std::memory_order_release);
}

void SchedulingHooks::atSlice() { call(pfnSliceHook_); }

void SchedulingHooks::atFrame() { call(pfnFrameHook_); }

} // namespace ORVO::DataFlow::internal
