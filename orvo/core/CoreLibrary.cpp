#include "orvo/core/CoreLibrary.h"

#include <atomic>

#include "orvo/core/Check.h"
#include "orvo/core/EmbeddedColourEngine.h"
#include "orvo/core/memory/ImageStorage.h"

namespace ORVO {

namespace {
std::atomic<bool> bInitialized{false};

/// Stands for "the host installed nothing", which null cannot.
void* askEmbeddedEngine(char const* interfaceName, char const* selector, char const* procName);

std::atomic<QuorGetAddressProc> pEmbeddedProc{nullptr};
std::atomic<QuorGetAddressProc> pInstalledProc{&askEmbeddedEngine};

void* askEmbeddedEngine(char const* interfaceName, char const* selector, char const* procName) {
    QuorGetAddressProc const pProc = pEmbeddedProc.load(std::memory_order_acquire);
    return pProc != nullptr ? pProc(interfaceName, selector, procName) : nullptr;
}
} // namespace

QuorGetAddressProc GetQuorGetAddressProc() {
    QuorGetAddressProc const pProc = pInstalledProc.load(std::memory_order_acquire);
    return pProc == &askEmbeddedEngine ? pEmbeddedProc.load(std::memory_order_acquire) : pProc;
}

namespace Core {

void Library::initialize() {
    ORVO_CHECK(!isInitialized());
    bInitialized.store(true, std::memory_order_release);
}

void Library::terminate() {
    ORVO_CHECK(isInitialized());
    releaseImageStorage();
    setQuorGetAddressProc(&askEmbeddedEngine);
    bInitialized.store(false, std::memory_order_release);
}

bool Library::isInitialized() noexcept { return bInitialized.load(std::memory_order_acquire); }

void Library::setQuorGetAddressProc(QuorGetAddressProc pProc) noexcept {
    pInstalledProc.store(pProc, std::memory_order_release);
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

namespace ORVO_private {

void setEmbeddedQuorGetAddressProc(ORVO::QuorGetAddressProc pProc) noexcept {
    ORVO::pEmbeddedProc.store(pProc, std::memory_order_release);
}

} // namespace ORVO_private
