#include "orvo/core/memory/AllocationFailure.h"

#include <atomic>
#include <new>

#include "orvo/core/Check.h"
#include "orvo/core/memory/AllocationGate.h"

namespace {

std::atomic<bool> bArmed{false};
std::atomic<std::uint64_t> nFailing{0};
std::atomic<std::uint64_t> nSeen{0};

} // namespace

void ORVO_private::passAllocationGate() {
    if (!bArmed.load(std::memory_order_acquire))
        return;
    std::uint64_t const n = nSeen.fetch_add(1, std::memory_order_relaxed) + 1;
    if (n == nFailing.load(std::memory_order_relaxed))
        throw std::bad_alloc();
}

namespace ORVO::Core {

AllocationFailure::AllocationFailure(std::uint64_t n) : n_(n) {
    ORVO_CHECK(!bArmed.load(), "No other AllocationFailure is alive");
    nFailing.store(n);
    nSeen.store(0);
    bArmed.store(true, std::memory_order_release);
}

AllocationFailure::~AllocationFailure() { bArmed.store(false, std::memory_order_release); }

bool AllocationFailure::hasFired() const noexcept { return n_ != 0 && count() >= n_; }

std::uint64_t AllocationFailure::count() const noexcept { return nSeen.load(); }

} // namespace ORVO::Core
