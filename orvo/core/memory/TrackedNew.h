/// The tracked allocation of the system's objects.
///
///     Node* pNode = ORVO_NEW Node("blur");
///     std::shared_ptr<Node> spNode(pNode, ORVO::ORVODeleter<Node>());
///
/// The memory itself comes from the global operator new; beside it the block is counted by category
/// (MemoryStatistics) under its allocation site. An object of plain new may therefore be freed by
/// trackedDelete as well. An object of tracked new that is freed with plain delete gives its memory back, but
/// stays counted.
#pragma once

#include <cstddef>
#include <new>
#include <type_traits>

#include "orvo/core/Export.h"
#include "orvo/core/memory/MemoryType.h"

/// Allocates bytes in the given category; file (a text that outlives the block) and line name the site.
/// Throws std::bad_alloc. Threads: any.
ORVO_API void* operator new(std::size_t bytes, ORVO::MemoryType type, char const* file, int line);
ORVO_API void* operator new(std::size_t bytes, std::align_val_t alignment, ORVO::MemoryType type,
                            char const* file, int line);

/// The matching frees: called by the language if a constructor throws. Null is allowed. Threads: any.
ORVO_API void operator delete(void* pBlock, ORVO::MemoryType type, char const* file, int line) noexcept;
ORVO_API void operator delete(void* pBlock, std::align_val_t alignment, ORVO::MemoryType type,
                              char const* file, int line) noexcept;

/// `ORVO_NEW Type(arguments)`: a tracked object of category MEMORY_TYPE_OBJECT.
#define ORVO_NEW new (::ORVO::MEMORY_TYPE_OBJECT, __FILE__, __LINE__)

namespace ORVO_private {

/// Takes a block out of the accounts; does nothing for a block that is not in them. Threads: any.
ORVO_API void forgetTrackedBlock(void const* pBlock) noexcept;

} // namespace ORVO_private

namespace ORVO {

/// Runs the destructor of an object and frees it, in the category in which it was allocated. A polymorphic
/// object may be given through a base with a virtual destructor. Null is allowed. Threads: any.
template <typename T>
void trackedDelete(T* pObject) {
    static_assert(sizeof(T) > 0, "the type must be complete where it is deleted");
    if (pObject == nullptr)
        return;
    // Taken out of the accounts first: once the memory is free, another thread may be given the same address.
    if constexpr (std::is_polymorphic_v<T>)
        ORVO_private::forgetTrackedBlock(dynamic_cast<void const*>(pObject));
    else
        ORVO_private::forgetTrackedBlock(pObject);
    delete pObject;
}

} // namespace ORVO
