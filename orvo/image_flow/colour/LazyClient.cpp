#include "orvo/image_flow/colour/LazyClient.h"

#include <mutex>

namespace Quor_T_MT {

namespace {

std::mutex oTerminateLock;
LazyTerminate* pFirstTerminate = nullptr; // the latest
LazyClient* pFirstClient = nullptr;       // the earliest

} // namespace

void LazyTerminate::add() noexcept {
    std::lock_guard<std::mutex> const lock(oTerminateLock);
    if (bListed_) {
        return;
    }
    bListed_ = true;
    pNext_ = pFirstTerminate;
    pFirstTerminate = this;
}

void LazyTerminate::runAll() noexcept {
    std::unique_lock<std::mutex> lock(oTerminateLock);
    while (pFirstTerminate != nullptr) {
        LazyTerminate* const pEntry = pFirstTerminate;
        pFirstTerminate = pEntry->pNext_;
        pEntry->bListed_ = false;
        // Unlocked: what is finished may finish something else.
        lock.unlock();
        pEntry->pTerminate_(pEntry->pContext_);
        lock.lock();
    }
}

LazyClient::LazyClient(void (*pInitialize)()) noexcept : pInitialize_(pInitialize) {
    LazyClient** ppLink = &pFirstClient;
    while (*ppLink != nullptr) {
        ppLink = &(*ppLink)->pNext_;
    }
    *ppLink = this;
}

LazyClient::~LazyClient() {
    LazyClient** ppLink = &pFirstClient;
    while (*ppLink != this) {
        ppLink = &(*ppLink)->pNext_;
    }
    *ppLink = pNext_;
}

void LazyClient::initializeAll() {
    for (LazyClient* pClient = pFirstClient; pClient != nullptr; pClient = pClient->pNext_) {
        pClient->pInitialize_();
    }
}

} // namespace Quor_T_MT
