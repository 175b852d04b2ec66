#include "orvo/core/memory/ImageStorage.h"

#include <gtest/gtest.h>
#include <sys/resource.h>

#include <cstring>
#include <fstream>
#include <new>
#include <set>
#include <thread>
#include <vector>

#include "orvo/core/memory/AlignedMemory.h"
#include "orvo/core/memory/MemoryStatistics.h"

#if defined(__SANITIZE_ADDRESS__)
#include <sanitizer/asan_interface.h>
#endif

namespace {

using namespace ORVO;

constexpr std::size_t nMiB = std::size_t(1) << 20;
constexpr std::size_t nDefaultLimit = std::size_t(1) << 30;

void* allocate(std::size_t bytes) { return ORVO_private::newAlignedMemory(MEMORY_TYPE_IMAGE, bytes, 64); }
void release(void* pBlock) { ORVO_private::deleteAlignedMemory(MEMORY_TYPE_IMAGE, pBlock); }

/// Starts and ends with an empty store and the default limit.
class ImageStorage : public testing::Test {
protected:
    void SetUp() override {
        ASSERT_EQ(nDefaultLimit, Core::imageStorageLimit());
        Core::releaseImageStorage();
    }
    void TearDown() override {
        Core::setImageStorageLimit(nDefaultLimit);
        Core::releaseImageStorage();
    }
};

TEST_F(ImageStorage, GivesAFreedBlockToTheNextImageOfItsSize) {
    for (std::size_t bytes : {std::size_t(1), std::size_t(1000), 3 * nMiB, 40 * nMiB}) {
        void* const pFirst = allocate(bytes);
        EXPECT_EQ(0u, Core::heldImageStorage());
        release(pFirst);
        EXPECT_GE(Core::heldImageStorage(), bytes);
        void* const pSecond = allocate(bytes);
        EXPECT_EQ(pFirst, pSecond) << bytes;
        EXPECT_EQ(0u, Core::heldImageStorage());
        release(pSecond);
        Core::releaseImageStorage();
    }
}

TEST_F(ImageStorage, RoundsSizesUpToEightClassesADoubling) {
    // Between 1 MiB and 2 MiB classes are 128 KiB apart.
    void* const pFirst = allocate(nMiB + 1);
    release(pFirst);
    void* const pSame = allocate(nMiB + nMiB / 8);
    EXPECT_EQ(pFirst, pSame);
    release(pSame);
    void* const pNext = allocate(nMiB + nMiB / 8 + 1);
    EXPECT_NE(pFirst, pNext);
    void* const pBelow = allocate(nMiB);
    EXPECT_NE(pFirst, pBelow);
    release(pNext);
    release(pBelow);
}

TEST_F(ImageStorage, NeverWastesMoreThanAnEighthAndAHeader) {
    for (std::size_t bytes = 4096; bytes < 64 * nMiB; bytes = bytes * 5 / 4 + 1) {
        release(allocate(bytes));
        // A page of rounding and the header beside the class's eighth.
        EXPECT_LE(Core::heldImageStorage(), bytes + bytes / 8 + 2 * 4096) << bytes;
        Core::releaseImageStorage();
    }
}

TEST_F(ImageStorage, GivesTheBlockThatCameBackLastFirst) {
    void* const pFirst = allocate(nMiB);
    void* const pSecond = allocate(nMiB);
    release(pFirst);
    release(pSecond);
    void* const pThird = allocate(nMiB);
    EXPECT_EQ(pSecond, pThird);
    void* const pFourth = allocate(nMiB);
    EXPECT_EQ(pFirst, pFourth);
    release(pThird);
    release(pFourth);
}

TEST_F(ImageStorage, KeepsNoMoreThanItsLimitAndDropsTheOldestFirst) {
    std::vector<void*> blocks;
    for (int i = 0; i < 4; ++i)
        blocks.push_back(allocate(nMiB));
    Core::setImageStorageLimit(3 * nMiB + nMiB / 2);
    EXPECT_EQ(3 * nMiB + nMiB / 2, Core::imageStorageLimit());
    for (void* pBlock : blocks)
        release(pBlock);
    EXPECT_LE(Core::heldImageStorage(), Core::imageStorageLimit());
    EXPECT_GE(Core::heldImageStorage(), 3 * nMiB);
    // The first one went: the other three come back, the last one first.
    for (int i = 3; i >= 1; --i) {
        void* const pBlock = allocate(nMiB);
        EXPECT_EQ(blocks[static_cast<std::size_t>(i)], pBlock) << i;
        blocks[static_cast<std::size_t>(i)] = pBlock;
    }
    EXPECT_EQ(0u, Core::heldImageStorage());
    for (int i = 1; i < 4; ++i)
        release(blocks[static_cast<std::size_t>(i)]);
}

TEST_F(ImageStorage, DropsOldBlocksOfOtherSizesForNewOnes) {
    Core::setImageStorageLimit(5 * nMiB);
    void* const pSmall = allocate(2 * nMiB);
    void* const pLarge = allocate(4 * nMiB);
    release(pSmall);
    std::size_t const held = Core::heldImageStorage();
    EXPECT_GE(held, 2 * nMiB);
    release(pLarge);
    EXPECT_GE(Core::heldImageStorage(), 4 * nMiB);
    EXPECT_LE(Core::heldImageStorage(), 5 * nMiB);
    void* const pAgain = allocate(4 * nMiB);
    EXPECT_EQ(pLarge, pAgain);
    EXPECT_EQ(0u, Core::heldImageStorage());
    release(pAgain);
}

TEST_F(ImageStorage, LeavesTheOthersForABlockAboveItsLimit) {
    Core::setImageStorageLimit(3 * nMiB);
    void* const pSmall = allocate(nMiB);
    void* const pLarge = allocate(8 * nMiB);
    release(pSmall);
    std::size_t const held = Core::heldImageStorage();
    release(pLarge);
    EXPECT_EQ(held, Core::heldImageStorage());
}

TEST_F(ImageStorage, GivesBackAtOnceWhatALowerLimitForbids) {
    std::vector<void*> blocks;
    for (int i = 0; i < 4; ++i)
        blocks.push_back(allocate(nMiB));
    for (void* pBlock : blocks)
        release(pBlock);
    EXPECT_GE(Core::heldImageStorage(), 4 * nMiB);
    Core::setImageStorageLimit(2 * nMiB + nMiB / 2);
    EXPECT_LE(Core::heldImageStorage(), 2 * nMiB + nMiB / 2);
    EXPECT_GE(Core::heldImageStorage(), 2 * nMiB);
}

TEST_F(ImageStorage, KeepsNothingAtALimitOfZero) {
    Core::setImageStorageLimit(0);
    release(allocate(nMiB));
    release(allocate(1));
    EXPECT_EQ(0u, Core::heldImageStorage());
}

TEST_F(ImageStorage, GivesAllBackOnRequestAndWorksOn) {
    release(allocate(nMiB));
    release(allocate(100));
    Core::releaseImageStorage();
    EXPECT_EQ(0u, Core::heldImageStorage());
    Core::releaseImageStorage();
    void* const pBlock = allocate(nMiB);
    std::memset(pBlock, 1, nMiB);
    release(pBlock);
    EXPECT_GE(Core::heldImageStorage(), nMiB);
}

TEST_F(ImageStorage, DoesNotCountHeldBlocksAsInUse) {
    std::size_t const blocks = Core::MemoryStatistics::blocks(MEMORY_TYPE_IMAGE);
    std::size_t const bytes = Core::MemoryStatistics::bytes(MEMORY_TYPE_IMAGE);
    release(allocate(nMiB));
    EXPECT_EQ(blocks, Core::MemoryStatistics::blocks(MEMORY_TYPE_IMAGE));
    EXPECT_EQ(bytes, Core::MemoryStatistics::bytes(MEMORY_TYPE_IMAGE));
}

TEST_F(ImageStorage, KeepsBlocksOfOtherCategoriesOut) {
    void* const pBlock = ORVO_private::newAlignedMemory(MEMORY_TYPE_OBJECT, nMiB, 64);
    ORVO_private::deleteAlignedMemory(MEMORY_TYPE_OBJECT, pBlock);
    EXPECT_EQ(0u, Core::heldImageStorage());
    void* const pWide = ORVO_private::newAlignedMemory(MEMORY_TYPE_IMAGE, nMiB, 8192);
    ORVO_private::deleteAlignedMemory(MEMORY_TYPE_IMAGE, pWide);
    EXPECT_EQ(0u, Core::heldImageStorage());
}

TEST_F(ImageStorage, GivesNoBlockTwice) {
    std::set<void*> blocks;
    for (int round = 0; round < 3; ++round) {
        for (int i = 0; i < 50; ++i)
            EXPECT_TRUE(blocks.insert(allocate(10000)).second);
        for (void* pBlock : blocks)
            release(pBlock);
        blocks.clear();
    }
}

#if !defined(__SANITIZE_ADDRESS__) && !defined(__SANITIZE_THREAD__)
// The sanitizers' own memory takes faults that no program can foresee.
long minorFaults() {
    rusage usage{};
    getrusage(RUSAGE_SELF, &usage);
    return usage.ru_minflt;
}

TEST_F(ImageStorage, TakesNoPageFaultsForAFrameOfTheSameSizes) {
    std::size_t const sizes[] = {8 * nMiB, 2 * nMiB, 8 * nMiB, 300000, 64};
    auto const frame = [&sizes] {
        void* aBlocks[5] = {};
        for (int i = 0; i < 5; ++i) {
            aBlocks[i] = allocate(sizes[i]);
            std::memset(aBlocks[i], i, sizes[i]);
        }
        for (void* pBlock : aBlocks)
            release(pBlock);
    };
    frame();
    frame();
    long const before = minorFaults();
    for (int i = 0; i < 10; ++i)
        frame();
    EXPECT_LE(minorFaults() - before,
              2); // 18 MiB a frame would be 4,600 pages, or 9 huge ones; two for the system
}

/// Lowers the address space of the process to what it uses and a bit more, for a scope.
class AddressSpaceLimit {
public:
    explicit AddressSpaceLimit(std::size_t nMore) {
        std::size_t nPages = 0;
        std::ifstream("/proc/self/statm") >> nPages;
        getrlimit(RLIMIT_AS, &oOld_);
        rlimit lower = oOld_;
        lower.rlim_cur = nPages * 4096 + nMore;
        setrlimit(RLIMIT_AS, &lower);
    }
    ~AddressSpaceLimit() { setrlimit(RLIMIT_AS, &oOld_); }
    AddressSpaceLimit(AddressSpaceLimit const&) = delete;
    AddressSpaceLimit& operator=(AddressSpaceLimit const&) = delete;

private:
    rlimit oOld_{};
};

TEST_F(ImageStorage, GivesHeldBlocksBackBeforeMemoryIsSaidToBeOut) {
    release(allocate(256 * nMiB));
    AddressSpaceLimit const limit(64 * nMiB);
    void* const pOther = allocate(200 * nMiB); // of another class: only the room of the held block serves it
    EXPECT_EQ(0u, Core::heldImageStorage());
    release(pOther);
    EXPECT_THROW(allocate(1024 * nMiB), std::bad_alloc);
    void* const pSmall = allocate(nMiB);
    EXPECT_NE(nullptr, pSmall);
    release(pSmall);
}
#endif

#if defined(__SANITIZE_ADDRESS__)
TEST_F(ImageStorage, PoisonsWhatItHolds) {
    auto* const pBlock = static_cast<char*>(allocate(1000));
    EXPECT_EQ(nullptr, __asan_region_is_poisoned(pBlock, 1000));
    EXPECT_NE(0, __asan_address_is_poisoned(pBlock + 1000)); // the rest of the class
    release(pBlock);
    EXPECT_NE(0, __asan_address_is_poisoned(pBlock));
    EXPECT_NE(0, __asan_address_is_poisoned(pBlock + 999));
    auto* const pAgain = static_cast<char*>(allocate(1020));
    ASSERT_EQ(pBlock, pAgain);
    EXPECT_EQ(nullptr, __asan_region_is_poisoned(pAgain, 1020));
    EXPECT_NE(0, __asan_address_is_poisoned(pAgain + 1020));
    release(pAgain);
}
#endif

TEST_F(ImageStorage, WorksOnManyThreads) {
    Core::setImageStorageLimit(4 * nMiB);
    std::vector<std::thread> threads;
    for (unsigned thread = 0; thread < 4; ++thread) {
        threads.emplace_back([thread] {
            for (unsigned i = 0; i < 400; ++i) {
                std::size_t const bytes = 1000 + 70000 * ((i + thread) % 9);
                auto* const pBytes = static_cast<unsigned char*>(allocate(bytes));
                std::memset(pBytes, static_cast<int>(thread), bytes);
                EXPECT_EQ(thread, pBytes[0]);
                EXPECT_EQ(thread, pBytes[bytes - 1]);
                release(pBytes);
                if (i % 100 == 99)
                    Core::releaseImageStorage();
            }
        });
    }
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_LE(Core::heldImageStorage(), 4 * nMiB);
}

} // namespace
