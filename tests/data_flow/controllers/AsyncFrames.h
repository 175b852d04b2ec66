#pragma once

#include "orvo/data_flow/controllers/Controller.h"
#include "orvo/data_flow/controllers/SchedulingHooks.h"

#include "tests/data_flow/controllers/SharedFailure.h"
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

/// checkException() must throw a SharedException around an `Exception` with exactly the given message.
template <typename Exception>
void expectSaved(Controller& controller, std::string const& sMessage) {
    expectShared<Exception>([&controller] { controller.checkException(); }, sMessage);
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
