#pragma once

#include <cstdint>

namespace ORVO {

/// The category of a block of memory, for accounting.
enum MemoryType : std::int32_t {
    MEMORY_TYPE_OBJECT = 0, ///< Every object that is made by the tracked operator new.
    MEMORY_TYPE_IMAGE = 1   ///< The pixel storage of a CPU image; such blocks are recycled.
};

} // namespace ORVO
