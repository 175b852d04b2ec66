#pragma once

#include "orvo/core/utility/InstructionSet.h"

namespace ORVO::ImageRuntime {

/// The names by which this layer and those above it know the process's choice of instructions.
///
/// Threads: as the originals.
using Core::activeInstructionSet;
using Core::bestInstructionSet;
using Core::InstructionSet;
using Core::isSupported;
using Core::setActiveInstructionSet;

} // namespace ORVO::ImageRuntime
