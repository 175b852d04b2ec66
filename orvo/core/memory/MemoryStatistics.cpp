#include "orvo/core/memory/MemoryStatistics.h"

#include <ostream>

#include "orvo/core/memory/AlignedCounts.h"
#include "orvo/core/memory/PointerTable.h"

namespace ORVO::Core {

using ORVO_private::alignedCounts;
using ORVO_private::PointerTable;

std::size_t MemoryStatistics::blocks(MemoryType type) {
    return PointerTable::instance().counts(type).nBlocks_ + alignedCounts(type).nBlocks_;
}

std::size_t MemoryStatistics::bytes(MemoryType type) {
    return PointerTable::instance().counts(type).nBytes_ + alignedCounts(type).nBytes_;
}

std::uint64_t MemoryStatistics::allocations(MemoryType type) {
    return PointerTable::instance().counts(type).nAllocations_ + alignedCounts(type).nAllocations_;
}

void MemoryStatistics::writeObjects(std::ostream& stream) {
    for (PointerTable::Entry const& entry : PointerTable::instance().entries())
        stream << entry.nBytes_ << " bytes at " << (entry.pFile_ != nullptr ? entry.pFile_ : "") << ':'
               << entry.iLine_ << '\n';
}

} // namespace ORVO::Core
