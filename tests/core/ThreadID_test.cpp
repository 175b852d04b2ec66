#include "orvo/core/ThreadID.h"

#include <gtest/gtest.h>

#include <sstream>
#include <thread>

namespace {

using ORVO::ThreadID;

TEST(ThreadID, IsThatOfTheConstructingThread) {
    ThreadID const here;
    EXPECT_TRUE(here.isCurrent());
    EXPECT_TRUE(here == ThreadID());
    EXPECT_FALSE(here != ThreadID());

    bool bSame = true;
    bool bCurrent = true;
    bool bCopyKeeps = false;
    std::thread([&] {
        ThreadID const there;
        ThreadID const copy(here);
        bSame = there == here;
        bCurrent = here.isCurrent();
        bCopyKeeps = copy == here && copy != there;
    }).join();
    EXPECT_FALSE(bSame);
    EXPECT_FALSE(bCurrent);
    EXPECT_TRUE(bCopyKeeps);
}

TEST(ThreadID, Prints) {
    std::ostringstream stream;
    std::ostringstream expected;
    stream << ThreadID();
    expected << std::this_thread::get_id();
    EXPECT_EQ(expected.str(), stream.str());
}

} // namespace
