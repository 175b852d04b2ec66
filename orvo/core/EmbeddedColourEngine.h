#pragma once

#include "orvo/core/CoreLibrary.h"

namespace ORVO_private {

/// Tells the base library of the engine that is built in; called by that engine while the library is loaded,
/// since the base library stands below it and cannot name it.
///
/// Threads: any.
void setEmbeddedQuorGetAddressProc(ORVO::QuorGetAddressProc pProc) noexcept;

} // namespace ORVO_private
