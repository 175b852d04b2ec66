#pragma once

#include "orvo/core/memory/PointerTable.h"

namespace ORVO_private {

/// What newAlignedMemory has handed out in a category. Threads: any.
PointerTable::Counts alignedCounts(ORVO::MemoryType type) noexcept;

} // namespace ORVO_private
