#pragma once

#include <cstddef>
#include <cstdint>
#include <iosfwd>

#include "orvo/core/Export.h"
#include "orvo/core/memory/MemoryType.h"

namespace ORVO::Core {

/// What the tracked operator new and newAlignedMemory have handed out, by category. Bytes are the bytes asked
/// for. Blocks that the image store holds for reuse are not in use and not counted.
///
/// Threads: any; figures taken while other threads allocate are a moment's view.
class ORVO_API MemoryStatistics {
public:
    MemoryStatistics() = delete;

    /// Blocks in use now.
    static std::size_t blocks(MemoryType type);
    /// Bytes in use now.
    static std::size_t bytes(MemoryType type);
    /// Blocks handed out since the program began, freed ones included.
    static std::uint64_t allocations(MemoryType type);

    /// Writes a line for every tracked object in use: "<bytes> bytes at <file>:<line>", in no particular
    /// order.
    static void writeObjects(std::ostream& stream);
};

} // namespace ORVO::Core
