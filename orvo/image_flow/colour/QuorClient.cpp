#include "orvo/image_flow/colour/QuorClient.h"

#include "orvo/colour_engine/QuorProcedures.h"
#include "orvo/image_flow/colour/LazyClient.h"
#include "orvo/image_flow/colour/QuorInterfaces.h"

#include <array>
#include <atomic>

namespace ORVO::ImageFlow {

namespace {

/// Selector and procedure name are equal.
constexpr std::array<char const*, 5> aCoreProcedures = {"QuorRegisterProcAddress", "QuorReportError",
                                                        "QuorUnregisterInterface",
                                                        "QuorGetUnregisterCountAddr", "QuorIsMultiThreaded"};
constexpr std::size_t iGetUnregisterCountAddr = 3;

std::atomic<QuorGetAddressProc> pAddressProc{nullptr};
std::atomic<std::uint32_t*> pUnregisterCount{nullptr};
std::atomic<bool> bStrict{false};
std::atomic<bool> bLive{false};
std::atomic<std::uint32_t> iGeneration{0};

} // namespace

int QuorClient::start(QuorGetAddressProc pProc) {
    if (pAddressProc.load(std::memory_order_acquire) != nullptr) {
        return 1;
    }
    if (pProc == nullptr) {
        return 0;
    }
    pAddressProc.store(pProc, std::memory_order_release);
    iGeneration.fetch_add(1, std::memory_order_acq_rel);
    if (!fetchCore() || !loadBase()) {
        forget();
        return 0;
    }
    bStrict.store(true, std::memory_order_release);
    // Live before the initialisers, not after them: a table is refreshed for a live client only, so that
    // otherwise an initialiser that calls the engine would find none.
    bLive.store(true, std::memory_order_release);
    try {
        Quor_T_MT::LazyClient::initializeAll();
    } catch (...) {
        stop();
        throw;
    }
    return 1;
}

bool QuorClient::fetchCore() {
    std::array<void*, aCoreProcedures.size()> aFound{};
    for (std::size_t i = 0; i < aFound.size(); ++i) {
        aFound[i] = resolve("Quor", aCoreProcedures[i], aCoreProcedures[i]);
        if (aFound[i] == nullptr) {
            return false;
        }
    }
    std::uint32_t* pCount = nullptr;
    auto* const pGetAddress =
        reinterpret_cast<QuorGetUnregisterCountAddrProc>(aFound[iGetUnregisterCountAddr]);
    if (pGetAddress(&pCount) != 0 || pCount == nullptr) {
        return false;
    }
    pUnregisterCount.store(pCount, std::memory_order_release);
    bStrict.store(false, std::memory_order_release);
    return true;
}

bool QuorClient::loadBase() {
    return quorContainerInterface().load() != 0 && quorErrorInterface().load() != 0 &&
           quorStringInterface().load() != 0 && quorMemoryInterface().load() != 0;
}

void QuorClient::stop() noexcept {
    if (pAddressProc.load(std::memory_order_acquire) == nullptr) {
        return;
    }
    Quor_T_MT::LazyTerminate::runAll();
    forget();
    for (QuorTable* const pTable :
         {&quorContainerInterface(), &quorErrorInterface(), &quorStringInterface(), &quorMemoryInterface()}) {
        pTable->clear();
    }
}

void QuorClient::forget() noexcept {
    bLive.store(false, std::memory_order_release);
    bStrict.store(false, std::memory_order_release);
    pUnregisterCount.store(nullptr, std::memory_order_release);
    pAddressProc.store(nullptr, std::memory_order_release);
}

QuorGetAddressProc QuorClient::addressProc() noexcept { return pAddressProc.load(std::memory_order_acquire); }

bool QuorClient::isLive() noexcept { return bLive.load(std::memory_order_acquire); }

bool QuorClient::isStrict() noexcept { return bStrict.load(std::memory_order_acquire); }

void* QuorClient::resolve(char const* pInterface, char const* pSelector, char const* pProcName) {
    QuorGetAddressProc const pProc = pAddressProc.load(std::memory_order_acquire);
    return pProc != nullptr ? pProc(pInterface, pSelector, pProcName) : nullptr;
}

std::uint32_t QuorClient::generation() noexcept { return iGeneration.load(std::memory_order_acquire); }

std::uint32_t QuorClient::unregisterCount() noexcept {
    std::uint32_t* const pCount = pUnregisterCount.load(std::memory_order_acquire);
    return pCount != nullptr ? std::atomic_ref<std::uint32_t>(*pCount).load(std::memory_order_acquire) : 0;
}

} // namespace ORVO::ImageFlow
