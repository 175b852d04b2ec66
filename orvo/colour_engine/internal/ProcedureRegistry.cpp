#include "orvo/colour_engine/internal/ProcedureRegistry.h"

#include "orvo/colour_engine/internal/EngineFailure.h"
#include "orvo/colour_engine/internal/EngineProcedures.h"

#include <atomic>
#include <mutex>

namespace ORVO::ColourEngine::Internal {

namespace {

std::string keyOf(char const* pSelector, char const* pProcName) {
    return std::string(pSelector) + '\n' + pProcName;
}

} // namespace

ProcedureRegistry& ProcedureRegistry::instance() {
    static auto* const pRegistry = new ProcedureRegistry;
    return *pRegistry;
}

ProcedureRegistry::ProcedureRegistry() {
    prepareEngineFailures();
    for (ProcedureSpan const procedures :
         {layerProcedures(), containerProcedures(), errorProcedures(), stringProcedures(), memoryProcedures(),
          transformProcedures(), shaderProcedures()}) {
        for (std::size_t i = 0; i < procedures.nEntries; ++i) {
            add(procedures.pEntries[i]);
        }
    }
}

void* ProcedureRegistry::find(char const* pInterface, char const* pSelector, char const* pProcName) {
    std::shared_lock<std::shared_mutex> const lock(oLock_);
    auto const foundInterface = aInterfaces_.find(pInterface);
    if (foundInterface == aInterfaces_.end()) {
        return nullptr;
    }
    auto const found = foundInterface->second.find(keyOf(pSelector, pProcName));
    return found != foundInterface->second.end() ? found->second : nullptr;
}

void ProcedureRegistry::add(ProcedureEntry const& entry) {
    std::unique_lock<std::shared_mutex> const lock(oLock_);
    aInterfaces_[entry.pInterface][keyOf(entry.pSelector, entry.pProcName)] = entry.pProcedure;
}

bool ProcedureRegistry::removeInterface(char const* pInterface) {
    std::unique_lock<std::shared_mutex> const lock(oLock_);
    auto const found = aInterfaces_.find(pInterface);
    if (found == aInterfaces_.end()) {
        return false;
    }
    aInterfaces_.erase(found);
    std::atomic_ref<std::uint32_t>(nRemovals_).fetch_add(1, std::memory_order_acq_rel);
    return true;
}

} // namespace ORVO::ColourEngine::Internal
