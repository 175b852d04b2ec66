#pragma once

#include "orvo/core/CoreLibrary.h"
#include "orvo/core/Export.h"

namespace ORVO::ColourEngine {

/// The address procedure of the engine that is built in, which `GetQuorGetAddressProc()` hands out unless the
/// host installs another. A host that installed its own, or none, goes back to the embedded engine with
///
///     Core::Library::setQuorGetAddressProc(ColourEngine::embeddedEngine());
///
/// and a procedure of the host's own may hand on to it what it does not serve itself.
/// Threads: any.
ORVO_API QuorGetAddressProc embeddedEngine() noexcept;

} // namespace ORVO::ColourEngine
