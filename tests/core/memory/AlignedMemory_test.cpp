#include "orvo/core/memory/AlignedMemory.h"

#include <cstdint>
#include <cstring>
#include <limits>
#include <new>

#include "orvo/core/memory/MemoryStatistics.h"
#include "tests/support/Expect.h"

namespace {

using namespace ORVO;
using Core::MemoryStatistics;
using ORVO_private::deleteAlignedMemory;
using ORVO_private::newAlignedMemory;

TEST(AlignedMemory, IsAlignedAndWritable) {
    for (MemoryType type : {MEMORY_TYPE_OBJECT, MEMORY_TYPE_IMAGE}) {
        for (int alignment : {1, 2, 16, 64, 128, 4096, 65536}) {
            for (std::size_t bytes : {std::size_t(1), std::size_t(63), std::size_t(64), std::size_t(65),
                                      std::size_t(5000), std::size_t(700001), std::size_t(5) << 20}) {
                SCOPED_TRACE(testing::Message() << type << ' ' << alignment << ' ' << bytes);
                void* const pBlock = newAlignedMemory(type, bytes, alignment);
                ASSERT_NE(nullptr, pBlock);
                EXPECT_EQ(0u, reinterpret_cast<std::uintptr_t>(pBlock) % static_cast<unsigned>(alignment));
                std::memset(pBlock, 0xA5, bytes);
                deleteAlignedMemory(type, pBlock);
            }
        }
    }
}

TEST(AlignedMemory, CountsBlocksAndBytesByCategory) {
    for (MemoryType type : {MEMORY_TYPE_OBJECT, MEMORY_TYPE_IMAGE}) {
        MemoryType const other = type == MEMORY_TYPE_OBJECT ? MEMORY_TYPE_IMAGE : MEMORY_TYPE_OBJECT;
        std::size_t const blocks = MemoryStatistics::blocks(type);
        std::size_t const bytes = MemoryStatistics::bytes(type);
        std::uint64_t const allocations = MemoryStatistics::allocations(type);
        std::size_t const otherBlocks = MemoryStatistics::blocks(other);
        void* const pFirst = newAlignedMemory(type, 1000, 64);
        void* const pSecond = newAlignedMemory(type, 24, 16);
        EXPECT_EQ(blocks + 2, MemoryStatistics::blocks(type));
        EXPECT_EQ(bytes + 1024, MemoryStatistics::bytes(type));
        EXPECT_EQ(otherBlocks, MemoryStatistics::blocks(other));
        deleteAlignedMemory(type, pFirst);
        EXPECT_EQ(blocks + 1, MemoryStatistics::blocks(type));
        EXPECT_EQ(bytes + 24, MemoryStatistics::bytes(type));
        deleteAlignedMemory(type, pSecond);
        EXPECT_EQ(blocks, MemoryStatistics::blocks(type));
        EXPECT_EQ(bytes, MemoryStatistics::bytes(type));
        EXPECT_EQ(allocations + 2, MemoryStatistics::allocations(type));
    }
}

TEST(AlignedMemory, GivesABlockOfNoBytesAnAddressOfItsOwn) {
    void* const pFirst = newAlignedMemory(MEMORY_TYPE_IMAGE, 0, 64);
    void* const pSecond = newAlignedMemory(MEMORY_TYPE_IMAGE, 0, 64);
    EXPECT_NE(nullptr, pFirst);
    EXPECT_NE(pFirst, pSecond);
    deleteAlignedMemory(MEMORY_TYPE_IMAGE, pFirst);
    deleteAlignedMemory(MEMORY_TYPE_IMAGE, pSecond);
}

TEST(AlignedMemory, RefusesAnAlignmentThatIsNoPowerOfTwo) {
    for (int alignment : {0, -1, -64, 3, 48, std::numeric_limits<int>::min()})
        ORVO_EXPECT_PARAMETER(newAlignedMemory(MEMORY_TYPE_IMAGE, 100, alignment),
                              "alignment is a power of two");
}

TEST(AlignedMemory, ThrowsBadAllocForSizesThatNoMemoryHas) {
    std::size_t const most = std::numeric_limits<std::size_t>::max();
    for (std::size_t bytes : {most, most - 64, most / 2 + 1, most / 2 - 100}) {
        EXPECT_THROW(newAlignedMemory(MEMORY_TYPE_IMAGE, bytes, 64), std::bad_alloc) << bytes;
        EXPECT_THROW(newAlignedMemory(MEMORY_TYPE_OBJECT, bytes, 4096), std::bad_alloc) << bytes;
    }
}

TEST(AlignedMemory, TakesNullForNothing) {
    deleteAlignedMemory(MEMORY_TYPE_OBJECT, nullptr);
    deleteAlignedMemory(MEMORY_TYPE_IMAGE, nullptr);
}

TEST(AlignedMemory, RefusesABlockOfAnotherCategoryOrOneThatIsFree) {
    void* const pBlock = newAlignedMemory(MEMORY_TYPE_IMAGE, 100, 64);
    char const* const pText = "Block is of newAlignedMemory and of this type";
    ORVO_EXPECT_INTERNAL(deleteAlignedMemory(MEMORY_TYPE_OBJECT, pBlock), pText);
    deleteAlignedMemory(MEMORY_TYPE_IMAGE, pBlock);
    ORVO_EXPECT_INTERNAL(deleteAlignedMemory(MEMORY_TYPE_IMAGE, pBlock), pText);
}

} // namespace
