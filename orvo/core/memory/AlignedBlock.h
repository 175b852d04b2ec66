#pragma once

#include <cstddef>
#include <cstdint>

#include "orvo/core/memory/MemoryType.h"

namespace ORVO_private {

/// What stands in front of every block of aligned memory: its size, its state and its links in the image
/// store. The header is in no account of bytes.
struct alignas(64) AlignedBlock {
    /// States, as odd numbers that random memory hardly holds.
    enum State : std::uint64_t { IN_USE = 0x4F52564F5F555345u, HELD = 0x4F52564F5F48454Cu, DEAD = 0 };

    State eState_ = DEAD;
    ORVO::MemoryType eType_ = ORVO::MEMORY_TYPE_OBJECT;
    bool bMapped_ = false;        ///< Pages of the system's, not of the heap.
    std::size_t nBytes_ = 0;      ///< Bytes that the caller asked for.
    std::size_t nCapacity_ = 0;   ///< Bytes that stand behind the header.
    std::size_t nTotalBytes_ = 0; ///< Bytes of the allocation, with header and padding.
    std::size_t nAlignment_ = 0;  ///< Of the allocation, where it is of the heap.
    void* pAllocation_ = nullptr; ///< Start of the allocation; padding may stand between it and the header.
    AlignedBlock* pNewer_ = nullptr; ///< Links of the image store, by the time of the return ...
    AlignedBlock* pOlder_ = nullptr;
    AlignedBlock* pNewerOfClass_ = nullptr; ///< ... and within the size class.
    AlignedBlock* pOlderOfClass_ = nullptr;

    /// The caller's memory, which begins right behind the header.
    void* memory() noexcept { return this + 1; }
    static AlignedBlock* ofMemory(void* pMemory) noexcept { return static_cast<AlignedBlock*>(pMemory) - 1; }

    /// Makes a block with the given room, aligned to at least 64 bytes; throws std::bad_alloc. Large image
    /// blocks are pages of the system's, in huge pages where it has them.
    static AlignedBlock* create(ORVO::MemoryType type, std::size_t capacity, std::size_t alignment);
    /// Gives the block back to the system.
    static void destroy(AlignedBlock* pBlock) noexcept;

    /// Marks the block as in use with the given size: the rest of the room is poisoned under address
    /// sanitizer.
    void open(std::size_t bytes) noexcept;
    /// Marks the block as out of use: all of the room is poisoned under address sanitizer.
    void close() noexcept;
};

} // namespace ORVO_private
