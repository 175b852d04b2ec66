#pragma once

#include "orvo/core/Export.h"

#include <cstddef>
#include <cstdint>

namespace ORVO::ColourEngine {

/// What the embedded engine holds at one moment: objects that somebody has a reference on, and what was
/// computed since the library was loaded. For tests and diagnosis: every count of objects is back at its old
/// value once all that was taken was dropped.
struct EngineStatistics {
    std::size_t nProfiles;
    std::size_t nTransforms; ///< an optimised transform counts once, however often it was handed out
    std::size_t nShaders;
    std::size_t nStrings;
    std::size_t nStringAtoms;
    std::size_t nErrors;             ///< made by `NewError`; the engine's own are not counted
    std::size_t nBlocks;             ///< of `Alloc`
    std::uint64_t nReferences;       ///< on all these objects together
    std::uint64_t nResolved;         ///< transforms whose curves, matrix or cube were computed
    std::uint64_t nShadersDescribed; ///< shaders that were written
    std::uint64_t nErrorsReported;   ///< errors handed to `QuorReportError`
};

/// Threads: any.
ORVO_API EngineStatistics engineStatistics();

} // namespace ORVO::ColourEngine
