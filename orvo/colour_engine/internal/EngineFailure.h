#pragma once

#include "orvo/colour_engine/VantleHandles.h"

#include <exception>
#include <new>
#include <string>

namespace ORVO::ColourEngine::Internal {

/// An error object: what an error handle stands for.
struct EngineError {
    std::string sText_;
    std::string sComponent_;
};

/// The failures of the engine's own procedures. Their error objects are permanent, so that a client which
/// looks at no more than "not 0" leaks nothing.
enum class EngineFailure {
    InvalidArgument,
    InvalidHandle,
    UnknownProfileCode,
    NoTransform,
    UnsupportedPixels,
    UnknownShaderFamily,
    InvalidIndex,
    MissingMethod,
    MissingInterface,
    OutOfMemory,
    Internal
};

/// Makes the error objects of all failures, so that telling of one, of too little memory above all, needs no
/// memory. Throws std::bad_alloc.
/// Threads: any.
void prepareEngineFailures();

/// The result that stands for a failure; never 0, always the same one. After prepareEngineFailures().
/// Threads: any.
VantleResult engineFailure(EngineFailure eFailure) noexcept;

/// Runs the body of a procedure: nothing but a result leaves it.
template <typename Body>
VantleResult runProcedure(Body const& body) noexcept {
    try {
        return body();
    } catch (std::bad_alloc const&) {
        return engineFailure(EngineFailure::OutOfMemory);
    } catch (...) {
        return engineFailure(EngineFailure::Internal);
    }
}

/// 0 where it holds.
inline VantleResult resultOf(bool bDone, EngineFailure eElse) noexcept {
    return bDone ? 0 : engineFailure(eElse);
}

} // namespace ORVO::ColourEngine::Internal
