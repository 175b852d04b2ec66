#include "orvo/core/memory/AlignedBlock.h"

#include <sys/mman.h>

#include <algorithm>
#include <limits>
#include <new>

#if defined(__has_feature)
#if __has_feature(address_sanitizer)
#define ORVO_ADDRESS_SANITIZER 1
#endif
#if __has_feature(thread_sanitizer)
#define ORVO_THREAD_SANITIZER 1
#endif
#endif
#if defined(__SANITIZE_ADDRESS__)
#define ORVO_ADDRESS_SANITIZER 1
#endif
#if defined(__SANITIZE_THREAD__)
#define ORVO_THREAD_SANITIZER 1
#endif

#if defined(ORVO_ADDRESS_SANITIZER)
#include <sanitizer/asan_interface.h>
#endif

namespace ORVO_private {

namespace {

// The sanitizers watch the heap, not mapped pages.
#if defined(ORVO_ADDRESS_SANITIZER) || defined(ORVO_THREAD_SANITIZER)
constexpr std::size_t nSmallestMapping = std::numeric_limits<std::size_t>::max();
#else
constexpr std::size_t nSmallestMapping = std::size_t(256) << 10;
#endif
constexpr std::size_t nSmallestHugeMapping = std::size_t(4) << 20;
constexpr std::size_t nPage = 4096;

void poison([[maybe_unused]] void* pMemory, [[maybe_unused]] std::size_t bytes) noexcept {
#if defined(ORVO_ADDRESS_SANITIZER)
    ASAN_POISON_MEMORY_REGION(pMemory, bytes);
#endif
}

void unpoison([[maybe_unused]] void* pMemory, [[maybe_unused]] std::size_t bytes) noexcept {
#if defined(ORVO_ADDRESS_SANITIZER)
    ASAN_UNPOISON_MEMORY_REGION(pMemory, bytes);
#endif
}

void* mapPages(std::size_t bytes) {
    void* const pPages = mmap(nullptr, bytes, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    if (pPages == MAP_FAILED)
        throw std::bad_alloc();
    if (bytes >= nSmallestHugeMapping)
        madvise(pPages, bytes, MADV_HUGEPAGE); // advice: a system without huge pages refuses, and all works
    return pPages;
}

} // namespace

AlignedBlock* AlignedBlock::create(ORVO::MemoryType type, std::size_t capacity, std::size_t alignment) {
    alignment = std::max(alignment, alignof(AlignedBlock));
    // The header is as large as a multiple of its own alignment; a larger alignment needs padding in front of
    // it.
    std::size_t const offset = (sizeof(AlignedBlock) + alignment - 1) / alignment * alignment;
    if (capacity > std::numeric_limits<std::size_t>::max() / 2 - offset)
        throw std::bad_alloc();
    std::size_t total = offset + capacity;
    bool const bMapped = type == ORVO::MEMORY_TYPE_IMAGE && total >= nSmallestMapping && alignment <= nPage;
    if (bMapped)
        total = (total + nPage - 1) / nPage * nPage;

    void* const pAllocation = bMapped ? mapPages(total) : ::operator new(total, std::align_val_t(alignment));
    void* const pHeader = static_cast<std::byte*>(pAllocation) + offset - sizeof(AlignedBlock);
    auto* const pBlock = new (pHeader) AlignedBlock;
    pBlock->eType_ = type;
    pBlock->bMapped_ = bMapped;
    pBlock->nCapacity_ = capacity;
    pBlock->nTotalBytes_ = total;
    pBlock->nAlignment_ = alignment;
    pBlock->pAllocation_ = pAllocation;
    return pBlock;
}

void AlignedBlock::destroy(AlignedBlock* pBlock) noexcept {
    unpoison(pBlock->memory(), pBlock->nCapacity_);
    void* const pAllocation = pBlock->pAllocation_;
    if (pBlock->bMapped_)
        munmap(pAllocation, pBlock->nTotalBytes_);
    else
        ::operator delete(pAllocation, std::align_val_t(pBlock->nAlignment_));
}

void AlignedBlock::open(std::size_t bytes) noexcept {
    eState_ = IN_USE;
    nBytes_ = bytes;
    unpoison(memory(), bytes);
    poison(static_cast<std::byte*>(memory()) + bytes, nCapacity_ - bytes);
}

void AlignedBlock::close() noexcept {
    eState_ = HELD;
    poison(memory(), nCapacity_);
}

} // namespace ORVO_private
