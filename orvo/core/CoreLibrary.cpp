#include "orvo/core/CoreLibrary.h"

#include <atomic>

#include "orvo/core/Check.h"
#include "orvo/core/memory/ImageStorage.h"

namespace ORVO {

namespace {
std::atomic<bool> bInitialized{false};
std::atomic<QuorGetAddressProc> pQuorGetAddressProc{nullptr};
} // namespace

QuorGetAddressProc GetQuorGetAddressProc() { return pQuorGetAddressProc.load(std::memory_order_acquire); }

namespace Core {

void Library::initialize() {
    ORVO_CHECK(!isInitialized());
    bInitialized.store(true, std::memory_order_release);
}

void Library::terminate() {
    ORVO_CHECK(isInitialized());
    releaseImageStorage();
    setQuorGetAddressProc(nullptr);
    bInitialized.store(false, std::memory_order_release);
}

bool Library::isInitialized() noexcept { return bInitialized.load(std::memory_order_acquire); }

void Library::setQuorGetAddressProc(QuorGetAddressProc pProc) noexcept {
    pQuorGetAddressProc.store(pProc, std::memory_order_release);
}

AutoInitializer::AutoInitializer() : bArmed_(true) { Library::initialize(); }

AutoInitializer::~AutoInitializer() {
    if (!bArmed_)
        return;
    try {
        Library::terminate();
    } catch (...) {
        // The host stopped the library itself: nothing is left to do.
    }
}

void AutoInitializer::release() noexcept { bArmed_ = false; }

} // namespace Core
} // namespace ORVO
