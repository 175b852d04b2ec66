#include "orvo/image_flow/colour/VantleGuard.h"

#include "orvo/image_flow/colour/TrelException.h"

namespace ORVO::ImageFlow {

bool VantleGuard::isAvailable() noexcept {
    if (!oTable_.refresh()) {
        pTable_.store(nullptr, std::memory_order_release);
        return false;
    }
    if (pTable_.load(std::memory_order_acquire) == nullptr) {
        pTable_.store(&oTable_, std::memory_order_release);
        oTerminate_.add();
    }
    return true;
}

bool VantleGuard::check() {
    if (!isAvailable()) {
        throw TrelException("couldn't init CVantle");
    }
    return true;
}

void* VantleGuard::checkedProcedure(std::size_t slot) {
    check();
    void* const pProcedure = oTable_.procedure(slot);
    // Another thread may have found the engine gone since.
    if (pProcedure == nullptr) {
        throw TrelException("couldn't init CVantle");
    }
    return pProcedure;
}

void VantleGuard::forget(void* pGuard) noexcept {
    auto& guard = *static_cast<VantleGuard*>(pGuard);
    guard.pTable_.store(nullptr, std::memory_order_release);
    guard.oTable_.clear();
}

} // namespace ORVO::ImageFlow
