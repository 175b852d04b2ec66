#pragma once

#include <cstdint>

#include "orvo/core/Export.h"

namespace ORVO::Core {

/// Test hook: while an object of this class lives, the n-th allocation through the tracked operator new or
/// newAlignedMemory, counted on all threads from its construction on, throws std::bad_alloc; all others work.
/// Only one may be alive at a time.
///
///     for (std::uint64_t n = 1;; ++n) {
///         Core::AllocationFailure failure(n);
///         ... run the code under test, which may throw ...
///         if (!failure.hasFired())
///             break; // every allocation has failed once
///     }
///
/// Threads: construct and destroy on one thread, while allocations run on any.
class ORVO_API AllocationFailure {
public:
    /// Arms the hook; n counts from 1, 0 only counts. Throws InternalException "No other AllocationFailure is
    /// alive".
    explicit AllocationFailure(std::uint64_t n);
    ~AllocationFailure();
    AllocationFailure(AllocationFailure const&) = delete;
    AllocationFailure& operator=(AllocationFailure const&) = delete;

    /// Whether the n-th allocation was reached and made to fail.
    bool hasFired() const noexcept;
    /// Allocations seen since construction, the failed one included.
    std::uint64_t count() const noexcept;

private:
    std::uint64_t n_;
};

} // namespace ORVO::Core
