/// ICC profiles as bytes, made with the colour library itself.
#pragma once

#include <lcms2.h>

#include <array>
#include <cmath>
#include <stdexcept>
#include <vector>

namespace ORVO::Test {

using Bytes = std::vector<unsigned char>;

/// What the colour library was asked to make must be there.
inline void demand(cmsBool made) {
    if (made == 0) {
        throw std::runtime_error("the colour library makes no such profile");
    }
}

/// The bytes of a profile, which is closed.
inline Bytes bytesOf(cmsHPROFILE pProfile) {
    cmsUInt32Number size = 0;
    demand(cmsSaveProfileToMem(pProfile, nullptr, &size));
    Bytes aBytes(size);
    demand(cmsSaveProfileToMem(pProfile, aBytes.data(), &size));
    cmsCloseProfile(pProfile);
    return aBytes;
}

/// RGB of curves and a matrix, D65, with the primaries of sRGB and a gamma.
inline cmsHPROFILE gammaProfile(double gamma) {
    cmsCIExyY const white = {0.3127, 0.3290, 1.0};
    cmsCIExyYTRIPLE const primaries = {{0.64, 0.33, 1.0}, {0.30, 0.60, 1.0}, {0.15, 0.06, 1.0}};
    cmsToneCurve* const pCurve = cmsBuildGamma(nullptr, gamma);
    cmsToneCurve* const aCurves[3] = {pCurve, pCurve, pCurve};
    auto* const pProfile = cmsCreateRGBProfile(&white, &primaries, aCurves);
    cmsFreeToneCurve(pCurve);
    return pProfile;
}

/// sRGB as most files have it: the curve as 1024 entries of 16 bits, version 2.
inline Bytes sampledProfile() {
    std::array<cmsUInt16Number, 1024> aEntries{};
    for (std::size_t i = 0; i < aEntries.size(); ++i) {
        double const x = static_cast<double>(i) / 1023.0;
        double const y = x <= 0.04045 ? x / 12.92 : std::pow((x + 0.055) / 1.055, 2.4);
        aEntries[i] = static_cast<cmsUInt16Number>(std::lround(65535.0 * y));
    }
    cmsToneCurve* const pCurve = cmsBuildTabulatedToneCurve16(nullptr, 1024, aEntries.data());
    auto* const pFile = gammaProfile(1.0);
    for (auto const eTag : {cmsSigRedTRCTag, cmsSigGreenTRCTag, cmsSigBlueTRCTag}) {
        cmsWriteTag(pFile, eTag, pCurve);
    }
    cmsFreeToneCurve(pCurve);
    cmsSetProfileVersion(pFile, 2.1);
    return bytesOf(pFile);
}

/// RGB with tables alone: what sRGB means, in Lab. It is a source and no destination.
inline Bytes tableSourceProfile() {
    auto* const pRGB = gammaProfile(2.0);
    auto* const pLab = cmsCreateLab4Profile(nullptr);
    auto* const pTransform =
        cmsCreateTransform(pRGB, TYPE_RGB_16, pLab, TYPE_Lab_16, INTENT_PERCEPTUAL, cmsFLAGS_NOOPTIMIZE);
    auto* const pLink = cmsTransform2DeviceLink(pTransform, 4.3, cmsFLAGS_GUESSDEVICECLASS);
    cmsDeleteTransform(pTransform);
    cmsCloseProfile(pLab);
    cmsCloseProfile(pRGB);
    return bytesOf(pLink);
}

} // namespace ORVO::Test
