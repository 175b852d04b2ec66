#include "orvo/core/memory/TrackedNew.h"

#include <gtest/gtest.h>

#include <atomic>
#include <cstdint>
#include <random>
#include <sstream>
#include <stdexcept>
#include <thread>
#include <vector>

#include "orvo/core/memory/MemoryStatistics.h"
#include "orvo/core/utility/SharedPtr.h"

namespace {

using namespace ORVO;
using Core::MemoryStatistics;

std::size_t blocks() { return MemoryStatistics::blocks(MEMORY_TYPE_OBJECT); }
std::size_t bytes() { return MemoryStatistics::bytes(MEMORY_TYPE_OBJECT); }

struct Base {
    virtual ~Base() = default;
    int iBase_ = 1;
};
struct OtherBase {
    virtual ~OtherBase() = default;
    int iOther_ = 2;
};
struct Derived : Base, OtherBase {
    ~Derived() override { ++nDestroyed; }
    char aPadding_[100] = {};
    static int nDestroyed;
};
int Derived::nDestroyed = 0;

struct alignas(256) Wide {
    char aBytes_[300];
};

struct Throwing {
    Throwing() { throw std::runtime_error("constructor"); }
    char aBytes_[40];
};
struct alignas(128) ThrowingWide {
    ThrowingWide() { throw std::runtime_error("constructor"); }
    char aBytes_[40];
};

TEST(TrackedNew, CountsBlocksAndBytes) {
    std::size_t const blocksBefore = blocks();
    std::size_t const bytesBefore = bytes();
    std::uint64_t const allocationsBefore = MemoryStatistics::allocations(MEMORY_TYPE_OBJECT);
    auto* const pFirst = ORVO_NEW std::uint64_t(7);
    auto* const pSecond = ORVO_NEW Derived;
    EXPECT_EQ(7u, *pFirst);
    EXPECT_EQ(blocksBefore + 2, blocks());
    EXPECT_EQ(bytesBefore + sizeof(std::uint64_t) + sizeof(Derived), bytes());
    trackedDelete(pFirst);
    trackedDelete(pSecond);
    EXPECT_EQ(blocksBefore, blocks());
    EXPECT_EQ(bytesBefore, bytes());
    EXPECT_EQ(allocationsBefore + 2, MemoryStatistics::allocations(MEMORY_TYPE_OBJECT));
}

TEST(TrackedNew, CountsInTheCategoryThatWasAskedFor) {
    std::size_t const objectsBefore = blocks();
    std::size_t const imagesBefore = MemoryStatistics::blocks(MEMORY_TYPE_IMAGE);
    int* const pObject = new (MEMORY_TYPE_IMAGE, "site.cpp", 12) int(3);
    EXPECT_EQ(objectsBefore, blocks());
    EXPECT_EQ(imagesBefore + 1, MemoryStatistics::blocks(MEMORY_TYPE_IMAGE));
    trackedDelete(pObject);
    EXPECT_EQ(imagesBefore, MemoryStatistics::blocks(MEMORY_TYPE_IMAGE));
}

TEST(TrackedNew, NamesTheSitesOfBlocksInUse) {
    int* const pObject = new (MEMORY_TYPE_OBJECT, "folder/site.cpp", 1234) int(3);
    std::ostringstream with;
    MemoryStatistics::writeObjects(with);
    EXPECT_NE(std::string::npos, with.str().find("4 bytes at folder/site.cpp:1234\n"));
    trackedDelete(pObject);
    std::ostringstream without;
    MemoryStatistics::writeObjects(without);
    EXPECT_EQ(std::string::npos, without.str().find("folder/site.cpp:1234"));
}

TEST(TrackedNew, FreesAPolymorphicObjectThroughAnyBase) {
    std::size_t const before = blocks();
    Derived::nDestroyed = 0;
    auto* const pDerived = ORVO_NEW Derived;
    OtherBase* const pOther = pDerived;
    ASSERT_NE(static_cast<void*>(pDerived), static_cast<void*>(pOther));
    trackedDelete(pOther);
    EXPECT_EQ(1, Derived::nDestroyed);
    EXPECT_EQ(before, blocks());
    Base const* const pBase = ORVO_NEW Derived;
    trackedDelete(pBase);
    EXPECT_EQ(2, Derived::nDestroyed);
    EXPECT_EQ(before, blocks());
}

TEST(TrackedNew, FreesAnObjectOfPlainNewAsWell) {
    std::size_t const before = blocks();
    OtherBase* const pOther = new Derived;
    EXPECT_EQ(before, blocks());
    trackedDelete(pOther);
    EXPECT_EQ(before, blocks());
    trackedDelete(new int(5));
    EXPECT_EQ(before, blocks());
}

TEST(TrackedNew, TakesNull) {
    trackedDelete(static_cast<Derived*>(nullptr));
    operator delete(nullptr, MEMORY_TYPE_OBJECT, __FILE__, __LINE__);
    operator delete(nullptr, std::align_val_t(64), MEMORY_TYPE_OBJECT, __FILE__, __LINE__);
}

TEST(TrackedNew, KeepsAWideAlignment) {
    std::size_t const before = bytes();
    auto* const pWide = ORVO_NEW Wide;
    EXPECT_EQ(0u, reinterpret_cast<std::uintptr_t>(pWide) % 256);
    EXPECT_EQ(before + sizeof(Wide), bytes());
    trackedDelete(pWide);
    EXPECT_EQ(before, bytes());
}

TEST(TrackedNew, FreesTheBlockWhereAConstructorThrows) {
    std::size_t const before = blocks();
    EXPECT_THROW(ORVO_NEW Throwing, std::runtime_error);
    EXPECT_EQ(before, blocks());
    EXPECT_THROW(ORVO_NEW ThrowingWide, std::runtime_error);
    EXPECT_EQ(before, blocks());
}

TEST(TrackedNew, FreesRawMemoryThroughItsOwnDelete) {
    std::size_t const before = bytes();
    void* const pBlock = operator new(1000, MEMORY_TYPE_OBJECT, __FILE__, __LINE__);
    EXPECT_EQ(before + 1000, bytes());
    operator delete(pBlock, MEMORY_TYPE_OBJECT, __FILE__, __LINE__);
    EXPECT_EQ(before, bytes());
}

TEST(TrackedNew, CorrectsItselfAfterAPlainDelete) {
    // The block of a tracked object that was freed with plain delete stays counted until its address comes
    // back.
    std::size_t const before = blocks();
    int* const pObject = ORVO_NEW int(1);
    std::uintptr_t const volatile address = reinterpret_cast<std::uintptr_t>(pObject);
    delete pObject;
    EXPECT_EQ(before + 1, blocks());
    ORVO_private::forgetTrackedBlock(reinterpret_cast<void const*>(address));
    EXPECT_EQ(before, blocks());
}

TEST(TrackedNew, CountsABlockOnceWhoseAddressComesBackAfterAPlainDelete) {
    std::size_t const before = blocks();
    int* const pFreed = ORVO_NEW int(1);
    std::uintptr_t const volatile address = reinterpret_cast<std::uintptr_t>(pFreed);
    delete pFreed;
    // The heap mostly gives the address out again at once; one that holds it back leaves the old entry
    // counted.
    std::vector<int*> held;
    bool bCameBack = false;
    while (!bCameBack && held.size() < 1000) {
        held.push_back(ORVO_NEW int(2));
        bCameBack = reinterpret_cast<std::uintptr_t>(held.back()) == address;
    }
    EXPECT_EQ(before + held.size() + (bCameBack ? 0 : 1), blocks());
    for (int* pHeld : held)
        trackedDelete(pHeld);
    EXPECT_EQ(before + (bCameBack ? 0 : 1), blocks());
    ORVO_private::forgetTrackedBlock(reinterpret_cast<void const*>(address));
    EXPECT_EQ(before, blocks());
}

TEST(TrackedNew, CountsManyBlocksFreedInAnyOrder) {
    std::size_t const blocksBefore = blocks();
    std::size_t const bytesBefore = bytes();
    std::mt19937 random(1);
    std::vector<std::pair<void*, std::size_t>> held;
    std::size_t nHeldBytes = 0;
    for (int round = 0; round < 100000; ++round) {
        if (held.empty() || random() % 100 < (round < 50000 ? 60u : 40u)) {
            std::size_t const size = 1 + random() % 200;
            held.emplace_back(operator new(size, MEMORY_TYPE_OBJECT, __FILE__, __LINE__), size);
            nHeldBytes += size;
        } else {
            std::swap(held[random() % held.size()], held.back());
            nHeldBytes -= held.back().second;
            operator delete(held.back().first, MEMORY_TYPE_OBJECT, __FILE__, __LINE__);
            held.pop_back();
        }
        if (round % 1000 == 0) {
            ASSERT_EQ(blocksBefore + held.size(), blocks());
            ASSERT_EQ(bytesBefore + nHeldBytes, bytes());
        }
    }
    for (auto const& [pBlock, size] : held)
        operator delete(pBlock, MEMORY_TYPE_OBJECT, __FILE__, __LINE__);
    EXPECT_EQ(blocksBefore, blocks());
    EXPECT_EQ(bytesBefore, bytes());
}

TEST(TrackedNew, WorksOnManyThreadsAndAcrossThem) {
    std::size_t const blocksBefore = blocks();
    std::size_t const bytesBefore = bytes();
    constexpr int nThreads = 4;
    constexpr int nRounds = 5000;
    std::vector<std::atomic<std::uint64_t*>> exchanged(64);
    std::vector<std::thread> threads;
    for (int thread = 0; thread < nThreads; ++thread) {
        threads.emplace_back([&, thread] {
            std::mt19937 random(static_cast<unsigned>(thread));
            for (int round = 0; round < nRounds; ++round) {
                std::uint64_t* const pOld =
                    exchanged[random() % exchanged.size()].exchange(ORVO_NEW std::uint64_t(1));
                trackedDelete(pOld); // often one of another thread's
            }
        });
    }
    for (std::thread& thread : threads)
        thread.join();
    for (auto& slot : exchanged)
        trackedDelete(slot.load());
    EXPECT_EQ(blocksBefore, blocks());
    EXPECT_EQ(bytesBefore, bytes());
}

} // namespace
