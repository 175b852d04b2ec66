#include "orvo/colour_engine/QuorProcedures.h"
#include "orvo/colour_engine/internal/EngineFailure.h"
#include "orvo/colour_engine/internal/EngineProcedures.h"
#include "orvo/colour_engine/internal/HandleTable.h"

#include <atomic>
#include <cstddef>
#include <cstdlib>
#include <cstring>
#include <iterator>
#include <limits>
#include <memory>
#include <string>

namespace ORVO::ColourEngine::Internal {

namespace {

// Containers. Shaders are the only objects of this engine that a client releases as such.

VantleResult containerAddRefProc(QuorContainer* pObject) {
    return runProcedure([&] {
        return resultOf(HandleTable::instance().addReference(pObject, HandleKind::Shader),
                        EngineFailure::InvalidHandle);
    });
}

VantleResult containerReleaseProc(QuorContainer* pObject) {
    return runProcedure([&] {
        return resultOf(HandleTable::instance().release(pObject, HandleKind::Shader),
                        EngineFailure::InvalidHandle);
    });
}

/// A shader is used through "VantleShaderInterface" alone and has no methods of its own.
VantleResult containerGetMethodProc(void** pOut, QuorContainer* pObject, QuorStringAtom* pSelector,
                                    QuorStringAtom* pProcName, std::uint32_t notRequired) {
    return runProcedure([&] {
        HandleTable& table = HandleTable::instance();
        if (table.find<void>(pObject, HandleKind::Shader) == nullptr ||
            table.find<std::string>(pSelector, HandleKind::StringAtom) == nullptr ||
            table.find<std::string>(pProcName, HandleKind::StringAtom) == nullptr) {
            return engineFailure(EngineFailure::InvalidHandle);
        }
        if (pOut == nullptr) {
            return engineFailure(EngineFailure::InvalidArgument);
        }
        *pOut = nullptr;
        return resultOf(notRequired != 0, EngineFailure::MissingMethod);
    });
}

// Errors

VantleResult newErrorProc(QuorError** pOut, char const* pText, char const* pComponent) {
    return runProcedure([&] {
        if (pOut == nullptr || pText == nullptr || pComponent == nullptr) {
            return engineFailure(EngineFailure::InvalidArgument);
        }
        auto spError = std::make_shared<EngineError const>(EngineError{pText, pComponent});
        *pOut = static_cast<QuorError*>(HandleTable::instance().add(HandleKind::Error, std::move(spError)));
        return VantleResult{0};
    });
}

VantleResult errorAddRefProc(QuorError* pError) {
    return runProcedure([&] {
        return resultOf(HandleTable::instance().addReference(pError, HandleKind::Error),
                        EngineFailure::InvalidHandle);
    });
}

VantleResult errorReleaseProc(QuorError* pError) {
    return runProcedure([&] {
        return resultOf(HandleTable::instance().release(pError, HandleKind::Error),
                        EngineFailure::InvalidHandle);
    });
}

VantleResult tellErrorText(QuorError* pError, char const** pOut, std::string EngineError::*pMember) {
    return runProcedure([&] {
        auto const spError = HandleTable::instance().find<EngineError>(pError, HandleKind::Error);
        if (spError == nullptr) {
            return engineFailure(EngineFailure::InvalidHandle);
        }
        if (pOut == nullptr) {
            return engineFailure(EngineFailure::InvalidArgument);
        }
        *pOut = ((*spError).*pMember).c_str();
        return VantleResult{0};
    });
}

VantleResult getErrorMessageProc(QuorError* pError, char const** pText) {
    return tellErrorText(pError, pText, &EngineError::sText_);
}

VantleResult getComponentProc(QuorError* pError, char const** pComponent) {
    return tellErrorText(pError, pComponent, &EngineError::sComponent_);
}

// String atoms

VantleResult newStringAtomProc(QuorStringAtom** pOut, char const* pText) {
    return runProcedure([&] {
        if (pOut == nullptr || pText == nullptr) {
            return engineFailure(EngineFailure::InvalidArgument);
        }
        *pOut = static_cast<QuorStringAtom*>(
            HandleTable::instance().add(HandleKind::StringAtom, std::make_shared<std::string const>(pText)));
        return VantleResult{0};
    });
}

VantleResult deleteStringAtomProc(QuorStringAtom* pAtom) {
    return runProcedure([&] {
        return resultOf(HandleTable::instance().release(pAtom, HandleKind::StringAtom),
                        EngineFailure::InvalidHandle);
    });
}

VantleResult getCStringProc(QuorStringAtom* pAtom, char const** pText) {
    return runProcedure([&] {
        auto const spText = HandleTable::instance().find<std::string>(pAtom, HandleKind::StringAtom);
        if (spText == nullptr) {
            return engineFailure(EngineFailure::InvalidHandle);
        }
        if (pText == nullptr) {
            return engineFailure(EngineFailure::InvalidArgument);
        }
        *pText = spText->c_str();
        return VantleResult{0};
    });
}

VantleResult stringAtomAddRefProc(QuorStringAtom* pAtom) {
    return runProcedure([&] {
        return resultOf(HandleTable::instance().addReference(pAtom, HandleKind::StringAtom),
                        EngineFailure::InvalidHandle);
    });
}

// Memory. A block has its size before it.

constexpr std::size_t nBlockHeader = alignof(std::max_align_t);
std::atomic<std::size_t> nBlocks{0};

std::size_t sizeOfBlock(void* pBlock) {
    std::size_t size = 0;
    std::memcpy(&size, static_cast<char*>(pBlock) - nBlockHeader, sizeof(size));
    return size;
}

/// Null where there is no room. `pOld` is null or a block, which is given up on success.
void* resizeBlock(void* pOld, std::size_t size) {
    if (size > std::numeric_limits<std::size_t>::max() - nBlockHeader) {
        return nullptr;
    }
    void* const pStart = pOld != nullptr ? static_cast<char*>(pOld) - nBlockHeader : nullptr;
    auto* const pNew = static_cast<char*>(std::realloc(pStart, size + nBlockHeader));
    if (pNew == nullptr) {
        return nullptr;
    }
    std::memcpy(pNew, &size, sizeof(size));
    return pNew + nBlockHeader;
}

VantleResult reallocProc(void** pBlock, std::size_t size) {
    return runProcedure([&] {
        if (pBlock == nullptr) {
            return engineFailure(EngineFailure::InvalidArgument);
        }
        void* const pNew = resizeBlock(*pBlock, size);
        if (pNew == nullptr) {
            return engineFailure(EngineFailure::OutOfMemory);
        }
        nBlocks += *pBlock == nullptr ? 1 : 0;
        *pBlock = pNew;
        return VantleResult{0};
    });
}

VantleResult allocProc(void** pOut, std::size_t size) {
    if (pOut == nullptr) {
        return engineFailure(EngineFailure::InvalidArgument);
    }
    void* pBlock = nullptr;
    VantleResult const result = reallocProc(&pBlock, size);
    if (result == 0) {
        *pOut = pBlock;
    }
    return result;
}

VantleResult freeProc(void* pBlock) {
    if (pBlock != nullptr) {
        std::free(static_cast<char*>(pBlock) - nBlockHeader);
        --nBlocks;
    }
    return 0;
}

VantleResult getBlockSizeProc(void* pBlock, std::size_t* pSize) {
    if (pBlock == nullptr || pSize == nullptr) {
        return engineFailure(EngineFailure::InvalidArgument);
    }
    *pSize = sizeOfBlock(pBlock);
    return 0;
}

} // namespace

std::size_t nMemoryBlocks() noexcept { return nBlocks; }

ProcedureSpan containerProcedures() noexcept {
    static ProcedureEntry const aEntries[] = {
        {"QuorContainerInterface", "AddRef", "QuorAddRefProc", asAddress(&containerAddRefProc)},
        {"QuorContainerInterface", "Release", "QuorReleaseProc", asAddress(&containerReleaseProc)},
        {"QuorContainerInterface", "GetMethod", "QuorGetMethodV3Proc", asAddress(&containerGetMethodProc)},
    };
    return {aEntries, std::size(aEntries)};
}

ProcedureSpan errorProcedures() noexcept {
    static ProcedureEntry const aEntries[] = {
        {"QuorErrorInterface", "NewError", "QuorNewErrorProc", asAddress(&newErrorProc)},
        {"QuorErrorInterface", "AddRef", "QuorErrorAddRefProc", asAddress(&errorAddRefProc)},
        {"QuorErrorInterface", "Release", "QuorErrorReleaseProc", asAddress(&errorReleaseProc)},
        {"QuorErrorInterface", "GetErrorMessage", "QuorGetErrorMessageProc", asAddress(&getErrorMessageProc)},
        {"QuorErrorInterface", "GetComponent", "QuorGetComponentProc", asAddress(&getComponentProc)},
    };
    return {aEntries, std::size(aEntries)};
}

ProcedureSpan stringProcedures() noexcept {
    static ProcedureEntry const aEntries[] = {
        {"QuorStringInterface", "NewStringAtom", "QuorNewStringAtomProc", asAddress(&newStringAtomProc)},
        {"QuorStringInterface", "DeleteStringAtom", "QuorDeleteStringAtomProc",
         asAddress(&deleteStringAtomProc)},
        {"QuorStringInterface", "GetCString", "QuorGetCStringProc", asAddress(&getCStringProc)},
        {"QuorStringInterface", "AddRef", "QuorStringAtomAddRefProc", asAddress(&stringAtomAddRefProc)},
    };
    return {aEntries, std::size(aEntries)};
}

ProcedureSpan memoryProcedures() noexcept {
    static ProcedureEntry const aEntries[] = {
        {"QuorMemoryInterface", "Alloc", "QuorAllocProc", asAddress(&allocProc)},
        {"QuorMemoryInterface", "Realloc", "QuorReallocProc", asAddress(&reallocProc)},
        {"QuorMemoryInterface", "Free", "QuorFreeProc", asAddress(&freeProc)},
        {"QuorMemoryInterface", "GetBlockSize", "QuorGetBlockSizeProc", asAddress(&getBlockSizeProc)},
    };
    return {aEntries, std::size(aEntries)};
}

} // namespace ORVO::ColourEngine::Internal
