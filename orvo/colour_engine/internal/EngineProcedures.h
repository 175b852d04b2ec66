#pragma once

#include "orvo/colour_engine/internal/ProcedureRegistry.h"

#include <cstddef>
#include <cstdint>

namespace ORVO::ColourEngine::Internal {

struct ProcedureSpan {
    ProcedureEntry const* pEntries;
    std::size_t nEntries;
};

/// The procedures of the engine, by the interface that they belong to. Each lets nothing but its result out,
/// answers null and unknown handles with a failure, and may be called from any thread.
ProcedureSpan layerProcedures() noexcept;     ///< "Quor"
ProcedureSpan containerProcedures() noexcept; ///< "QuorContainerInterface": shaders are its objects
ProcedureSpan errorProcedures() noexcept;     ///< "QuorErrorInterface"
ProcedureSpan stringProcedures() noexcept;    ///< "QuorStringInterface"
ProcedureSpan memoryProcedures() noexcept;    ///< "QuorMemoryInterface"
ProcedureSpan transformProcedures() noexcept; ///< "VantleInterface2"
ProcedureSpan shaderProcedures() noexcept;    ///< "VantleShaderInterface"

/// Counts for the statistics.
std::size_t nMemoryBlocks() noexcept;
std::uint64_t nErrorsReported() noexcept;
std::uint64_t nShadersDescribed() noexcept;

/// A procedure as the registry keeps it.
template <typename Procedure>
void* asAddress(Procedure pProcedure) noexcept {
    return reinterpret_cast<void*>(pProcedure);
}

} // namespace ORVO::ColourEngine::Internal
