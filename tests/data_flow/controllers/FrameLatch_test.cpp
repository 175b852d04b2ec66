#include "orvo/data_flow/controllers/FrameLatch.h"

#include <gtest/gtest.h>

#include <atomic>
#include <memory>
#include <thread>

namespace ORVO::Test {

using DataFlow::internal::FrameLatch;

TEST(FrameLatchTest, CountsOneWhenIdle) {
    FrameLatch latch;
    EXPECT_EQ(1u, latch.count());
    latch.wait();
    latch.add();
    latch.add();
    EXPECT_EQ(3u, latch.count());
    latch.release();
    latch.release();
    EXPECT_EQ(1u, latch.count());
}

TEST(FrameLatchTest, WaitReturnsWhenTheLastFrameHasEnded) {
    FrameLatch latch;
    latch.add();
    std::atomic<bool> bEnded{false};
    std::thread frame([&] {
        bEnded = true;
        latch.release();
    });
    latch.wait();
    EXPECT_TRUE(bEnded);
    frame.join();
}

TEST(FrameLatchTest, ThreadDoesNotWaitForFramesOfItsOwn) {
    FrameLatch latch;
    FrameLatch other;
    EXPECT_FALSE(latch.isOnFrameThread());
    latch.add();
    latch.add();
    {
        FrameLatch::ThreadMark const outer(latch);
        FrameLatch::ThreadMark const foreign(other);
        FrameLatch::ThreadMark const inner(latch);
        EXPECT_TRUE(latch.isOnFrameThread());
        latch.wait();
        std::thread([&] { EXPECT_FALSE(latch.isOnFrameThread()); }).join();
    }
    EXPECT_FALSE(latch.isOnFrameThread());
    EXPECT_FALSE(other.isOnFrameThread());
    latch.release();
    latch.release();
}

TEST(FrameLatchTest, LatchMayDieAsSoonAsTheWaitReturns) {
    for (int i = 0; i < 500; ++i) {
        auto pLatch = std::make_unique<FrameLatch>();
        pLatch->add();
        std::thread frame([p = pLatch.get()] { p->release(); });
        pLatch->wait();
        pLatch.reset();
        frame.join();
    }
}

} // namespace ORVO::Test
