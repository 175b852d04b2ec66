#include "orvo/core/memory/PointerTable.h"

#include <new>

namespace ORVO_private {

namespace {
std::size_t indexOf(ORVO::MemoryType type) { return type == ORVO::MEMORY_TYPE_IMAGE ? 1 : 0; }
} // namespace

PointerTable& PointerTable::instance() {
    // In static storage and without a destructor run, so that it needs no heap block of its own.
    alignas(PointerTable) static std::byte aStorage[sizeof(PointerTable)];
    static PointerTable* const pTable = new (aStorage) PointerTable;
    return *pTable;
}

std::size_t PointerTable::hash(void const* pBlock) noexcept {
    // Blocks are multiples of 16; the product spreads neighbours over shards and places (Fibonacci hashing).
    std::uint64_t const bits = static_cast<std::uint64_t>(reinterpret_cast<std::uintptr_t>(pBlock)) >> 4;
    return static_cast<std::size_t>((bits * 0x9E3779B97F4A7C15u) >> 24);
}

PointerTable::Entry* PointerTable::Shard::find(void const* pBlock) noexcept {
    if (aPlaces_.empty())
        return nullptr;
    std::size_t const mask = aPlaces_.size() - 1;
    for (std::size_t i = (hash(pBlock) / nShards) & mask; aPlaces_[i].pBlock_ != nullptr;
         i = (i + 1) & mask) {
        if (aPlaces_[i].pBlock_ == pBlock)
            return &aPlaces_[i];
    }
    return nullptr;
}

void PointerTable::Shard::place(Entry const& entry) noexcept {
    std::size_t const mask = aPlaces_.size() - 1;
    std::size_t i = (hash(entry.pBlock_) / nShards) & mask;
    while (aPlaces_[i].pBlock_ != nullptr)
        i = (i + 1) & mask;
    aPlaces_[i] = entry;
    ++nTaken_;
}

void PointerTable::Shard::remove(Entry* pEntry) noexcept {
    Counts& counts = aCounts_[indexOf(pEntry->eType_)];
    --counts.nBlocks_;
    counts.nBytes_ -= pEntry->nBytes_;
    --nTaken_;
    // Linear probing without tombstones: entries behind the gap whose own place is not between gap and entry
    // move up.
    std::size_t const mask = aPlaces_.size() - 1;
    std::size_t gap = static_cast<std::size_t>(pEntry - aPlaces_.data());
    for (std::size_t i = (gap + 1) & mask; aPlaces_[i].pBlock_ != nullptr; i = (i + 1) & mask) {
        std::size_t const home = (hash(aPlaces_[i].pBlock_) / nShards) & mask;
        if (((i - home) & mask) >= ((i - gap) & mask)) {
            aPlaces_[gap] = aPlaces_[i];
            gap = i;
        }
    }
    aPlaces_[gap] = Entry();
}

void PointerTable::Shard::grow() {
    std::vector<Entry> places(aPlaces_.empty() ? 64 : aPlaces_.size() * 2);
    places.swap(aPlaces_);
    nTaken_ = 0;
    for (Entry const& entry : places) {
        if (entry.pBlock_ != nullptr)
            place(entry);
    }
}

void PointerTable::insert(Entry const& entry) {
    Shard& shard = shardOf(entry.pBlock_);
    std::lock_guard<std::mutex> const lock(shard.oLock_);
    if (Entry* const pStale = shard.find(entry.pBlock_))
        shard.remove(pStale);
    if (2 * (shard.nTaken_ + 1) > shard.aPlaces_.size())
        shard.grow();
    shard.place(entry);
    Counts& counts = shard.aCounts_[indexOf(entry.eType_)];
    ++counts.nBlocks_;
    counts.nBytes_ += entry.nBytes_;
    ++counts.nAllocations_;
}

bool PointerTable::erase(void const* pBlock) noexcept {
    Shard& shard = shardOf(pBlock);
    std::lock_guard<std::mutex> const lock(shard.oLock_);
    Entry* const pEntry = shard.find(pBlock);
    if (pEntry == nullptr)
        return false;
    shard.remove(pEntry);
    return true;
}

PointerTable::Counts PointerTable::counts(ORVO::MemoryType type) const {
    Counts sum;
    for (Shard const& shard : aShards_) {
        std::lock_guard<std::mutex> const lock(shard.oLock_);
        Counts const& counts = shard.aCounts_[indexOf(type)];
        sum.nBlocks_ += counts.nBlocks_;
        sum.nBytes_ += counts.nBytes_;
        sum.nAllocations_ += counts.nAllocations_;
    }
    return sum;
}

std::vector<PointerTable::Entry> PointerTable::entries() const {
    std::vector<Entry> result;
    for (Shard const& shard : aShards_) {
        std::lock_guard<std::mutex> const lock(shard.oLock_);
        for (Entry const& entry : shard.aPlaces_) {
            if (entry.pBlock_ != nullptr)
                result.push_back(entry);
        }
    }
    return result;
}

} // namespace ORVO_private
