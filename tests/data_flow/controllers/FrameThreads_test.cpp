#include "orvo/data_flow/controllers/FrameThreads.h"

#include "tests/data_flow/controllers/TestNodes.h"

#include <gtest/gtest.h>

#include <atomic>
#include <set>
#include <thread>

namespace ORVO::Test {

using DataFlow::internal::FrameThreads;

TEST(FrameThreadsTest, IdleThreadIsUsedAgain) {
    FrameThreads threads;
    std::set<std::thread::id> ids;
    for (int i = 0; i < 20; ++i) {
        Signal done;
        threads.run([&] {
            ids.insert(std::this_thread::get_id());
            done.raise();
        });
        done.await();
        // The thread counts as idle a moment after the end of its job.
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
    EXPECT_LE(threads.size(), 3u);
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
