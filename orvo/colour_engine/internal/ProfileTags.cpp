#include "orvo/colour_engine/internal/ProfileTags.h"

#include "orvo/colour_engine/internal/CurveFormula.h"
#include "orvo/colour_engine/internal/Profile.h"

#include <cmath>
#include <utility>

namespace ORVO::ColourEngine::Internal {

namespace {

/// By the adjugate; nothing for a singular matrix.
std::optional<Matrix> invert(Matrix const& m) {
    Matrix adjugate = {m[4] * m[8] - m[5] * m[7], m[2] * m[7] - m[1] * m[8], m[1] * m[5] - m[2] * m[4],
                       m[5] * m[6] - m[3] * m[8], m[0] * m[8] - m[2] * m[6], m[2] * m[3] - m[0] * m[5],
                       m[3] * m[7] - m[4] * m[6], m[1] * m[6] - m[0] * m[7], m[0] * m[4] - m[1] * m[3]};
    double const determinant = m[0] * adjugate[0] + m[1] * adjugate[3] + m[2] * adjugate[6];
    if (!(std::abs(determinant) > 1e-9)) {
        return std::nullopt;
    }
    for (double& element : adjugate) {
        element /= determinant;
    }
    return adjugate;
}

std::optional<ShaperTags> readGrayTags(cmsHPROFILE pProfile) {
    auto const* const pCurve = static_cast<cmsToneCurve const*>(cmsReadTag(pProfile, cmsSigGrayTRCTag));
    if (pCurve == nullptr) {
        return std::nullopt;
    }
    cmsCIEXYZ const& white = *cmsD50_XYZ();
    // Green alone is looked at.
    return ShaperTags{{pCurve, pCurve, pCurve}, {0.0, white.X, 0.0, 0.0, white.Y, 0.0, 0.0, white.Z, 0.0}};
}

/// The media white that absolute colours are relative to. Displays of version 2 are taken as adapted to D50.
cmsCIEXYZ mediaWhite(cmsHPROFILE pProfile) {
    auto const* const pWhite = static_cast<cmsCIEXYZ const*>(cmsReadTag(pProfile, cmsSigMediaWhitePointTag));
    bool const bOldDisplay =
        cmsGetProfileVersion(pProfile) < 4.0 && cmsGetDeviceClass(pProfile) == cmsSigDisplayClass;
    return pWhite == nullptr || bOldDisplay ? *cmsD50_XYZ() : *pWhite;
}

/// Nothing for a curve of entries or of several segments.
std::optional<CurveFormula> formulaOf(cmsToneCurve const* pCurve) {
    cmsInt32Number const type = cmsGetToneCurveParametricType(pCurve);
    return type == 0 ? std::nullopt : curveFormula(type, cmsGetToneCurveParams(pCurve));
}

} // namespace

Matrix multiply(Matrix const& a, Matrix const& b) {
    Matrix product{};
    for (std::size_t row = 0; row < 3; ++row) {
        for (std::size_t column = 0; column < 3; ++column) {
            for (std::size_t k = 0; k < 3; ++k) {
                product[3 * row + column] += a[3 * row + k] * b[3 * k + column];
            }
        }
    }
    return product;
}

std::optional<ShaperTags> readTags(Profile const& profile) {
    void* const pProfile = profile.handle();
    if (profile.isGray()) {
        return readGrayTags(pProfile);
    }
    constexpr std::array aCurveTags = {cmsSigRedTRCTag, cmsSigGreenTRCTag, cmsSigBlueTRCTag};
    constexpr std::array aColorantTags = {cmsSigRedColorantTag, cmsSigGreenColorantTag,
                                          cmsSigBlueColorantTag};
    ShaperTags tags{};
    for (std::size_t i = 0; i < 3; ++i) {
        tags.aCurves_[i] = static_cast<cmsToneCurve const*>(cmsReadTag(pProfile, aCurveTags[i]));
        auto const* const pColorant = static_cast<cmsCIEXYZ const*>(cmsReadTag(pProfile, aColorantTags[i]));
        if (tags.aCurves_[i] == nullptr || pColorant == nullptr) {
            return std::nullopt;
        }
        tags.toXYZ_[i] = pColorant->X;
        tags.toXYZ_[3 + i] = pColorant->Y;
        tags.toXYZ_[6 + i] = pColorant->Z;
    }
    return tags;
}

std::optional<Matrix> fromXYZ(Profile const& profile, ShaperTags const& tags) {
    if (profile.isGray()) {
        return Matrix{0.0, 1.0, 0.0, 0.0, 1.0, 0.0, 0.0, 1.0, 0.0};
    }
    return invert(tags.toXYZ_);
}

Matrix whiteScale(Profile const& source, Profile const& destination) {
    cmsCIEXYZ const from = mediaWhite(source.handle());
    cmsCIEXYZ const to = mediaWhite(destination.handle());
    return {from.X / to.X, 0.0, 0.0, 0.0, from.Y / to.Y, 0.0, 0.0, 0.0, from.Z / to.Z};
}

ChannelCurve curveFunction(CurveHandle spCurve) {
    auto const formula = formulaOf(spCurve.get());
    return ChannelCurve(
        [spCurve = std::move(spCurve)](double x) {
            return static_cast<double>(
                cmsEvalToneCurveFloat(spCurve.get(), static_cast<cmsFloat32Number>(x)));
        },
        formula);
}

} // namespace ORVO::ColourEngine::Internal
