#include "orvo/core/memory/AllocationFailure.h"

#include <new>
#include <thread>
#include <vector>

#include "orvo/core/memory/AlignedMemory.h"
#include "orvo/core/memory/MemoryStatistics.h"
#include "orvo/core/utility/ScopedPtr.h"
#include "tests/support/Expect.h"

namespace {

using namespace ORVO;
using Core::AllocationFailure;

/// Three allocations of two kinds; which of them failed is the number of those before it plus one, 0 for
/// none.
int failedAllocation() {
    int nDone = 0;
    try {
        ScopedPtr<int> const pFirst(ORVO_NEW int(1));
        ++nDone;
        void* const pBlock = ORVO_private::newAlignedMemory(MEMORY_TYPE_IMAGE, 100, 64);
        ++nDone;
        try {
            ScopedPtr<int> const pThird(ORVO_NEW int(3));
        } catch (...) {
            ORVO_private::deleteAlignedMemory(MEMORY_TYPE_IMAGE, pBlock);
            throw;
        }
        ORVO_private::deleteAlignedMemory(MEMORY_TYPE_IMAGE, pBlock);
    } catch (std::bad_alloc const&) {
        return nDone + 1;
    }
    return 0;
}

TEST(AllocationFailure, MakesTheNthAllocationFailAndNoOther) {
    for (int n = 1; n <= 3; ++n) {
        AllocationFailure const failure(static_cast<std::uint64_t>(n));
        EXPECT_FALSE(failure.hasFired());
        EXPECT_EQ(n, failedAllocation());
        EXPECT_TRUE(failure.hasFired());
        EXPECT_EQ(static_cast<std::uint64_t>(n), failure.count());
        EXPECT_EQ(0, failedAllocation());
    }
}

TEST(AllocationFailure, DoesNotFireBeyondTheLastAllocation) {
    AllocationFailure const failure(4);
    EXPECT_EQ(0, failedAllocation());
    EXPECT_FALSE(failure.hasFired());
    EXPECT_EQ(3u, failure.count());
}

TEST(AllocationFailure, OnlyCountsForZero) {
    AllocationFailure const failure(0);
    EXPECT_EQ(0, failedAllocation());
    EXPECT_FALSE(failure.hasFired());
    EXPECT_EQ(3u, failure.count());
}

TEST(AllocationFailure, EndsWithItsScope) {
    { AllocationFailure const failure(1); }
    EXPECT_EQ(0, failedAllocation());
}

TEST(AllocationFailure, LeavesNoCountBehindForAFailedBlock) {
    std::size_t const objects = Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT);
    std::size_t const images = Core::MemoryStatistics::blocks(MEMORY_TYPE_IMAGE);
    for (std::uint64_t n = 1; n <= 3; ++n) {
        AllocationFailure const failure(n);
        failedAllocation();
        EXPECT_EQ(objects, Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT));
        EXPECT_EQ(images, Core::MemoryStatistics::blocks(MEMORY_TYPE_IMAGE));
    }
}

TEST(AllocationFailure, RefusesASecondOne) {
    AllocationFailure const failure(1);
    ORVO_EXPECT_INTERNAL(AllocationFailure(1), "No other AllocationFailure is alive");
    EXPECT_EQ(1, failedAllocation());
}

TEST(AllocationFailure, CountsOnAllThreadsAndFailsOneAlone) {
    AllocationFailure const failure(500);
    std::vector<int> failures(4, 0);
    std::vector<std::thread> threads;
    for (int& nFailures : failures) {
        threads.emplace_back([&nFailures] {
            for (int i = 0; i < 250; ++i) {
                try {
                    trackedDelete(ORVO_NEW int(i));
                } catch (std::bad_alloc const&) {
                    ++nFailures;
                }
            }
        });
    }
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_EQ(1, failures[0] + failures[1] + failures[2] + failures[3]);
    EXPECT_EQ(1000u, failure.count());
}

} // namespace
