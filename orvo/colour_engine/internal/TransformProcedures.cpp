#include "orvo/colour_engine/VantlePackingSpec.h"
#include "orvo/colour_engine/VantleProcedures.h"
#include "orvo/colour_engine/internal/Applier.h"
#include "orvo/colour_engine/internal/EngineFailure.h"
#include "orvo/colour_engine/internal/EngineProcedures.h"
#include "orvo/colour_engine/internal/HandleTable.h"
#include "orvo/colour_engine/internal/Profile.h"
#include "orvo/colour_engine/internal/Transform.h"
#include "orvo/colour_engine/internal/TransformResolver.h"

#include <algorithm>
#include <iterator>
#include <stdexcept>
#include <string>

namespace ORVO::ColourEngine::Internal {

namespace {

VantleResult profileFromCodeProc(VantleProfile** pOut, std::uint32_t code) {
    return runProcedure([&] {
        if (pOut == nullptr) {
            return engineFailure(EngineFailure::InvalidArgument);
        }
        auto spProfile = profileFromCode(code);
        if (spProfile == nullptr) {
            return engineFailure(EngineFailure::UnknownProfileCode);
        }
        *pOut = static_cast<VantleProfile*>(
            HandleTable::instance().add(HandleKind::Profile, std::move(spProfile)));
        return VantleResult{0};
    });
}

VantleResult unReferenceProfileProc(VantleProfile* pProfile) {
    return runProcedure([&] {
        return resultOf(HandleTable::instance().release(pProfile, HandleKind::Profile),
                        EngineFailure::InvalidHandle);
    });
}

VantleResult unReferenceStringProc(VantleString* pString) {
    return runProcedure([&] {
        return resultOf(HandleTable::instance().release(pString, HandleKind::String),
                        EngineFailure::InvalidHandle);
    });
}

VantleResult stringASCIIProc(VantleString* pString, char* pBuffer, std::uint32_t* pSize,
                             std::uint32_t capacity) {
    return runProcedure([&] {
        auto const spText = HandleTable::instance().find<std::string>(pString, HandleKind::String);
        if (spText == nullptr) {
            return engineFailure(EngineFailure::InvalidHandle);
        }
        if (pSize == nullptr) {
            return engineFailure(EngineFailure::InvalidArgument);
        }
        *pSize = static_cast<std::uint32_t>(spText->size());
        if (pBuffer != nullptr) {
            std::copy_n(spText->data(), std::min<std::size_t>(capacity, spText->size()), pBuffer);
        }
        return VantleResult{0};
    });
}

VantleResult makeColorTransformProc(VantleTransform** pOut, VantleProfile* pSource,
                                    VantleProfile* pDestination, std::uint32_t intent,
                                    std::uint32_t options) {
    return runProcedure([&] {
        HandleTable& table = HandleTable::instance();
        auto spSource = table.find<Profile>(pSource, HandleKind::Profile);
        auto spDestination = table.find<Profile>(pDestination, HandleKind::Profile);
        if (spSource == nullptr || spDestination == nullptr) {
            return engineFailure(EngineFailure::InvalidHandle);
        }
        if (pOut == nullptr || intent > VANTLE_INTENT_ABSOLUTE ||
            (options & ~TRANSFORM_BLACK_POINT_COMPENSATION) != 0) {
            return engineFailure(EngineFailure::InvalidArgument);
        }
        if (!spSource->canBeSource() || !spDestination->canBeDestination()) {
            return engineFailure(EngineFailure::NoTransform);
        }
        auto spTransform =
            std::make_shared<Transform const>(std::move(spSource), std::move(spDestination), intent, options);
        *pOut = static_cast<VantleTransform*>(table.add(HandleKind::Transform, std::move(spTransform)));
        return VantleResult{0};
    });
}

VantleResult referenceTransformProc(VantleTransform* pTransform) {
    return runProcedure([&] {
        return resultOf(HandleTable::instance().addReference(pTransform, HandleKind::Transform),
                        EngineFailure::InvalidHandle);
    });
}

VantleResult unReferenceTransformProc(VantleTransform* pTransform) {
    return runProcedure([&] {
        return resultOf(HandleTable::instance().release(pTransform, HandleKind::Transform),
                        EngineFailure::InvalidHandle);
    });
}

/// The options are another engine's: this one knows none.
VantleResult applyGeneralProc(VantleTransform* pTransform, _t_Vantle_PackingSpec const* pSource,
                              _t_Vantle_PackingSpec const* pDestination, std::uint32_t rows,
                              std::uint32_t columns, _t_Vantle_Options const* /*pOptions*/) {
    return runProcedure([&] {
        // Kept alive here: another thread may drop the last reference meanwhile.
        auto const spTransform = HandleTable::instance().find<Transform>(pTransform, HandleKind::Transform);
        if (spTransform == nullptr) {
            return engineFailure(EngineFailure::InvalidHandle);
        }
        if (pSource == nullptr || pDestination == nullptr) {
            return engineFailure(EngineFailure::InvalidArgument);
        }
        try {
            spTransform->resolved();
        } catch (std::runtime_error const&) {
            return engineFailure(EngineFailure::NoTransform);
        }
        return resultOf(spTransform->applier().apply(*pSource, *pDestination, rows, columns),
                        EngineFailure::UnsupportedPixels);
    });
}

VantleResult optimizeTransformProc(VantleTransform** pOut, VantleTransform* pTransform,
                                   std::uint32_t options) {
    return runProcedure([&] {
        HandleTable& table = HandleTable::instance();
        auto const spTransform = table.find<Transform>(pTransform, HandleKind::Transform);
        if (spTransform == nullptr) {
            return engineFailure(EngineFailure::InvalidHandle);
        }
        if (pOut == nullptr || options != 0) {
            return engineFailure(EngineFailure::InvalidArgument);
        }
        void* pHandle = table.findInterned(spTransform->key());
        if (pHandle == nullptr) {
            try {
                spTransform->resolved();
            } catch (std::runtime_error const&) {
                return engineFailure(EngineFailure::NoTransform);
            }
            pHandle = table.intern(HandleKind::Transform, spTransform->key(), spTransform);
        }
        *pOut = static_cast<VantleTransform*>(pHandle);
        return VantleResult{0};
    });
}

constexpr char const* pTransformInterface = "VantleInterface2";

} // namespace

ProcedureSpan transformProcedures() noexcept {
    static ProcedureEntry const aEntries[] = {
        {pTransformInterface, "ProfileFromCode", "Vantle_ProfileFromCodeProc2",
         asAddress(&profileFromCodeProc)},
        {pTransformInterface, "UnReferenceProfile", "Vantle_UnReferenceProfileProc2",
         asAddress(&unReferenceProfileProc)},
        {pTransformInterface, "UnReferenceString", "Vantle_UnReferenceStringProc2",
         asAddress(&unReferenceStringProc)},
        {pTransformInterface, "StringASCII", "Vantle_StringASCIIProc2", asAddress(&stringASCIIProc)},
        {pTransformInterface, "MakeColorTransform", "Vantle_MakeColorTransformProc2",
         asAddress(&makeColorTransformProc)},
        {pTransformInterface, "ReferenceTransform", "Vantle_ReferenceTransformProc2",
         asAddress(&referenceTransformProc)},
        {pTransformInterface, "UnReferenceTransform", "Vantle_UnReferenceTransformProc2",
         asAddress(&unReferenceTransformProc)},
        {pTransformInterface, "ApplyGeneral", "Vantle_ApplyGeneralProc2", asAddress(&applyGeneralProc)},
        {pTransformInterface, "OptimizeTransform", "Vantle_OptimizeTransformProc2",
         asAddress(&optimizeTransformProc)},
    };
    return {aEntries, std::size(aEntries)};
}

} // namespace ORVO::ColourEngine::Internal
