#include "orvo/colour_engine/internal/Profile.h"

#include "orvo/colour_engine/internal/LcmsHandles.h"
#include "orvo/core/Check.h"

#include <array>
#include <atomic>
#include <cmath>
#include <cstring>
#include <limits>
#include <new>

namespace ORVO::ColourEngine::Internal {

namespace {

std::uint64_t nextSerial() {
    static std::atomic<std::uint64_t> iLast{0};
    return ++iLast;
}

CurveHandle makeTransferCurve(BuiltInProfile const& space) {
    switch (space.eTransfer) {
    case Transfer::SRGB: {
        std::array<cmsFloat64Number, 5> const aParameters = {2.4, 1.0 / 1.055, 0.055 / 1.055, 1.0 / 12.92,
                                                             0.04045};
        return ownCurve(cmsBuildParametricToneCurve(lcmsContext(), 4, aParameters.data()));
    }
    case Transfer::BT2020: {
        // The constants at which the two branches meet with one slope.
        constexpr double alpha = 1.09929682680944;
        constexpr double beta = 0.018053968510807;
        std::array<cmsFloat64Number, 5> const aParameters = {1.0 / 0.45, 1.0 / alpha, (alpha - 1.0) / alpha,
                                                             1.0 / 4.5, 4.5 * beta};
        return ownCurve(cmsBuildParametricToneCurve(lcmsContext(), 4, aParameters.data()));
    }
    case Transfer::Gamma:
        break;
    }
    return ownCurve(cmsBuildGamma(lcmsContext(), space.gamma));
}

cmsHPROFILE makeSpace(BuiltInProfile const& space) {
    CurveHandle const spCurve = makeTransferCurve(space);
    if (spCurve == nullptr) {
        return nullptr;
    }
    cmsCIExyY const white = {PROFILE_WHITE.x, PROFILE_WHITE.y, 1.0};
    if (space.bGray) {
        return cmsCreateGrayProfileTHR(lcmsContext(), &white, spCurve.get());
    }
    cmsCIExyYTRIPLE const primaries = {{space.aPrimaries[0].x, space.aPrimaries[0].y, 1.0},
                                       {space.aPrimaries[1].x, space.aPrimaries[1].y, 1.0},
                                       {space.aPrimaries[2].x, space.aPrimaries[2].y, 1.0}};
    std::array<cmsToneCurve*, 3> const aCurves = {spCurve.get(), spCurve.get(), spCurve.get()};
    return cmsCreateRGBProfileTHR(lcmsContext(), &white, &primaries, aCurves.data());
}

bool describesDevice(cmsHPROFILE pProfile) {
    switch (cmsGetDeviceClass(pProfile)) {
    case cmsSigInputClass:
    case cmsSigDisplayClass:
    case cmsSigOutputClass:
    case cmsSigColorSpaceClass:
        return true;
    case cmsSigLinkClass:
    case cmsSigAbstractClass:
    case cmsSigNamedColorClass:
        break;
    }
    return false;
}

} // namespace

cmsContext lcmsContext() {
    // Never deleted: profiles that live as long as the process belong to it.
    static auto* const pContext = cmsCreateContext(nullptr, nullptr);
    return pContext;
}

Profile::Profile(BuiltInProfile const& space) : iSerial_(nextSerial()), bGray_(space.bGray) {
    ProfileHandle handle(makeSpace(space));
    if (handle == nullptr) {
        throw std::bad_alloc();
    }
    bSource_ = true;
    bDestination_ = true;
    pHandle_ = handle.release();
}

Profile::Profile(void const* pBytes, std::size_t nBytes) : iSerial_(nextSerial()) {
    ORVO_CHECK_PARAMETER(pBytes != nullptr, "Enforce pBytes != NULL");
    ORVO_CHECK_PARAMETER(nBytes <= std::numeric_limits<cmsUInt32Number>::max(), "Not an ICC profile");
    auto const* const pFirst = static_cast<unsigned char const*>(pBytes);
    aBytes_.assign(pFirst, pFirst + nBytes);
    ProfileHandle handle(
        cmsOpenProfileFromMemTHR(lcmsContext(), pBytes, static_cast<cmsUInt32Number>(nBytes)));
    ORVO_CHECK_PARAMETER(handle != nullptr, "Not an ICC profile");
    cmsColorSpaceSignature const eSpace = cmsGetColorSpace(handle.get());
    ORVO_CHECK_PARAMETER(eSpace == cmsSigRgbData || eSpace == cmsSigGrayData,
                         "Profile is neither RGB nor grey");
    bGray_ = eSpace == cmsSigGrayData;
    bool const bDevice = describesDevice(handle.get());
    ORVO_CHECK_PARAMETER(bDevice, "Profile describes no colours");
    pHandle_ = handle.get();
    findDirections();
    ORVO_CHECK_PARAMETER(bSource_ || bDestination_, "Profile describes no colours");
    pHandle_ = handle.release();
}

Profile::~Profile() { cmsCloseProfile(pHandle_); }

void Profile::findDirections() {
    ProfileHandle const spaceXYZ(cmsCreateXYZProfileTHR(lcmsContext()));
    if (spaceXYZ == nullptr) {
        throw std::bad_alloc();
    }
    cmsUInt32Number const format = bGray_ ? TYPE_GRAY_DBL : TYPE_RGB_DBL;
    cmsUInt32Number const flags = cmsFLAGS_NOOPTIMIZE | cmsFLAGS_NOCACHE;
    TransformHandle const toXYZ(cmsCreateTransformTHR(lcmsContext(), pHandle_, format, spaceXYZ.get(),
                                                      TYPE_XYZ_DBL, INTENT_PERCEPTUAL, flags));
    TransformHandle const fromXYZ(cmsCreateTransformTHR(lcmsContext(), spaceXYZ.get(), TYPE_XYZ_DBL, pHandle_,
                                                        format, INTENT_PERCEPTUAL, flags));
    bSource_ = toXYZ != nullptr;
    bDestination_ = fromXYZ != nullptr;
}

bool Profile::isMadeFrom(void const* pBytes, std::size_t nBytes) const noexcept {
    return !aBytes_.empty() && nBytes == aBytes_.size() && std::memcmp(aBytes_.data(), pBytes, nBytes) == 0;
}

} // namespace ORVO::ColourEngine::Internal
