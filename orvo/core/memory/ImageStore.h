#pragma once

#include <array>
#include <cstddef>
#include <mutex>

#include "orvo/core/memory/AlignedBlock.h"

namespace ORVO_private {

/// The store of freed image blocks: a list of blocks for each size class, and one list through all of them by
/// the time of their return. It allocates nothing itself, so that freeing a block cannot fail.
///
/// Threads: any.
class ImageStore {
public:
    /// The store of the process; it is never destroyed, since images may be freed until the very end.
    static ImageStore& instance() noexcept;

    /// The size class of a number of bytes, as the room of its blocks: at least 64, eight classes to a
    /// doubling. Throws std::bad_alloc for sizes beyond half the address space.
    static std::size_t classSize(std::size_t bytes);

    /// Takes the block of this class that came back last; null if there is none.
    AlignedBlock* take(std::size_t classSize) noexcept;

    /// Keeps a closed block of a class; gives it, or those that came back first, to the system if the limit
    /// asks it.
    void give(AlignedBlock* pBlock) noexcept;

    void setLimit(std::size_t bytes) noexcept;
    std::size_t limit() const noexcept;
    std::size_t heldBytes() const noexcept;
    /// Gives all blocks to the system; false if there was none.
    bool releaseAll() noexcept;

private:
    // Classes 64 * 2^a * (8 + b) / 8 for each doubling a and b of 0 to 7.
    static constexpr std::size_t nClasses = 64 * 8;
    static std::size_t indexOfClass(std::size_t classSize) noexcept;

    void link(AlignedBlock* pBlock) noexcept;
    void unlink(AlignedBlock* pBlock) noexcept;
    /// Unlinks the oldest blocks until at most the given bytes are held; the result is a chain by pOlder_.
    AlignedBlock* shrinkTo(std::size_t bytes) noexcept;
    static void destroyChain(AlignedBlock* pFirst) noexcept;

    mutable std::mutex oLock_;
    std::array<AlignedBlock*, nClasses> aNewestOfClass_{};
    AlignedBlock* pNewest_ = nullptr;
    AlignedBlock* pOldest_ = nullptr;
    std::size_t nHeldBytes_ = 0;
    std::size_t nLimit_ = std::size_t(1) << 30;
};

} // namespace ORVO_private
