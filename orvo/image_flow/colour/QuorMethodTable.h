#pragma once

#include "orvo/colour_engine/VantleHandles.h"
#include "orvo/core/Export.h"

#include <cstddef>

namespace Quor_T_MT {

/// The methods of one container object, bound by name.
///
/// Threads: any; one table by one thread at a time.
class ORVO_API QuorVTabGeneric {
public:
    struct Method {
        char const* pSelector;
        char const* pProcName;
    };

    /// Borrows both: `pMethods` are the names, `pSlots` receives a pointer for each of them.
    constexpr QuorVTabGeneric(Method const* pMethods, std::size_t nMethods, void** pSlots) noexcept
        : pMethods_(pMethods), nMethods_(nMethods), pSlots_(pSlots) {}

    /// Asks the object for each method in order. True when all are there, or when `bRequired` is false, where
    /// a missing one is null; false at the first null method of a required binding. Throws `CQuorError` where
    /// the engine fails, with the text "Missing Interface" where there is none. No atom is left in any case.
    bool bind(ORVO::QuorContainer* pObject, bool bRequired);

private:
    Method const* pMethods_;
    std::size_t nMethods_;
    void** pSlots_;
};

} // namespace Quor_T_MT
