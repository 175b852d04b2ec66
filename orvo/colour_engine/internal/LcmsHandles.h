#pragma once

#include <lcms2.h>

#include <memory>

namespace ORVO::ColourEngine::Internal {

struct CloseProfile {
    using pointer = cmsHPROFILE;
    void operator()(cmsHPROFILE pProfile) const noexcept { cmsCloseProfile(pProfile); }
};

struct DeleteTransform {
    using pointer = cmsHTRANSFORM;
    void operator()(cmsHTRANSFORM pTransform) const noexcept { cmsDeleteTransform(pTransform); }
};

using ProfileHandle = std::unique_ptr<void, CloseProfile>;
using TransformHandle = std::unique_ptr<void, DeleteTransform>;
using CurveHandle = std::shared_ptr<cmsToneCurve>;

/// Null in, null out.
inline CurveHandle ownCurve(cmsToneCurve* pCurve) {
    return pCurve != nullptr ? CurveHandle(pCurve, &cmsFreeToneCurve) : CurveHandle();
}

/// The colour library's context for everything here: what a host sets in the library's global one does not
/// reach us.
cmsContext lcmsContext();

} // namespace ORVO::ColourEngine::Internal
