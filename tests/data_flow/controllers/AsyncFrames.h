#pragma once

#include "orvo/core/exceptions/SharedException.h"
#include "orvo/data_flow/controllers/Controller.h"
#include "orvo/data_flow/controllers/SchedulingHooks.h"

#include "tests/data_flow/controllers/TestNodes.h"
#include "tests/support/DataFlowLayers.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

#include <atomic>
#include <functional>
#include <string>
#include <thread>

namespace ORVO::Test {

using DataFlow::Controller;
using DataFlow::internal::SchedulingHooks;

/// For tests of asynchronous frames: brings the layers up, and takes the frame hook away afterwards.
class AsyncFrameTest : public ::testing::Test, protected DataFlowLayers {
protected:
    ~AsyncFrameTest() override { SchedulingHooks::setFrameHook(nullptr); }
};

/// Fails the test instead of hanging it.
inline void waitForEnd(Controller& controller) { ASSERT_TRUE(controller.wait(60.0, 0.0002)); }

inline void failInternally() { ORVO_FAIL("broken"); }

/// The exception that checkException() throws must be a SharedException around an `Exception`; gives its
/// text.
template <typename Exception>
std::string sharedText(Controller& controller) {
    try {
        controller.checkException();
    } catch (SharedException const& shared) {
        auto const* pInner = dynamic_cast<Exception const*>(shared.exception().get());
        return pInner != nullptr ? pInner->message() : std::string("another class: ") + shared.what();
    }
    return "nothing was thrown";
}

/// Counts its sleeps and does not sleep.
struct CountingController : Controller {
    void sleep(double seconds) override {
        ++nSleeps;
        dSlept += seconds;
        if (afterSleep) {
            afterSleep();
        }
    }
    int nSleeps = 0;
    double dSlept = 0.0;
    std::function<void()> afterSleep;
};

struct CallbackRecord {
    Controller* pController = nullptr;
    std::atomic<int> nCalls{0};
    std::atomic<int> iStatus{-1};
    std::thread::id oThread;
    std::function<void()> onCall;

    static bool call(void* pData) {
        auto& record = *static_cast<CallbackRecord*>(pData);
        record.iStatus = static_cast<int>(record.pController->controllerStatus());
        record.oThread = std::this_thread::get_id();
        ++record.nCalls;
        if (record.onCall) {
            record.onCall();
        }
        return false;
    }
    void registerWith(Controller& controller) {
        pController = &controller;
        ASSERT_TRUE(controller.registerProcessingCompletedCallback(&CallbackRecord::call, this));
    }
};

/// While true, frames that are launched with the hook `holdFrame` do not start.
inline std::atomic<bool> bHoldFrames{false};
inline void holdFrame() {
    while (bHoldFrames) {
        std::this_thread::yield();
    }
}

} // namespace ORVO::Test
