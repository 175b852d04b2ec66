#pragma once

#include "orvo/colour_engine/QuorProcedures.h"
#include "orvo/image_flow/colour/QuorTable.h"

namespace ORVO::ImageFlow {

/// The base interfaces of the layer, with the rows that the system uses.
///
/// Threads: as QuorTable.
ORVO_API QuorTable& quorContainerInterface() noexcept;
ORVO_API QuorTable& quorErrorInterface() noexcept;
ORVO_API QuorTable& quorStringInterface() noexcept;
ORVO_API QuorTable& quorMemoryInterface() noexcept;

/// The slots of those rows.
enum QuorContainerSlot : std::size_t {
    QUOR_CONTAINER_ADD_REF = 3,
    QUOR_CONTAINER_RELEASE = 4,
    QUOR_CONTAINER_GET_METHOD = 9
};
enum QuorErrorSlot : std::size_t {
    QUOR_ERROR_NEW_ERROR = 0,
    QUOR_ERROR_ADD_REF = 2,
    QUOR_ERROR_RELEASE = 3,
    QUOR_ERROR_GET_ERROR_MESSAGE = 4,
    QUOR_ERROR_GET_COMPONENT = 5
};
enum QuorStringSlot : std::size_t {
    QUOR_STRING_NEW_STRING_ATOM = 0,
    QUOR_STRING_DELETE_STRING_ATOM = 1,
    QUOR_STRING_GET_C_STRING = 2,
    QUOR_STRING_ADD_REF = 3
};
enum QuorMemorySlot : std::size_t {
    QUOR_MEMORY_ALLOC = 0,
    QUOR_MEMORY_REALLOC = 1,
    QUOR_MEMORY_FREE = 2,
    QUOR_MEMORY_GET_BLOCK_SIZE = 3
};

/// A procedure of a table that is fresh; null where the engine is absent.
template <typename Procedure>
Procedure freshProcedure(QuorTable& table, std::size_t slot) noexcept {
    return table.refresh() ? reinterpret_cast<Procedure>(table.procedure(slot)) : nullptr;
}

} // namespace ORVO::ImageFlow
