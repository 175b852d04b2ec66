#include "orvo/data_flow/controllers/FrameThreads.h"

#include "tests/data_flow/controllers/TestNodes.h"

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <set>
#include <thread>

namespace ORVO::Test {

using DataFlow::internal::FrameThreads;

TEST(FrameThreadsTest, IdleThreadIsUsedAgain) {
    FrameThreads threads;
    std::set<std::thread::id> ids;
    // A thread counts as idle a moment after the end of its job, so that the first jobs may each need a new
    // one.
    bool bUsedAgain = false;
    for (int i = 0; i < 1000 && !bUsedAgain; ++i) {
        Signal done;
        threads.run([&] {
            bUsedAgain = !ids.insert(std::this_thread::get_id()).second;
            done.raise();
        });
        done.await();
        std::this_thread::sleep_for(std::chrono::milliseconds(bUsedAgain ? 0 : 1));
    }
    EXPECT_TRUE(bUsedAgain);
    EXPECT_EQ(threads.size(), ids.size());
    EXPECT_EQ(0u, ids.count(std::this_thread::get_id()));
}

TEST(FrameThreadsTest, PoolGrowsSoThatNoJobWaitsForAnother) {
    FrameThreads threads;
    std::vector<Signal> aStarted(10);
    for (std::size_t i = 0; i < aStarted.size(); ++i) {
        threads.run([&, i] {
            aStarted[i].raise();
            for (Signal const& started : aStarted) {
                started.await();
            }
        });
    }
    threads.join();
    for (Signal const& started : aStarted) {
        EXPECT_TRUE(started.isRaised());
    }
    EXPECT_EQ(0u, threads.size());
}

TEST(FrameThreadsTest, JoinRunsWhatWasHandedOverAndThePoolWorksOn) {
    FrameThreads threads;
    for (int iRound = 0; iRound < 3; ++iRound) {
        std::atomic<int> nDone{0};
        for (int i = 0; i < 50; ++i) {
            threads.run([&] { ++nDone; });
        }
        threads.join();
        EXPECT_EQ(50, nDone);
        EXPECT_EQ(0u, threads.size());
    }
    threads.join();
}

TEST(FrameThreadsTest, JobMayHandOverAJobDuringTheJoin) {
    FrameThreads threads;
    std::atomic<int> nDone{0};
    threads.run([&] {
        std::this_thread::sleep_for(std::chrono::milliseconds(2));
        threads.run([&] {
            std::this_thread::sleep_for(std::chrono::milliseconds(2));
            ++nDone;
        });
        ++nDone;
    });
    threads.join();
    EXPECT_EQ(2, nDone);
}

TEST(FrameThreadsTest, KnowsItsThreads) {
    FrameThreads threads;
    EXPECT_FALSE(FrameThreads::isFrameThread());
    bool bInside = false;
    threads.run([&] { bInside = FrameThreads::isFrameThread(); });
    threads.join();
    EXPECT_TRUE(bInside);
}

} // namespace ORVO::Test
