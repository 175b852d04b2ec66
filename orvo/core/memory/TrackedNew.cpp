#include "orvo/core/memory/TrackedNew.h"

#include "orvo/core/memory/AllocationGate.h"
#include "orvo/core/memory/PointerTable.h"

void* operator new(std::size_t bytes, ORVO::MemoryType type, char const* file, int line) {
    ORVO_private::passAllocationGate();
    void* const pBlock = ::operator new(bytes);
    try {
        ORVO_private::PointerTable::instance().insert({pBlock, bytes, file, line, type});
    } catch (...) {
        ::operator delete(pBlock);
        throw;
    }
    return pBlock;
}

void* operator new(std::size_t bytes, std::align_val_t alignment, ORVO::MemoryType type, char const* file,
                   int line) {
    ORVO_private::passAllocationGate();
    void* const pBlock = ::operator new(bytes, alignment);
    try {
        ORVO_private::PointerTable::instance().insert({pBlock, bytes, file, line, type});
    } catch (...) {
        ::operator delete(pBlock, alignment);
        throw;
    }
    return pBlock;
}

void operator delete(void* pBlock, ORVO::MemoryType, char const*, int) noexcept {
    ORVO_private::forgetTrackedBlock(pBlock);
    ::operator delete(pBlock);
}

void operator delete(void* pBlock, std::align_val_t alignment, ORVO::MemoryType, char const*, int) noexcept {
    ORVO_private::forgetTrackedBlock(pBlock);
    ::operator delete(pBlock, alignment);
}

void ORVO_private::forgetTrackedBlock(void const* pBlock) noexcept {
    if (pBlock != nullptr)
        PointerTable::instance().erase(pBlock);
}
