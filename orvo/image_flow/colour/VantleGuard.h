#pragma once

#include "orvo/image_flow/colour/LazyClient.h"
#include "orvo/image_flow/colour/QuorTable.h"

#include <atomic>
#include <cstddef>

namespace ORVO::ImageFlow {

/// Stands before every call of the colour engine: loads the engine's table on first use and again when it
/// went stale.
///
/// Threads: static; any.
class VantleGuard {
public:
    explicit constexpr VantleGuard(QuorTable& table) noexcept : oTable_(table), oTerminate_(&forget, this) {}

    /// Returns true, or throws `TrelException` "couldn't init CVantle".
    bool check();
    /// The same without throwing.
    bool isAvailable() noexcept;

    /// A procedure of the table, guarded; never null.
    template <typename Procedure>
    Procedure procedure(std::size_t slot) {
        return reinterpret_cast<Procedure>(checkedProcedure(slot));
    }

private:
    void* checkedProcedure(std::size_t slot);
    static void forget(void* pGuard) noexcept;

    QuorTable& oTable_;
    std::atomic<QuorTable*> pTable_{nullptr}; ///< set while the engine can be reached
    Quor_T_MT::LazyTerminate oTerminate_;
};

} // namespace ORVO::ImageFlow
