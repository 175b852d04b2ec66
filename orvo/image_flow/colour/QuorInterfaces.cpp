#include "orvo/image_flow/colour/QuorInterfaces.h"

namespace ORVO::ImageFlow {

namespace {

// Slots of all entries that the interface has; the rows name those that are called.
std::atomic<void*> aContainerSlots[16];
std::atomic<void*> aErrorSlots[8];
std::atomic<void*> aStringSlots[4];
std::atomic<void*> aMemorySlots[4];

constexpr QuorRow aContainerRows[] = {
    {QUOR_CONTAINER_ADD_REF, "AddRef", "QuorAddRefProc"},
    {QUOR_CONTAINER_RELEASE, "Release", "QuorReleaseProc"},
    {QUOR_CONTAINER_GET_METHOD, "GetMethod", "QuorGetMethodV3Proc"},
};

constexpr QuorRow aErrorRows[] = {
    {QUOR_ERROR_NEW_ERROR, "NewError", "QuorNewErrorProc"},
    {QUOR_ERROR_ADD_REF, "AddRef", "QuorErrorAddRefProc"},
    {QUOR_ERROR_RELEASE, "Release", "QuorErrorReleaseProc"},
    {QUOR_ERROR_GET_ERROR_MESSAGE, "GetErrorMessage", "QuorGetErrorMessageProc"},
    {QUOR_ERROR_GET_COMPONENT, "GetComponent", "QuorGetComponentProc"},
};

constexpr QuorRow aStringRows[] = {
    {QUOR_STRING_NEW_STRING_ATOM, "NewStringAtom", "QuorNewStringAtomProc"},
    {QUOR_STRING_DELETE_STRING_ATOM, "DeleteStringAtom", "QuorDeleteStringAtomProc"},
    {QUOR_STRING_GET_C_STRING, "GetCString", "QuorGetCStringProc"},
    {QUOR_STRING_ADD_REF, "AddRef", "QuorStringAtomAddRefProc"},
};

constexpr QuorRow aMemoryRows[] = {
    {QUOR_MEMORY_ALLOC, "Alloc", "QuorAllocProc"},
    {QUOR_MEMORY_REALLOC, "Realloc", "QuorReallocProc"},
    {QUOR_MEMORY_FREE, "Free", "QuorFreeProc"},
    {QUOR_MEMORY_GET_BLOCK_SIZE, "GetBlockSize", "QuorGetBlockSizeProc"},
};

constinit QuorTable oContainer("QuorContainerInterface", aContainerRows, std::size(aContainerRows),
                               aContainerSlots);
constinit QuorTable oError("QuorErrorInterface", aErrorRows, std::size(aErrorRows), aErrorSlots);
constinit QuorTable oString("QuorStringInterface", aStringRows, std::size(aStringRows), aStringSlots);
constinit QuorTable oMemory("QuorMemoryInterface", aMemoryRows, std::size(aMemoryRows), aMemorySlots);

} // namespace

QuorTable& quorContainerInterface() noexcept { return oContainer; }
QuorTable& quorErrorInterface() noexcept { return oError; }
QuorTable& quorStringInterface() noexcept { return oString; }
QuorTable& quorMemoryInterface() noexcept { return oMemory; }

} // namespace ORVO::ImageFlow
