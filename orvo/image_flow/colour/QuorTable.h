#pragma once

#include "orvo/core/Export.h"

#include <atomic>
#include <cstddef>
#include <cstdint>

namespace ORVO::ImageFlow {

/// One procedure of an interface: where it stands in the table and how it is asked for.
struct QuorRow {
    std::size_t slot;
    char const* pSelector;
    char const* pProcName;
};

/// The client's side of one interface: a record of procedure pointers that is filled by name and filled again
/// whenever an interface was unregistered since. Slots that no row names stay null.
///
/// Threads: static; everything from any thread, without locks, as the engine that is asked for a procedure
/// may come back here. Two loads write the same where the engine stays the same; where it is replaced
/// meanwhile, the load sees that the counter moved and fills the table again. A call at that very moment may
/// still go to the old engine's procedure: an engine that takes procedures away while they are being called
/// is the host's mistake.
class ORVO_API QuorTable {
public:
    /// Borrows everything: `pRows` lists the rows by rising slot, `pSlots` has room for the highest.
    constexpr QuorTable(char const* pInterface, QuorRow const* pRows, std::size_t nRows,
                        std::atomic<void*>* pSlots) noexcept
        : pInterface_(pInterface), pRows_(pRows), nRows_(nRows), pSlots_(pSlots) {}

    QuorTable(QuorTable const&) = delete;
    QuorTable& operator=(QuorTable const&) = delete;

    /// Fills the table from the last row to the first and notes the counter of unregistrations; 1 on success.
    /// Where the counter moves meanwhile it does so again, up to three times more.
    /// At the first procedure that is missing it stops and leaves the earlier rows as they are: in strict
    /// mode it throws `Quor_T_MT::CQuorError` on a new error object with empty text and component "Quor",
    /// else it returns 0.
    int load();

    /// Loads the table if it was never loaded or if the counter moved since. Where that fails, the first word
    /// of the table becomes null and the answer is false, as if there were no engine; the next use tries
    /// again.
    bool refresh() noexcept;

    /// Forgets everything, as before the first load.
    void clear() noexcept;

    /// What stands in a slot, null if nothing. Does not refresh.
    void* procedure(std::size_t slot) const noexcept { return pSlots_[slot].load(std::memory_order_acquire); }

    /// The counter's value at the last successful load.
    std::uint32_t loadCount() const noexcept { return iLoadCount_.load(std::memory_order_acquire); }
    char const* interfaceName() const noexcept { return pInterface_; }

private:
    bool tryLoad() noexcept;
    bool fill() noexcept;

    char const* pInterface_;
    QuorRow const* pRows_;
    std::size_t nRows_;
    std::atomic<void*>* pSlots_;
    std::atomic<std::uint32_t> iGeneration_{0}; ///< of the binding that it was loaded through; 0: not loaded
    std::atomic<std::uint32_t> iLoadCount_{0};
};

} // namespace ORVO::ImageFlow
