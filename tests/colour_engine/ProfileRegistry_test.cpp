#include "orvo/colour_engine/ProfileRegistry.h"

#include "orvo/colour_engine/ProfileCodes.h"
#include "tests/colour_engine/support/Engine.h"
#include "tests/colour_engine/support/ICCProfiles.h"
#include "tests/colour_engine/support/TableProfiles.h"
#include "tests/support/Expect.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <vector>

namespace {

using namespace ORVO;
using namespace ORVO::ColourEngine;
using Test::Bytes;
using Test::bytesOf;
using Test::Engine;
using Test::NothingLeft;

constexpr std::uint32_t iCode = profileCode("Cam1");

struct ProfileRegistryTest : testing::Test {
    ~ProfileRegistryTest() override { unregisterProfile(iCode); }
};

/// One pixel of a grey through a transform.
std::uint8_t transformed(Engine const& engine, VantleTransform* pTransform, std::uint8_t grey) {
    std::array<std::uint8_t, 3> aPixel = {grey, grey, grey};
    auto const spec = ORVO::Test::packedRGB8(aPixel.data(), 1);
    EXPECT_EQ(0u, engine.ApplyGeneral(pTransform, &spec, &spec, 1, 1, nullptr));
    EXPECT_EQ(aPixel[0], aPixel[1]);
    EXPECT_EQ(aPixel[0], aPixel[2]);
    return aPixel[1];
}

TEST_F(ProfileRegistryTest, MakesAProfileKnownUnderItsCode) {
    NothingLeft const nothingLeft;
    Engine const engine;
    EXPECT_FALSE(isKnownProfile(iCode));
    EXPECT_FALSE(unregisterProfile(iCode));
    Bytes aBytes = bytesOf(ORVO::Test::gammaProfile(2.0));
    registerProfile(iCode, aBytes.data(), aBytes.size());
    aBytes.assign(aBytes.size(), 0); // copied
    EXPECT_TRUE(isKnownProfile(iCode));
    VantleTransform* const pTransform = engine.transform(iCode, PROFILE_LINEAR_SRGB);
    // (100/255)^2 * 255 = 39.2, (200/255)^2 * 255 = 156.9
    EXPECT_EQ(39, transformed(engine, pTransform, 100));
    EXPECT_EQ(157, transformed(engine, pTransform, 200));
    EXPECT_EQ(0u, engine.UnReferenceTransform(pTransform));
    EXPECT_TRUE(unregisterProfile(iCode));
    VantleProfile* pProfile = nullptr;
    EXPECT_EQ("Unknown profile code", engine.failureText(engine.ProfileFromCode(&pProfile, iCode)));
}

TEST_F(ProfileRegistryTest, AnotherProfileUnderTheSameCodeIsAnotherTransform) {
    NothingLeft const nothingLeft;
    Engine const engine;
    Bytes const aSquare = bytesOf(ORVO::Test::gammaProfile(2.0));
    Bytes const aLinear = bytesOf(ORVO::Test::gammaProfile(1.0));
    registerProfile(iCode, aSquare.data(), aSquare.size());
    VantleTransform* const pFirst = engine.transform(iCode, PROFILE_LINEAR_SRGB);
    registerProfile(iCode, aSquare.data(), aSquare.size());
    VantleTransform* const pSame = engine.transform(iCode, PROFILE_LINEAR_SRGB);
    EXPECT_EQ(pFirst, pSame) << "the same bytes change nothing";
    registerProfile(iCode, aLinear.data(), aLinear.size());
    VantleTransform* const pOther = engine.transform(iCode, PROFILE_LINEAR_SRGB);
    EXPECT_NE(pFirst, pOther);
    EXPECT_EQ(100, transformed(engine, pOther, 100));
    EXPECT_EQ(39, transformed(engine, pFirst, 100)) << "a transform keeps its profile";
    for (VantleTransform* const pTransform : {pFirst, pSame, pOther}) {
        EXPECT_EQ(0u, engine.UnReferenceTransform(pTransform));
    }
}

TEST_F(ProfileRegistryTest, ATableProfileWorksInTheDirectionThatItHas) {
    NothingLeft const nothingLeft;
    Engine const engine;
    Bytes const aBytes = ORVO::Test::tableSourceProfile();
    registerProfile(iCode, aBytes.data(), aBytes.size());
    VantleTransform* const pTransform = engine.transform(iCode, PROFILE_LINEAR_SRGB);
    EXPECT_NEAR(39, transformed(engine, pTransform, 100), 1);
    EXPECT_NEAR(157, transformed(engine, pTransform, 200), 1);
    EXPECT_EQ(0u, engine.UnReferenceTransform(pTransform));
    VantleProfile* const pProfile = engine.profile(iCode);
    VantleProfile* const pSRGB = engine.profile(PROFILE_SRGB);
    VantleTransform* pRaw = nullptr;
    EXPECT_EQ("No transform between the profiles",
              engine.failureText(engine.MakeColorTransform(&pRaw, pSRGB, pProfile, 0, 0)));
    EXPECT_EQ(nullptr, pRaw);
    EXPECT_EQ(0u, engine.UnReferenceProfile(pProfile));
    EXPECT_EQ(0u, engine.UnReferenceProfile(pSRGB));
}

TEST_F(ProfileRegistryTest, TakesGreyProfiles) {
    NothingLeft const nothingLeft;
    Engine const engine;
    cmsToneCurve* const pCurve = cmsBuildGamma(nullptr, 2.0);
    Bytes const aBytes = bytesOf(cmsCreateGrayProfile(cmsD50_xyY(), pCurve));
    cmsFreeToneCurve(pCurve);
    registerProfile(iCode, aBytes.data(), aBytes.size());
    VantleTransform* const pFrom = engine.transform(iCode, PROFILE_LINEAR_SRGB);
    VantleTransform* const pTo = engine.transform(PROFILE_LINEAR_SRGB, iCode);
    EXPECT_EQ(39, transformed(engine, pFrom, 100));
    // sqrt(39 / 255) * 255 = 99.7
    EXPECT_EQ(100, transformed(engine, pTo, 39));
    EXPECT_EQ(0u, engine.UnReferenceTransform(pFrom));
    EXPECT_EQ(0u, engine.UnReferenceTransform(pTo));
}

/// Pixels through a transform between the code and another one, in both sizes, and its shader: all of it
/// works, or what fails has its text. Whether it worked.
bool usesProfile(Engine const& engine, std::uint32_t source, std::uint32_t destination) {
    VantleProfile* const pSource = engine.profile(source);
    VantleProfile* const pDestination = engine.profile(destination);
    VantleTransform* pRaw = nullptr;
    VantleTransform* pTransform = nullptr;
    VantleResult result = engine.MakeColorTransform(&pRaw, pSource, pDestination, 0, 0);
    if (result == 0) {
        result = engine.OptimizeTransform(&pTransform, pRaw, 0);
        EXPECT_EQ(0u, engine.UnReferenceTransform(pRaw));
    }
    EXPECT_EQ(0u, engine.UnReferenceProfile(pSource));
    EXPECT_EQ(0u, engine.UnReferenceProfile(pDestination));
    if (result != 0) {
        EXPECT_EQ("No transform between the profiles", engine.failureText(result));
        EXPECT_EQ(nullptr, pTransform);
        return false;
    }
    // All greys and some colours, as bytes and as words up to the white of words.
    std::array<std::uint8_t, 3 * 256> aBytes{};
    std::array<std::uint16_t, 3 * 256> aWords{};
    for (std::size_t i = 0; i < aBytes.size(); ++i) {
        aBytes[i] = static_cast<std::uint8_t>(i < 384 ? i * 2 / 3 : i * 37);
        aWords[i] = static_cast<std::uint16_t>(aBytes[i] * 32768 / 255);
    }
    auto const bytes = ORVO::Test::packedRGB8(aBytes.data(), 256);
    auto words = bytes;
    words.bytesPerChannel = 2;
    for (int i = 0; i < 3; ++i) {
        words.planes[i] = {aWords.data() + i, 3 * 2 * 256, 3 * 2, 0, 0};
    }
    EXPECT_EQ(0u, engine.ApplyGeneral(pTransform, &bytes, &bytes, 1, 256, nullptr));
    EXPECT_EQ(0u, engine.ApplyGeneral(pTransform, &words, &words, 1, 256, nullptr));
    for (std::uint16_t const word : aWords) {
        EXPECT_LE(word, 32768);
    }
    EXPECT_EQ(0u, engine.UnReferenceTransform(pTransform));
    return true;
}

/// What the shader of a transform is made of is finite.
void expectFiniteShader(Engine const& engine, std::uint32_t source, std::uint32_t destination) {
    VantleTransform* const pTransform = engine.transform(source, destination);
    VantleShader* pShader = nullptr;
    ASSERT_EQ(0u, engine.NewShader(VANTLE_SHADER_FAMILY, pTransform, nullptr, &pShader));
    std::uint32_t nParameters = 0;
    EXPECT_EQ(0u, engine.NumParameters(pShader, &nParameters));
    for (std::uint32_t i = 0; i < nParameters; ++i) {
        std::uint32_t nBytes = 0;
        EXPECT_EQ(0u, engine.CopyData(pShader, i, nullptr, &nBytes));
        std::vector<float> aData(nBytes / sizeof(float));
        EXPECT_EQ(0u, engine.CopyData(pShader, i, aData.data(), &nBytes));
        EXPECT_TRUE(
            std::all_of(aData.begin(), aData.end(), [](float value) { return std::isfinite(value); }));
    }
    EXPECT_EQ(0u, engine.Release(reinterpret_cast<QuorContainer*>(pShader)));
    EXPECT_EQ(0u, engine.UnReferenceTransform(pTransform));
}

TEST_F(ProfileRegistryTest, SurvivesDamagedProfiles) {
    NothingLeft const nothingLeft;
    Engine const engine;
    std::uint32_t noise = 1;
    auto const next = [&noise] { return noise = noise * 1664525U + 1013904223U; };
    int nRefused = 0;
    int nUsed = 0;
    for (Bytes const& aGood : {bytesOf(ORVO::Test::gammaProfile(2.0)), ORVO::Test::tableSourceProfile(),
                               ORVO::Test::tableProfile({true, 5, ORVO::Test::labOfCamera, 2.1}),
                               ORVO::Test::tableProfile({false, 5, ORVO::Test::sRGBOfLab})}) {
        for (int i = 0; i < 16; ++i) {
            Bytes aBytes = aGood;
            for (int iByte = 0; iByte < 4; ++iByte) {
                // Most of what can go wrong stands in the header, the table of tags and the heads of the
                // first tags.
                aBytes[(next() >> 8U) % 400] = static_cast<unsigned char>(next() >> 16U);
            }
            try {
                registerProfile(iCode, aBytes.data(), aBytes.size());
            } catch (ParameterException const&) {
                ++nRefused;
                continue;
            }
            bool const bSource = usesProfile(engine, iCode, PROFILE_SRGB);
            bool const bDestination = usesProfile(engine, PROFILE_SRGB, iCode);
            EXPECT_TRUE(bSource || bDestination);
            ++nUsed;
            // Tables are fitted to a cube, which takes its time.
            if (bSource && i % 8 == 0) {
                expectFiniteShader(engine, iCode, PROFILE_SRGB);
            }
        }
    }
    EXPECT_GT(nRefused, 0);
    EXPECT_GT(nUsed, 0);
}

TEST_F(ProfileRegistryTest, RefusesWhatIsNoProfileOfColoursAndKeepsTheOldOne) {
    Bytes const aGood = bytesOf(ORVO::Test::gammaProfile(2.0));
    registerProfile(iCode, aGood.data(), aGood.size());
    auto const refuse = [](Bytes const& aBytes, char const* pText) {
        ORVO_EXPECT_PARAMETER(registerProfile(iCode, aBytes.data(), aBytes.size()), pText);
        EXPECT_TRUE(isKnownProfile(iCode));
    };
    refuse(Bytes(200, 'x'), "Not an ICC profile");
    refuse(Bytes(1, 0), "Not an ICC profile");
    refuse(Bytes(aGood.begin(), aGood.begin() + 100), "Not an ICC profile");
    refuse(bytesOf(cmsCreateLab4Profile(nullptr)), "Profile is neither RGB nor grey");
    refuse(bytesOf(cmsCreateInkLimitingDeviceLink(cmsSigCmykData, 200)), "Profile is neither RGB nor grey");
    cmsToneCurve* const pCurve = cmsBuildGamma(nullptr, 1.0);
    cmsToneCurve* const aCurves[3] = {pCurve, pCurve, pCurve};
    refuse(bytesOf(cmsCreateLinearizationDeviceLink(cmsSigRgbData, aCurves)), "Profile describes no colours");
    cmsFreeToneCurve(pCurve);
    cmsHPROFILE const pNoCurves = ORVO::Test::gammaProfile(1.0);
    cmsWriteTag(pNoCurves, cmsSigRedTRCTag, nullptr);
    refuse(bytesOf(pNoCurves), "Profile describes no colours");
    ORVO_EXPECT_PARAMETER(registerProfile(iCode, nullptr, 3), "Enforce pBytes != NULL");
    for (BuiltInProfile const& profile : BUILT_IN_PROFILES) {
        ORVO_EXPECT_PARAMETER(registerProfile(profile.code, aGood.data(), aGood.size()),
                              "Profile code is built in");
        EXPECT_TRUE(isKnownProfile(profile.code));
        EXPECT_FALSE(unregisterProfile(profile.code));
    }
}

} // namespace
