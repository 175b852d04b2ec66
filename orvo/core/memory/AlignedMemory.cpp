#include "orvo/core/memory/AlignedMemory.h"

#include <array>
#include <atomic>
#include <new>

#include "orvo/core/Check.h"
#include "orvo/core/memory/AlignedCounts.h"
#include "orvo/core/memory/AllocationGate.h"
#include "orvo/core/memory/ImageStore.h"
#include "orvo/core/utility/Integers.h"

namespace ORVO_private {

namespace {

struct AtomicCounts {
    std::atomic<std::size_t> nBlocks_{0};
    std::atomic<std::size_t> nBytes_{0};
    std::atomic<std::uint64_t> nAllocations_{0};
};

AtomicCounts& countsOf(ORVO::MemoryType type) noexcept {
    static std::array<AtomicCounts, 2> aCounts;
    return aCounts[type == ORVO::MEMORY_TYPE_IMAGE ? 1 : 0];
}

/// A block of the store, or a new one. What the store holds is given back before memory is said to be out.
AlignedBlock* imageBlock(std::size_t bytes) {
    ImageStore& store = ImageStore::instance();
    std::size_t const size = ImageStore::classSize(bytes);
    if (AlignedBlock* const pBlock = store.take(size))
        return pBlock;
    try {
        return AlignedBlock::create(ORVO::MEMORY_TYPE_IMAGE, size, alignof(AlignedBlock));
    } catch (std::bad_alloc const&) {
        if (!store.releaseAll())
            throw;
    }
    return AlignedBlock::create(ORVO::MEMORY_TYPE_IMAGE, size, alignof(AlignedBlock));
}

/// Whether blocks of this alignment are all alike to the store.
bool isRecycled(ORVO::MemoryType type, std::size_t alignment) {
    return type == ORVO::MEMORY_TYPE_IMAGE && alignment <= alignof(AlignedBlock);
}

} // namespace

void* newAlignedMemory(ORVO::MemoryType type, std::size_t bytes, int alignment) {
    ORVO_CHECK_PARAMETER(alignment > 0 && ORVO::isPowerOfTwo(static_cast<unsigned>(alignment)),
                         "alignment is a power of two");
    passAllocationGate();
    std::size_t const wide = static_cast<std::size_t>(alignment);
    AlignedBlock* const pBlock =
        isRecycled(type, wide) ? imageBlock(bytes) : AlignedBlock::create(type, bytes, wide);
    pBlock->open(bytes);

    AtomicCounts& counts = countsOf(type);
    counts.nBlocks_.fetch_add(1, std::memory_order_relaxed);
    counts.nBytes_.fetch_add(bytes, std::memory_order_relaxed);
    counts.nAllocations_.fetch_add(1, std::memory_order_relaxed);
    return pBlock->memory();
}

void deleteAlignedMemory(ORVO::MemoryType type, void* pMemory) {
    if (pMemory == nullptr)
        return;
    AlignedBlock* const pBlock = AlignedBlock::ofMemory(pMemory);
    ORVO_CHECK(pBlock->eState_ == AlignedBlock::IN_USE && pBlock->eType_ == type,
               "Block is of newAlignedMemory and of this type");

    AtomicCounts& counts = countsOf(type);
    counts.nBlocks_.fetch_sub(1, std::memory_order_relaxed);
    counts.nBytes_.fetch_sub(pBlock->nBytes_, std::memory_order_relaxed);
    if (isRecycled(type, pBlock->nAlignment_)) {
        pBlock->close();
        ImageStore::instance().give(pBlock);
    } else {
        AlignedBlock::destroy(pBlock);
    }
}

PointerTable::Counts alignedCounts(ORVO::MemoryType type) noexcept {
    AtomicCounts const& counts = countsOf(type);
    return {counts.nBlocks_.load(std::memory_order_relaxed), counts.nBytes_.load(std::memory_order_relaxed),
            counts.nAllocations_.load(std::memory_order_relaxed)};
}

} // namespace ORVO_private
