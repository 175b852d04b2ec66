#pragma once

#include <cstddef>

#include "orvo/core/Export.h"
#include "orvo/core/memory/MemoryType.h"

namespace ORVO_private {

/// Allocates a block of at least the given bytes, aligned to alignment bytes, not cleared; 0 bytes give a
/// block that may only be freed. Blocks of MEMORY_TYPE_IMAGE come from the image store (ImageStorage.h) where
/// it has one of the size. Throws ORVO::ParameterException "alignment is a power of two" for any other
/// alignment, std::bad_alloc where there is no memory. Threads: any.
ORVO_API void* newAlignedMemory(ORVO::MemoryType type, std::size_t bytes, int alignment);

/// Frees a block of newAlignedMemory; one of MEMORY_TYPE_IMAGE goes back to the image store. Null is allowed.
/// Throws ORVO::InternalException "Block is of newAlignedMemory and of this type" for a block that was freed
/// already or was allocated in another category, as far as this can be seen. Threads: any.
ORVO_API void deleteAlignedMemory(ORVO::MemoryType type, void* pBlock);

} // namespace ORVO_private
