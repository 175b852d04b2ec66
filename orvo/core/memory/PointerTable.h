#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <mutex>
#include <vector>

#include "orvo/core/memory/MemoryType.h"

namespace ORVO_private {

/// The tracked blocks in use: a hash table from address to size, category and site, in shards with a lock
/// each, so that threads that allocate at once seldom meet. Each shard also keeps the counts of what it
/// holds.
///
/// Threads: any.
class PointerTable {
public:
    struct Entry {
        void const* pBlock_ = nullptr; ///< Null marks a free place.
        std::size_t nBytes_ = 0;
        char const* pFile_ = nullptr;
        int iLine_ = 0;
        ORVO::MemoryType eType_ = ORVO::MEMORY_TYPE_OBJECT;
    };

    struct Counts {
        std::size_t nBlocks_ = 0;
        std::size_t nBytes_ = 0;
        std::uint64_t nAllocations_ = 0;
    };

    /// The table of the process; it is never destroyed, since objects may be freed until the very end.
    static PointerTable& instance();

    /// Enters a block. An entry of the same address stands for a block that was freed behind the table's
    /// back: it is replaced. Throws std::bad_alloc, and enters nothing then.
    void insert(Entry const& entry);

    /// Takes a block out; false if it is not in the table.
    bool erase(void const* pBlock) noexcept;

    /// What is in use in a category now.
    Counts counts(ORVO::MemoryType type) const;

    /// A copy of all entries.
    std::vector<Entry> entries() const;

private:
    static constexpr std::size_t nShards = 64;

    struct alignas(64) Shard {
        mutable std::mutex oLock_;
        std::vector<Entry> aPlaces_; ///< A power of two of them, at most half of them taken.
        std::size_t nTaken_ = 0;
        std::array<Counts, 2> aCounts_;

        Entry* find(void const* pBlock) noexcept;
        void place(Entry const& entry) noexcept;
        void remove(Entry* pEntry) noexcept;
        void grow();
    };

    static std::size_t hash(void const* pBlock) noexcept;
    Shard& shardOf(void const* pBlock) noexcept { return aShards_[hash(pBlock) % nShards]; }

    std::array<Shard, nShards> aShards_;
};

} // namespace ORVO_private
