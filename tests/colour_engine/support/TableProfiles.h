/// ICC profiles of tables, made with the colour library itself from functions.
#pragma once

#include "tests/colour_engine/support/ICCProfiles.h"

#include <lcms2.h>

#include <algorithm>
#include <array>
#include <cmath>

namespace ORVO::Test {

using ColourTriple = std::array<double, 3>;

/// Lab as it stands in tables: L / 100, (a + 128) / 255, (b + 128) / 255, in D50.
inline ColourTriple encodedLab(ColourTriple const& xyz) {
    auto const lightness = [](double t) {
        return t > 216.0 / 24389.0 ? std::cbrt(t) : (24389.0 / 27.0 * t + 16.0) / 116.0;
    };
    double const x = lightness(xyz[0] / 0.9642);
    double const y = lightness(xyz[1]);
    double const z = lightness(xyz[2] / 0.8249);
    return {1.16 * y - 0.16, (500.0 * (x - y) + 128.0) / 255.0, (200.0 * (y - z) + 128.0) / 255.0};
}

inline ColourTriple xyzOfEncodedLab(ColourTriple const& lab) {
    auto const light = [](double t) {
        return t > 6.0 / 29.0 ? t * t * t : (116.0 * t - 16.0) * 27.0 / 24389.0;
    };
    double const y = (lab[0] + 0.16) / 1.16;
    double const x = y + (255.0 * lab[1] - 128.0) / 500.0;
    double const z = y - (255.0 * lab[2] - 128.0) / 200.0;
    return {0.9642 * light(x), light(y), 0.8249 * light(z)};
}

/// The primaries of sRGB, adapted to D50, as published.
inline ColourTriple xyzOfLight(ColourTriple const& c) {
    return {0.4360747 * c[0] + 0.3850649 * c[1] + 0.1430804 * c[2],
            0.2225045 * c[0] + 0.7168786 * c[1] + 0.0606169 * c[2],
            0.0139322 * c[0] + 0.0971045 * c[1] + 0.7141733 * c[2]};
}

inline ColourTriple lightOfXYZ(ColourTriple const& c) {
    return {3.1338561 * c[0] - 1.6168667 * c[1] - 0.4906146 * c[2],
            -0.9787684 * c[0] + 1.9161415 * c[1] + 0.0334540 * c[2],
            0.0719453 * c[0] - 0.2289914 * c[1] + 1.4052427 * c[2]};
}

inline double lightOfSRGB(double x) { return x <= 0.04045 ? x / 12.92 : std::pow((x + 0.055) / 1.055, 2.4); }

inline double sRGBOfLight(double x) {
    return x <= 0.0031308 ? 12.92 * x : 1.055 * std::pow(x, 1.0 / 2.4) - 0.055;
}

inline ColourTriple labOfLight(ColourTriple const& colour) { return encodedLab(xyzOfLight(colour)); }

inline ColourTriple labOfSRGB(ColourTriple const& colour) {
    return labOfLight({lightOfSRGB(colour[0]), lightOfSRGB(colour[1]), lightOfSRGB(colour[2])});
}

/// What lies outside the gamut is clipped, as the tables of real profiles clip it.
inline ColourTriple lightOfLab(ColourTriple const& lab) {
    ColourTriple light = lightOfXYZ(xyzOfEncodedLab(lab));
    for (double& value : light) {
        value = std::clamp(value, 0.0, 1.0);
    }
    return light;
}

inline ColourTriple sRGBOfLab(ColourTriple const& lab) {
    ColourTriple const light = lightOfLab(lab);
    return {sRGBOfLight(light[0]), sRGBOfLight(light[1]), sRGBOfLight(light[2])};
}

/// A device whose channels see each other's light and bend what they see: smooth, and no product of curves
/// and a matrix.
inline ColourTriple labOfCamera(ColourTriple const& colour) {
    ColourTriple const c = {std::pow(colour[0], 1.8), std::pow(colour[1], 1.8), std::pow(colour[2], 1.8)};
    ColourTriple light = {0.85 * c[0] + 0.1 * c[1] + 0.05 * c[2] + 0.1 * c[0] * c[1] * (1.0 - c[2]),
                          0.08 * c[0] + 0.82 * c[1] + 0.1 * c[2] - 0.1 * c[0] * c[2] * (1.0 - c[1]),
                          0.03 * c[0] + 0.12 * c[1] + 0.85 * c[2]};
    for (double& value : light) {
        value = value / (0.85 + 0.15 * value);
    }
    return labOfLight(light);
}

/// What a profile of tables is made of.
struct TableRecipe {
    bool bSource;
    cmsUInt32Number nNodes;
    /// Between what comes out of the first curves and what goes into the last ones.
    ColourTriple (*pFunction)(ColourTriple const&);
    double dVersion = 4.3;
    cmsToneCurve* pFirst = nullptr; ///< straight without one; not owned
    cmsToneCurve* pLast = nullptr;
};

inline cmsInt32Number sampleTable(cmsUInt16Number const* pIn, cmsUInt16Number* pOut, void* pRecipe) {
    auto const& recipe = *static_cast<TableRecipe const*>(pRecipe);
    // In tables of the older kind Lab has its white at 65280.
    double const white = recipe.dVersion < 4.0 ? 65280.0 : 65535.0;
    double const unitIn = recipe.bSource ? 65535.0 : white;
    double const unitOut = recipe.bSource ? white : 65535.0;
    ColourTriple const result = recipe.pFunction({pIn[0] / unitIn, pIn[1] / unitIn, pIn[2] / unitIn});
    for (std::size_t i = 0; i < 3; ++i) {
        pOut[i] = static_cast<cmsUInt16Number>(std::lround(std::clamp(result[i] * unitOut, 0.0, 65535.0)));
    }
    return 1;
}

/// The bytes of a profile of a display that has nothing but one table between curves, over Lab.
inline Bytes tableProfile(TableRecipe recipe) {
    auto* const pProfile = cmsCreateProfilePlaceholder(nullptr);
    cmsSetProfileVersion(pProfile, recipe.dVersion);
    cmsSetDeviceClass(pProfile, cmsSigDisplayClass);
    cmsSetColorSpace(pProfile, cmsSigRgbData);
    cmsSetPCS(pProfile, cmsSigLabData);
    cmsWriteTag(pProfile, cmsSigMediaWhitePointTag, cmsD50_XYZ());
    cmsToneCurve* const pStraight = cmsBuildGamma(nullptr, 1.0);
    auto const curves = [&](cmsToneCurve* pCurve) {
        cmsToneCurve* const pUsed = pCurve != nullptr ? pCurve : pStraight;
        cmsToneCurve* const aCurves[3] = {pUsed, pUsed, pUsed};
        return cmsStageAllocToneCurves(nullptr, 3, aCurves);
    };
    cmsPipeline* const pPipeline = cmsPipelineAlloc(nullptr, 3, 3);
    cmsStage* const pTable = cmsStageAllocCLut16bit(nullptr, recipe.nNodes, 3, 3, nullptr);
    demand(cmsStageSampleCLut16bit(pTable, &sampleTable, &recipe, 0));
    cmsPipelineInsertStage(pPipeline, cmsAT_END, curves(recipe.pFirst));
    cmsPipelineInsertStage(pPipeline, cmsAT_END, pTable);
    cmsPipelineInsertStage(pPipeline, cmsAT_END, curves(recipe.pLast));
    demand(cmsWriteTag(pProfile, recipe.bSource ? cmsSigAToB0Tag : cmsSigBToA0Tag, pPipeline));
    cmsPipelineFree(pPipeline);
    cmsFreeToneCurve(pStraight);
    return bytesOf(pProfile);
}

} // namespace ORVO::Test
