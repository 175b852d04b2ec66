#include "orvo/image_flow/colour/CVantle.h"

#include "orvo/image_flow/colour/TrelException.h"
#include "orvo/image_flow/colour/VantleGuard.h"

namespace ORVO {

namespace {

/// The rows that are called, by their slots in the engine's table of 150.
enum VantleSlot : std::size_t {
    VANTLE_PROFILE_FROM_CODE = 18,
    VANTLE_UN_REFERENCE_PROFILE = 32,
    VANTLE_UN_REFERENCE_STRING = 50,
    VANTLE_STRING_ASCII = 51,
    VANTLE_MAKE_COLOR_TRANSFORM = 53,
    VANTLE_REFERENCE_TRANSFORM = 55,
    VANTLE_UN_REFERENCE_TRANSFORM = 56,
    VANTLE_APPLY_GENERAL = 62,
    VANTLE_OPTIMIZE_TRANSFORM = 67
};

constexpr ImageFlow::QuorRow aVantleRows[] = {
    {VANTLE_PROFILE_FROM_CODE, "ProfileFromCode", "Vantle_ProfileFromCodeProc2"},
    {VANTLE_UN_REFERENCE_PROFILE, "UnReferenceProfile", "Vantle_UnReferenceProfileProc2"},
    {VANTLE_UN_REFERENCE_STRING, "UnReferenceString", "Vantle_UnReferenceStringProc2"},
    {VANTLE_STRING_ASCII, "StringASCII", "Vantle_StringASCIIProc2"},
    {VANTLE_MAKE_COLOR_TRANSFORM, "MakeColorTransform", "Vantle_MakeColorTransformProc2"},
    {VANTLE_REFERENCE_TRANSFORM, "ReferenceTransform", "Vantle_ReferenceTransformProc2"},
    {VANTLE_UN_REFERENCE_TRANSFORM, "UnReferenceTransform", "Vantle_UnReferenceTransformProc2"},
    {VANTLE_APPLY_GENERAL, "ApplyGeneral", "Vantle_ApplyGeneralProc2"},
    {VANTLE_OPTIMIZE_TRANSFORM, "OptimizeTransform", "Vantle_OptimizeTransformProc2"},
};

std::atomic<void*> aVantleSlots[150];
constinit ImageFlow::QuorTable oVantleTable("VantleInterface2", aVantleRows, std::size(aVantleRows),
                                            aVantleSlots);
constinit ImageFlow::VantleGuard oVantle(oVantleTable);

/// A reference on an object of the engine's for a scope, whatever throws in it.
template <typename Handle, VantleResult (*drop)(Handle*)>
struct Dropped {
    Dropped() = default;
    Dropped(Dropped const&) = delete;
    Dropped& operator=(Dropped const&) = delete;
    ~Dropped() {
        if (pHandle_ == nullptr) {
            return;
        }
        try {
            drop(pHandle_);
        } catch (TrelException const&) { // The engine is gone, and the object with it.
            return;
        }
    }

    Handle* pHandle_ = nullptr;
};

} // namespace

bool CVantle::isAvailable() noexcept { return oVantle.isAvailable(); }

ImageFlow::QuorTable const& CVantle::table() noexcept { return oVantleTable; }

VantleResult CVantle::ProfileFromCode(VantleProfile** pOut, std::uint32_t code) {
    return oVantle.procedure<VantleProfileFromCodeProc>(VANTLE_PROFILE_FROM_CODE)(pOut, code);
}

VantleResult CVantle::UnReferenceProfile(VantleProfile* pProfile) {
    return oVantle.procedure<VantleUnReferenceProfileProc>(VANTLE_UN_REFERENCE_PROFILE)(pProfile);
}

VantleResult CVantle::UnReferenceString(VantleString* pString) {
    return oVantle.procedure<VantleUnReferenceStringProc>(VANTLE_UN_REFERENCE_STRING)(pString);
}

VantleResult CVantle::StringASCII(VantleString* pString, char* pBuffer, std::uint32_t* pSize,
                                  std::uint32_t capacity) {
    return oVantle.procedure<VantleStringASCIIProc>(VANTLE_STRING_ASCII)(pString, pBuffer, pSize, capacity);
}

VantleResult CVantle::MakeColorTransform(VantleTransform** pOut, VantleProfile* pSource,
                                         VantleProfile* pDestination, std::uint32_t intent,
                                         std::uint32_t options) {
    return oVantle.procedure<VantleMakeColorTransformProc>(VANTLE_MAKE_COLOR_TRANSFORM)(
        pOut, pSource, pDestination, intent, options);
}

VantleResult CVantle::ReferenceTransform(VantleTransform* pTransform) {
    return oVantle.procedure<VantleReferenceTransformProc>(VANTLE_REFERENCE_TRANSFORM)(pTransform);
}

VantleResult CVantle::UnReferenceTransform(VantleTransform* pTransform) {
    return oVantle.procedure<VantleUnReferenceTransformProc>(VANTLE_UN_REFERENCE_TRANSFORM)(pTransform);
}

VantleResult CVantle::ApplyGeneral(VantleTransform* pTransform, _t_Vantle_PackingSpec const* pSource,
                                   _t_Vantle_PackingSpec const* pDestination, std::uint32_t rows,
                                   std::uint32_t columns, _t_Vantle_Options const* pOptions) {
    return oVantle.procedure<VantleApplyGeneralProc>(VANTLE_APPLY_GENERAL)(pTransform, pSource, pDestination,
                                                                           rows, columns, pOptions);
}

VantleResult CVantle::OptimizeTransform(VantleTransform** pOut, VantleTransform* pTransform,
                                        std::uint32_t options) {
    return oVantle.procedure<VantleOptimizeTransformProc>(VANTLE_OPTIMIZE_TRANSFORM)(pOut, pTransform,
                                                                                     options);
}

VantleResult CVantle::makeTransform(VantleTransform** pOut, std::uint32_t sourceCode,
                                    std::uint32_t destinationCode) {
    *pOut = nullptr;
    Dropped<VantleProfile, &UnReferenceProfile> source;
    Dropped<VantleProfile, &UnReferenceProfile> destination;
    Dropped<VantleTransform, &UnReferenceTransform> raw;
    VantleResult result = ProfileFromCode(&source.pHandle_, sourceCode);
    if (result == 0) {
        result = ProfileFromCode(&destination.pHandle_, destinationCode);
    }
    if (result == 0) {
        result = MakeColorTransform(&raw.pHandle_, source.pHandle_, destination.pHandle_,
                                    VANTLE_INTENT_ABSOLUTE, 0);
    }
    return result == 0 ? OptimizeTransform(pOut, raw.pHandle_, 0) : result;
}

} // namespace ORVO
