/// The embedded engine's procedures as a foreign client sees them: by name.
#pragma once

#include "orvo/colour_engine/EmbeddedEngine.h"
#include "orvo/colour_engine/EngineStatistics.h"
#include "orvo/colour_engine/QuorProcedures.h"
#include "orvo/colour_engine/VantlePackingSpec.h"
#include "orvo/colour_engine/VantleProcedures.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <string>

namespace ORVO::Test {

template <typename Procedure>
Procedure engineProcedure(char const* pInterface, char const* pSelector, char const* pProcName) {
    void* const pProcedure = ColourEngine::embeddedEngine()(pInterface, pSelector, pProcName);
    EXPECT_NE(nullptr, pProcedure) << pInterface << ' ' << pSelector;
    return reinterpret_cast<Procedure>(pProcedure);
}

#define ORVO_TEST_ENGINE(selector, pInterface, pProcName, Procedure)                                         \
    Procedure const selector = engineProcedure<Procedure>(pInterface, #selector, pProcName)

/// The procedures, each under its selector.
struct Engine {
    ORVO_TEST_ENGINE(ProfileFromCode, "VantleInterface2", "Vantle_ProfileFromCodeProc2",
                     VantleProfileFromCodeProc);
    ORVO_TEST_ENGINE(UnReferenceProfile, "VantleInterface2", "Vantle_UnReferenceProfileProc2",
                     VantleUnReferenceProfileProc);
    ORVO_TEST_ENGINE(UnReferenceString, "VantleInterface2", "Vantle_UnReferenceStringProc2",
                     VantleUnReferenceStringProc);
    ORVO_TEST_ENGINE(StringASCII, "VantleInterface2", "Vantle_StringASCIIProc2", VantleStringASCIIProc);
    ORVO_TEST_ENGINE(MakeColorTransform, "VantleInterface2", "Vantle_MakeColorTransformProc2",
                     VantleMakeColorTransformProc);
    ORVO_TEST_ENGINE(ReferenceTransform, "VantleInterface2", "Vantle_ReferenceTransformProc2",
                     VantleReferenceTransformProc);
    ORVO_TEST_ENGINE(UnReferenceTransform, "VantleInterface2", "Vantle_UnReferenceTransformProc2",
                     VantleUnReferenceTransformProc);
    ORVO_TEST_ENGINE(ApplyGeneral, "VantleInterface2", "Vantle_ApplyGeneralProc2", VantleApplyGeneralProc);
    ORVO_TEST_ENGINE(OptimizeTransform, "VantleInterface2", "Vantle_OptimizeTransformProc2",
                     VantleOptimizeTransformProc);
    ORVO_TEST_ENGINE(NewShader, "VantleShaderInterface", "VantleNewShaderProc", VantleNewShaderProc);
    ORVO_TEST_ENGINE(Family, "VantleShaderInterface", "VantleFamilyProc", VantleFamilyProc);
    ORVO_TEST_ENGINE(Strings, "VantleShaderInterface", "VantleStringsProc", VantleStringsProc);
    ORVO_TEST_ENGINE(NumParameters, "VantleShaderInterface", "VantleNumParametersProc",
                     VantleNumParametersProc);
    ORVO_TEST_ENGINE(Parameter, "VantleShaderInterface", "VantleParameterProc", VantleParameterProc);
    ORVO_TEST_ENGINE(CopyData, "VantleShaderInterface", "VantleCopyDataProc", VantleCopyDataProc);
    ORVO_TEST_ENGINE(AddRef, "QuorContainerInterface", "QuorAddRefProc", QuorContainerAddRefProc);
    ORVO_TEST_ENGINE(Release, "QuorContainerInterface", "QuorReleaseProc", QuorContainerReleaseProc);
    ORVO_TEST_ENGINE(GetMethod, "QuorContainerInterface", "QuorGetMethodV3Proc", QuorContainerGetMethodProc);
    ORVO_TEST_ENGINE(GetErrorMessage, "QuorErrorInterface", "QuorGetErrorMessageProc",
                     QuorGetErrorMessageProc);

    VantleProfile* profile(std::uint32_t code) const {
        VantleProfile* pProfile = nullptr;
        EXPECT_EQ(0u, ProfileFromCode(&pProfile, code));
        return pProfile;
    }

    /// An optimised transform; everything else is dropped.
    VantleTransform* transform(std::uint32_t source, std::uint32_t destination,
                               std::uint32_t intent = 0) const {
        VantleProfile* const pSource = profile(source);
        VantleProfile* const pDestination = profile(destination);
        VantleTransform* pRaw = nullptr;
        VantleTransform* pOptimised = nullptr;
        EXPECT_EQ(0u, MakeColorTransform(&pRaw, pSource, pDestination, intent, 0));
        EXPECT_EQ(0u, OptimizeTransform(&pOptimised, pRaw, 0));
        EXPECT_EQ(0u, UnReferenceTransform(pRaw));
        EXPECT_EQ(0u, UnReferenceProfile(pSource));
        EXPECT_EQ(0u, UnReferenceProfile(pDestination));
        return pOptimised;
    }

    /// The text of a failure; "" for success.
    std::string failureText(VantleResult result) const {
        char const* pText = "";
        if (result != 0) {
            EXPECT_EQ(0u, GetErrorMessage(reinterpret_cast<QuorError*>(result), &pText));
        }
        return pText;
    }
};

#undef ORVO_TEST_ENGINE

/// Interleaved 8-bit RGB pixels.
inline _t_Vantle_PackingSpec packedRGB8(std::uint8_t* pPixels, std::uint32_t columns) {
    _t_Vantle_PackingSpec spec{};
    spec.space = _t_Vantle_PackingSpec::SPACE_RGB;
    spec.channels = 3;
    spec.bytesPerChannel = 1;
    for (int i = 0; i < 3; ++i) {
        spec.planes[i] = {pPixels + i, static_cast<std::int32_t>(3 * columns), 3, 0, 0};
    }
    return spec;
}

/// The engine holds at the end what it held at the start.
class NothingLeft {
public:
    NothingLeft() : before_(ColourEngine::engineStatistics()) {}
    ~NothingLeft() {
        ColourEngine::EngineStatistics const after = ColourEngine::engineStatistics();
        EXPECT_EQ(before_.nProfiles, after.nProfiles);
        EXPECT_EQ(before_.nTransforms, after.nTransforms);
        EXPECT_EQ(before_.nShaders, after.nShaders);
        EXPECT_EQ(before_.nStrings, after.nStrings);
        EXPECT_EQ(before_.nStringAtoms, after.nStringAtoms);
        EXPECT_EQ(before_.nErrors, after.nErrors);
        EXPECT_EQ(before_.nBlocks, after.nBlocks);
        EXPECT_EQ(before_.nReferences, after.nReferences);
    }
    NothingLeft(NothingLeft const&) = delete;
    NothingLeft& operator=(NothingLeft const&) = delete;

private:
    ColourEngine::EngineStatistics before_;
};

} // namespace ORVO::Test
