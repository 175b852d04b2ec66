#include "orvo/colour_engine/EmbeddedEngine.h"
#include "orvo/colour_engine/EngineStatistics.h"
#include "orvo/colour_engine/QuorProcedures.h"
#include "orvo/colour_engine/internal/EngineFailure.h"
#include "orvo/colour_engine/internal/EngineProcedures.h"
#include "orvo/colour_engine/internal/HandleTable.h"
#include "orvo/colour_engine/internal/Transform.h"
#include "orvo/core/EmbeddedColourEngine.h"

#include <atomic>
#include <iterator>

namespace ORVO::ColourEngine {

namespace Internal {

namespace {

std::atomic<std::uint64_t> nReported{0};

VantleResult registerProcAddressProc(char const* pInterface, char const* pSelector, char const* pProcName,
                                     void* pProcedure) {
    return runProcedure([&] {
        if (pInterface == nullptr || pSelector == nullptr || pProcName == nullptr || pProcedure == nullptr) {
            return engineFailure(EngineFailure::InvalidArgument);
        }
        ProcedureRegistry::instance().add({pInterface, pSelector, pProcName, pProcedure});
        return VantleResult{0};
    });
}

VantleResult reportErrorProc(QuorError* pError) {
    return runProcedure([&] {
        if (HandleTable::instance().find<EngineError>(pError, HandleKind::Error) == nullptr) {
            return engineFailure(EngineFailure::InvalidHandle);
        }
        ++nReported;
        return VantleResult{0};
    });
}

VantleResult unregisterInterfaceProc(char const* pInterface) {
    return runProcedure([&] {
        if (pInterface == nullptr) {
            return engineFailure(EngineFailure::InvalidArgument);
        }
        return resultOf(ProcedureRegistry::instance().removeInterface(pInterface),
                        EngineFailure::MissingInterface);
    });
}

VantleResult getUnregisterCountAddrProc(std::uint32_t** pAddress) {
    return runProcedure([&] {
        if (pAddress == nullptr) {
            return engineFailure(EngineFailure::InvalidArgument);
        }
        *pAddress = ProcedureRegistry::instance().removalCount();
        return VantleResult{0};
    });
}

std::uint32_t isMultiThreadedProc() { return 1; }

void* embeddedAddressProc(char const* interfaceName, char const* selector, char const* procName) {
    if (interfaceName == nullptr || selector == nullptr || procName == nullptr) {
        return nullptr;
    }
    try {
        return ProcedureRegistry::instance().find(interfaceName, selector, procName);
    } catch (...) { // no memory
        return nullptr;
    }
}

[[maybe_unused]] bool const bEngineEmbedded =
    (ORVO_private::setEmbeddedQuorGetAddressProc(&embeddedAddressProc), true);

} // namespace

std::uint64_t nErrorsReported() noexcept { return nReported; }

ProcedureSpan layerProcedures() noexcept {
    static ProcedureEntry const aEntries[] = {
        {"Quor", "QuorRegisterProcAddress", "QuorRegisterProcAddress", asAddress(&registerProcAddressProc)},
        {"Quor", "QuorReportError", "QuorReportError", asAddress(&reportErrorProc)},
        {"Quor", "QuorUnregisterInterface", "QuorUnregisterInterface", asAddress(&unregisterInterfaceProc)},
        {"Quor", "QuorGetUnregisterCountAddr", "QuorGetUnregisterCountAddr",
         asAddress(&getUnregisterCountAddrProc)},
        {"Quor", "QuorIsMultiThreaded", "QuorIsMultiThreaded", asAddress(&isMultiThreadedProc)},
    };
    return {aEntries, std::size(aEntries)};
}

} // namespace Internal

QuorGetAddressProc embeddedEngine() noexcept { return &Internal::embeddedAddressProc; }

EngineStatistics engineStatistics() {
    using Internal::HandleKind;
    auto& table = Internal::HandleTable::instance();
    return {table.count(HandleKind::Profile),    table.count(HandleKind::Transform),
            table.count(HandleKind::Shader),     table.count(HandleKind::String),
            table.count(HandleKind::StringAtom), table.count(HandleKind::Error),
            Internal::nMemoryBlocks(),           table.countReferences(),
            Internal::Transform::nResolved(),    Internal::nShadersDescribed(),
            Internal::nErrorsReported()};
}

} // namespace ORVO::ColourEngine
