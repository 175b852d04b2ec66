#pragma once

#include "orvo/colour_engine/VantleHandles.h"

#include <cstddef>
#include <cstdint>

namespace ORVO {

/// The shapes of the procedures of the interface layer itself, below the colour engine. None of them lets an
/// exception out.
///
/// Threads: any procedure from any thread.

// "Quor": selector and procedure name are equal
using QuorRegisterProcAddressProc = VantleResult (*)(char const* pInterface, char const* pSelector,
                                                     char const* pProcName, void* pProcedure);
using QuorReportErrorProc = VantleResult (*)(QuorError* pError);
/// Takes an interface away and raises the counter of unregistrations.
using QuorUnregisterInterfaceProc = VantleResult (*)(char const* pInterface);
/// The counter is read while other threads raise it: atomically.
using QuorGetUnregisterCountAddrProc = VantleResult (*)(std::uint32_t** pAddress);
using QuorIsMultiThreadedProc = std::uint32_t (*)();

// "QuorContainerInterface"
using QuorContainerAddRefProc = VantleResult (*)(QuorContainer* pObject);
using QuorContainerReleaseProc = VantleResult (*)(QuorContainer* pObject);
/// A method that the object does not have is a null method and success where `notRequired` is set, else a
/// failure.
using QuorContainerGetMethodProc = VantleResult (*)(void** pOut, QuorContainer* pObject,
                                                    QuorStringAtom* pSelector, QuorStringAtom* pProcName,
                                                    std::uint32_t notRequired);

// "QuorErrorInterface"
using QuorNewErrorProc = VantleResult (*)(QuorError** pOut, char const* pText, char const* pComponent);
using QuorErrorAddRefProc = VantleResult (*)(QuorError* pError);
using QuorErrorReleaseProc = VantleResult (*)(QuorError* pError);
/// The text is valid as long as the error is.
using QuorGetErrorMessageProc = VantleResult (*)(QuorError* pError, char const** pText);
using QuorGetComponentProc = VantleResult (*)(QuorError* pError, char const** pComponent);

// "QuorStringInterface"
using QuorNewStringAtomProc = VantleResult (*)(QuorStringAtom** pOut, char const* pText);
using QuorDeleteStringAtomProc = VantleResult (*)(QuorStringAtom* pAtom);
using QuorGetCStringProc = VantleResult (*)(QuorStringAtom* pAtom, char const** pText);
using QuorStringAtomAddRefProc = VantleResult (*)(QuorStringAtom* pAtom);

// "QuorMemoryInterface"
using QuorAllocProc = VantleResult (*)(void** pOut, std::size_t size);
using QuorReallocProc = VantleResult (*)(void** pBlock, std::size_t size);
using QuorFreeProc = VantleResult (*)(void* pBlock);
using QuorGetBlockSizeProc = VantleResult (*)(void* pBlock, std::size_t* pSize);

} // namespace ORVO
