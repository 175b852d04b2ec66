#include "orvo/colour_engine/internal/HandleTable.h"

#include <utility>

namespace ORVO::ColourEngine::Internal {

namespace {

std::uintptr_t numberOf(void* pHandle) { return reinterpret_cast<std::uintptr_t>(pHandle); }

void* handleOf(std::uintptr_t number) { return reinterpret_cast<void*>(number); }

} // namespace

HandleTable& HandleTable::instance() {
    static auto* const pTable = new HandleTable;
    return *pTable;
}

void* HandleTable::addEntry(Entry entry) {
    // Steps of 16, like addresses of real objects.
    std::uintptr_t const number = iLast_ + 16;
    HandleKind const eKind = entry.eKind_;
    bool const bCounted = !entry.bPermanent_;
    aEntries_.emplace(number, std::move(entry));
    iLast_ = number;
    if (bCounted) {
        ++aCounts_[static_cast<std::size_t>(eKind)];
    }
    return handleOf(number);
}

HandleTable::Entry* HandleTable::findEntry(void* pHandle, HandleKind eKind) {
    auto const found = aEntries_.find(numberOf(pHandle));
    return found != aEntries_.end() && found->second.eKind_ == eKind ? &found->second : nullptr;
}

void* HandleTable::add(HandleKind eKind, std::shared_ptr<void const> spObject) {
    std::lock_guard<std::mutex> const lock(oLock_);
    return addEntry({eKind, std::move(spObject), 1, false, nullptr});
}

void* HandleTable::addPermanent(HandleKind eKind, std::shared_ptr<void const> spObject) {
    std::lock_guard<std::mutex> const lock(oLock_);
    return addEntry({eKind, std::move(spObject), 0, true, nullptr});
}

void* HandleTable::findInterned(InternKey const& key) {
    std::lock_guard<std::mutex> const lock(oLock_);
    auto const found = aInterned_.find(key);
    if (found == aInterned_.end()) {
        return nullptr;
    }
    ++aEntries_.at(found->second).nReferences_;
    return handleOf(found->second);
}

void* HandleTable::intern(HandleKind eKind, InternKey const& key, std::shared_ptr<void const> spObject) {
    std::lock_guard<std::mutex> const lock(oLock_);
    auto const [place, bNew] = aInterned_.emplace(key, 0);
    if (!bNew) {
        ++aEntries_.at(place->second).nReferences_;
        return handleOf(place->second);
    }
    try {
        void* const pHandle = addEntry({eKind, std::move(spObject), 1, false, &place->first});
        place->second = numberOf(pHandle);
        return pHandle;
    } catch (...) {
        aInterned_.erase(place);
        throw;
    }
}

bool HandleTable::addReference(void* pHandle, HandleKind eKind) {
    std::lock_guard<std::mutex> const lock(oLock_);
    Entry* const pEntry = findEntry(pHandle, eKind);
    if (pEntry == nullptr) {
        return false;
    }
    pEntry->nReferences_ += pEntry->bPermanent_ ? 0 : 1;
    return true;
}

bool HandleTable::release(void* pHandle, HandleKind eKind) {
    // Dies after the lock is gone: what it holds may be large.
    std::shared_ptr<void const> spObject;
    std::lock_guard<std::mutex> const lock(oLock_);
    Entry* const pEntry = findEntry(pHandle, eKind);
    if (pEntry == nullptr) {
        return false;
    }
    if (pEntry->bPermanent_ || --pEntry->nReferences_ > 0) {
        return true;
    }
    spObject.swap(pEntry->spObject_);
    if (pEntry->pKey_ != nullptr) {
        aInterned_.erase(aInterned_.find(*pEntry->pKey_));
    }
    aEntries_.erase(numberOf(pHandle));
    --aCounts_[static_cast<std::size_t>(eKind)];
    return true;
}

std::shared_ptr<void const> HandleTable::findObject(void* pHandle, HandleKind eKind) {
    std::lock_guard<std::mutex> const lock(oLock_);
    Entry* const pEntry = findEntry(pHandle, eKind);
    return pEntry != nullptr ? pEntry->spObject_ : nullptr;
}

std::size_t HandleTable::count(HandleKind eKind) {
    std::lock_guard<std::mutex> const lock(oLock_);
    return aCounts_[static_cast<std::size_t>(eKind)];
}

std::uint64_t HandleTable::countReferences() {
    std::lock_guard<std::mutex> const lock(oLock_);
    std::uint64_t nReferences = 0;
    for (auto const& [number, entry] : aEntries_) {
        nReferences += entry.nReferences_;
    }
    return nReferences;
}

} // namespace ORVO::ColourEngine::Internal
