#include "orvo/core/memory/ImageStore.h"

#include <algorithm>
#include <limits>
#include <new>

namespace ORVO_private {

namespace {

constexpr std::size_t nSmallestClass = 64;

/// The place of the highest bit that is set; value is not 0.
unsigned highestBit(std::size_t value) { return 63u - static_cast<unsigned>(__builtin_clzll(value)); }

} // namespace

ImageStore& ImageStore::instance() noexcept {
    alignas(ImageStore) static std::byte aStorage[sizeof(ImageStore)];
    static ImageStore* const pStore = new (aStorage) ImageStore;
    return *pStore;
}

std::size_t ImageStore::classSize(std::size_t bytes) {
    if (bytes > std::numeric_limits<std::size_t>::max() / 2)
        throw std::bad_alloc();
    std::size_t const size = std::max(bytes, nSmallestClass);
    std::size_t const step = std::max(nSmallestClass, std::size_t(1) << (highestBit(size) - 3));
    return (size + step - 1) / step * step;
}

std::size_t ImageStore::indexOfClass(std::size_t classSize) noexcept {
    unsigned const doubling = highestBit(classSize);
    return doubling * 8 + ((classSize >> (doubling - 3)) & 7);
}

void ImageStore::link(AlignedBlock* pBlock) noexcept {
    pBlock->pNewer_ = nullptr;
    pBlock->pOlder_ = pNewest_;
    (pNewest_ != nullptr ? pNewest_->pNewer_ : pOldest_) = pBlock;
    pNewest_ = pBlock;

    AlignedBlock*& pNewestOfClass = aNewestOfClass_[indexOfClass(pBlock->nCapacity_)];
    pBlock->pNewerOfClass_ = nullptr;
    pBlock->pOlderOfClass_ = pNewestOfClass;
    if (pNewestOfClass != nullptr)
        pNewestOfClass->pNewerOfClass_ = pBlock;
    pNewestOfClass = pBlock;

    nHeldBytes_ += pBlock->nTotalBytes_;
}

void ImageStore::unlink(AlignedBlock* pBlock) noexcept {
    (pBlock->pNewer_ != nullptr ? pBlock->pNewer_->pOlder_ : pNewest_) = pBlock->pOlder_;
    (pBlock->pOlder_ != nullptr ? pBlock->pOlder_->pNewer_ : pOldest_) = pBlock->pNewer_;

    AlignedBlock*& pNewestOfClass = aNewestOfClass_[indexOfClass(pBlock->nCapacity_)];
    (pBlock->pNewerOfClass_ != nullptr ? pBlock->pNewerOfClass_->pOlderOfClass_ : pNewestOfClass) =
        pBlock->pOlderOfClass_;
    if (pBlock->pOlderOfClass_ != nullptr)
        pBlock->pOlderOfClass_->pNewerOfClass_ = pBlock->pNewerOfClass_;

    nHeldBytes_ -= pBlock->nTotalBytes_;
}

AlignedBlock* ImageStore::take(std::size_t classSize) noexcept {
    std::lock_guard<std::mutex> const lock(oLock_);
    AlignedBlock* const pBlock = aNewestOfClass_[indexOfClass(classSize)];
    if (pBlock != nullptr)
        unlink(pBlock);
    return pBlock;
}

void ImageStore::give(AlignedBlock* pBlock) noexcept {
    AlignedBlock* pSurplus = nullptr;
    {
        std::lock_guard<std::mutex> const lock(oLock_);
        if (pBlock->nTotalBytes_ <= nLimit_) {
            pSurplus = shrinkTo(nLimit_ - pBlock->nTotalBytes_);
            link(pBlock);
        } else {
            pBlock->pOlder_ = nullptr;
            pSurplus = pBlock;
        }
    }
    destroyChain(pSurplus);
}

AlignedBlock* ImageStore::shrinkTo(std::size_t bytes) noexcept {
    AlignedBlock* pChain = nullptr;
    while (nHeldBytes_ > bytes) {
        AlignedBlock* const pBlock = pOldest_;
        unlink(pBlock);
        pBlock->pOlder_ = pChain;
        pChain = pBlock;
    }
    return pChain;
}

void ImageStore::destroyChain(AlignedBlock* pFirst) noexcept {
    while (pFirst != nullptr) {
        AlignedBlock* const pNext = pFirst->pOlder_;
        AlignedBlock::destroy(pFirst);
        pFirst = pNext;
    }
}

void ImageStore::setLimit(std::size_t bytes) noexcept {
    AlignedBlock* pSurplus = nullptr;
    {
        std::lock_guard<std::mutex> const lock(oLock_);
        nLimit_ = bytes;
        pSurplus = shrinkTo(bytes);
    }
    destroyChain(pSurplus);
}

std::size_t ImageStore::limit() const noexcept {
    std::lock_guard<std::mutex> const lock(oLock_);
    return nLimit_;
}

std::size_t ImageStore::heldBytes() const noexcept {
    std::lock_guard<std::mutex> const lock(oLock_);
    return nHeldBytes_;
}

bool ImageStore::releaseAll() noexcept {
    AlignedBlock* pAll = nullptr;
    {
        std::lock_guard<std::mutex> const lock(oLock_);
        pAll = shrinkTo(0);
    }
    bool const bAny = pAll != nullptr;
    destroyChain(pAll);
    return bAny;
}

} // namespace ORVO_private
