#include "orvo/image_flow/ImageFlowLibrary.h"

#include "orvo/colour_engine/EmbeddedEngine.h"
#include "orvo/colour_engine/EngineStatistics.h"
#include "orvo/colour_engine/ProfileCodes.h"
#include "orvo/data_flow/librarian/NodeLibrarian.h"
#include "orvo/image_flow/colour/CQuorError.h"
#include "orvo/image_flow/colour/CVantle.h"
#include "orvo/image_flow/colour/CVantleShader.h"
#include "orvo/image_flow/colour/QuorClient.h"
#include "orvo/image_flow/colour/QuorTable.h"
#include "orvo/image_flow/colour/TrelException.h"
#include "tests/image_flow/colour/FakeEngine.h"
#include "tests/support/Expect.h"
#include "tests/support/ImageFlowLayers.h"

#include <array>
#include <atomic>
#include <iterator>
#include <string>
#include <thread>
#include <vector>

namespace {

using namespace ORVO;
using ImageFlow::QuorClient;
using Test::FakeEngine;

/// The layers below image flow, up for a scope.
struct LayersBelow : ORVO::Test::ImageRuntimeLayers {
    DataFlow::AutoInitializer oDataFlow_;
};

TEST(ColourStart, BindsTheEmbeddedEngineAndLetsItGoAgain) {
    for (int iRound = 0; iRound < 2; ++iRound) {
        {
            ORVO::Test::ImageFlowLayers const layers;
            EXPECT_TRUE(QuorClient::isLive());
            EXPECT_TRUE(CVantle::isAvailable());
        }
        EXPECT_FALSE(QuorClient::isLive());
        EXPECT_FALSE(CVantle::isAvailable());
    }
}

TEST(ColourStart, MakesTransformsWithTheEmbeddedEngine) {
    ORVO::Test::ImageFlowLayers const layers;
    auto const before = ColourEngine::engineStatistics();
    VantleTransform* pFirst = nullptr;
    VantleTransform* pSecond = nullptr;
    EXPECT_EQ(0u,
              CVantle::makeTransform(&pFirst, ColourEngine::PROFILE_SRGB, ColourEngine::PROFILE_WIDE_GAMUT));
    EXPECT_EQ(0u,
              CVantle::makeTransform(&pSecond, ColourEngine::PROFILE_SRGB, ColourEngine::PROFILE_WIDE_GAMUT));
    EXPECT_EQ(pFirst, pSecond);
    VantleShader* pShader = nullptr;
    EXPECT_EQ(0u, CVantleShader::NewShader(VANTLE_SHADER_FAMILY, pFirst, nullptr, &pShader));
    CVantleShader::release(pShader);
    CVantle::UnReferenceTransform(pFirst);
    CVantle::UnReferenceTransform(pSecond);
    VantleResult const result = CVantle::makeTransform(&pFirst, ColourEngine::PROFILE_SRGB, 1);
    EXPECT_NE(0u, result);
    try {
        Quor_T_MT::checkQuorResult(result);
        ADD_FAILURE() << "nothing thrown";
    } catch (Quor_T_MT::CQuorError const& error) {
        EXPECT_STREQ("Unknown profile code", error.what());
    }
    auto const after = ColourEngine::engineStatistics();
    EXPECT_EQ(before.nProfiles, after.nProfiles);
    EXPECT_EQ(before.nTransforms, after.nTransforms);
    EXPECT_EQ(before.nShaders, after.nShaders);
    EXPECT_EQ(before.nReferences, after.nReferences);
}

TEST(ColourStart, AStrictLoadFailsWithAnErrorOfTheEngines) {
    ORVO::Test::ImageFlowLayers const layers;
    static constexpr ImageFlow::QuorRow aRows[] = {{0, "Repaint", "VantleRepaintProc"}};
    std::array<std::atomic<void*>, 1> aSlots{};
    ImageFlow::QuorTable table("VantleShaderInterface", aRows, std::size(aRows), aSlots.data());
    std::size_t const nErrors = ColourEngine::engineStatistics().nErrors;
    EXPECT_THROW(table.load(), Quor_T_MT::CQuorError);
    EXPECT_EQ(nErrors, ColourEngine::engineStatistics().nErrors);
}

template <typename Procedure>
Procedure layerProcedure(char const* pName) {
    return reinterpret_cast<Procedure>(ColourEngine::embeddedEngine()("Quor", pName, pName));
}

TEST(ColourStart, TheEmbeddedEngineMayGoAndComeBackToo) {
    struct Row {
        char const* pSelector;
        char const* pProcName;
    };
    constexpr std::array<Row, 6> aRows = {{{"NewShader", "VantleNewShaderProc"},
                                           {"Family", "VantleFamilyProc"},
                                           {"Strings", "VantleStringsProc"},
                                           {"NumParameters", "VantleNumParametersProc"},
                                           {"Parameter", "VantleParameterProc"},
                                           {"CopyData", "VantleCopyDataProc"}}};
    ORVO::Test::ImageFlowLayers const layers;
    std::uint32_t count = 0;
    EXPECT_NE(0u, CVantleShader::NumParameters(nullptr, &count));
    std::array<void*, aRows.size()> aProcedures{};
    for (std::size_t i = 0; i < aRows.size(); ++i) {
        aProcedures[i] =
            ColourEngine::embeddedEngine()("VantleShaderInterface", aRows[i].pSelector, aRows[i].pProcName);
    }
    EXPECT_EQ(
        0u, layerProcedure<QuorUnregisterInterfaceProc>("QuorUnregisterInterface")("VantleShaderInterface"));
    EXPECT_THROW(CVantleShader::NumParameters(nullptr, &count), TrelException);
    EXPECT_TRUE(CVantle::isAvailable()) << "the other interface stays";
    for (std::size_t i = 0; i < aRows.size(); ++i) {
        EXPECT_EQ(0u, layerProcedure<QuorRegisterProcAddressProc>("QuorRegisterProcAddress")(
                          "VantleShaderInterface", aRows[i].pSelector, aRows[i].pProcName, aProcedures[i]));
    }
    EXPECT_NE(0u, CVantleShader::NumParameters(nullptr, &count));
}

TEST(ColourStart, TablesAreLoadedAgainUnderManyThreads) {
    ORVO::Test::ImageFlowLayers const layers;
    auto* const pRegister = layerProcedure<QuorRegisterProcAddressProc>("QuorRegisterProcAddress");
    auto* const pUnregister = layerProcedure<QuorUnregisterInterfaceProc>("QuorUnregisterInterface");
    VantleTransform* pKept = nullptr; // worked out once
    ASSERT_EQ(0u, CVantle::makeTransform(&pKept, ColourEngine::PROFILE_SRGB, ColourEngine::PROFILE_BT_2020));
    std::atomic<int> nFailed{0};
    auto const work = [&nFailed] {
        for (int i = 0; i < 200; ++i) {
            VantleTransform* pTransform = nullptr;
            nFailed += CVantle::makeTransform(&pTransform, ColourEngine::PROFILE_SRGB,
                                              ColourEngine::PROFILE_BT_2020) == 0
                           ? 0
                           : 1;
            nFailed += CVantle::UnReferenceTransform(pTransform) == 0 ? 0 : 1;
        }
    };
    std::vector<std::thread> aThreads;
    for (int i = 0; i < 4; ++i) {
        aThreads.emplace_back(work);
    }
    int procedure = 0;
    for (int i = 0; i < 100; ++i) {
        EXPECT_EQ(0u, pRegister("PaintInterface", "Draw", "DrawProc", &procedure));
        EXPECT_EQ(0u, pUnregister("PaintInterface"));
    }
    for (std::thread& thread : aThreads) {
        thread.join();
    }
    EXPECT_EQ(0, nFailed);
    EXPECT_EQ(0u, CVantle::UnReferenceTransform(pKept));
}

TEST(ColourStart, WithoutAnEngineAllElseStarts) {
    LayersBelow const below;
    Core::Library::setQuorGetAddressProc(nullptr);
    ImageFlow::AutoInitializer const imageFlow(false);
    EXPECT_TRUE(ImageFlow::Library::isInitialized());
    EXPECT_FALSE(QuorClient::isLive());
    EXPECT_FALSE(CVantle::isAvailable());
    EXPECT_TRUE(DataFlow::NodeLibrarian::Instance()->begin() != DataFlow::NodeLibrarian::Instance()->end());
    VantleProfile* pProfile = nullptr;
    try {
        CVantle::ProfileFromCode(&pProfile, ColourEngine::PROFILE_SRGB);
        ADD_FAILURE() << "nothing thrown";
    } catch (TrelException const& exception) {
        EXPECT_STREQ("couldn't init CVantle", exception.what());
    }
}

TEST(ColourStart, BindsTheHostsEngine) {
    FakeEngine::reset();
    LayersBelow const below;
    Core::Library::setQuorGetAddressProc(&FakeEngine::address);
    {
        ImageFlow::AutoInitializer const imageFlow(false);
        EXPECT_EQ(0u, CVantle::ReferenceTransform(FakeEngine::handle<VantleTransform>(3)));
        EXPECT_EQ((std::vector<std::string>{"ReferenceTransform 3"}), FakeEngine::calls());
    }
    Core::Library::setQuorGetAddressProc(ColourEngine::embeddedEngine());
    ImageFlow::AutoInitializer const imageFlow(false);
    EXPECT_TRUE(CVantle::isAvailable());
    EXPECT_NE(0u, CVantle::ReferenceTransform(FakeEngine::handle<VantleTransform>(3)));
}

TEST(ColourStart, AFailureAfterTheBindingLeavesItOpenForTheNextStart) {
    Core::AutoInitializer const core;
    OGL::AutoInitializer const ogl;
    DataFlow::AutoInitializer const dataFlow;
    ORVO_EXPECT_INTERNAL(ImageFlow::Library::initialize(false), "ImageRuntime::Library::isInitialized()");
    EXPECT_FALSE(ImageFlow::Library::isInitialized());
    EXPECT_TRUE(QuorClient::isLive());
    ImageRuntime::AutoInitializer const imageRuntime(static_cast<OGL::Context const*>(nullptr),
                                                     VideoMemory::Configuration());
    std::uint32_t const iGeneration = QuorClient::generation();
    {
        ImageFlow::AutoInitializer const imageFlow(false);
        EXPECT_EQ(iGeneration, QuorClient::generation());
        EXPECT_TRUE(CVantle::isAvailable());
    }
    EXPECT_FALSE(QuorClient::isLive());
}

TEST(ColourStart, ABindingLeftOpenYieldsToTheHostsChoice) {
    LayersBelow const below;
    {
        ImageRuntime::Library::terminate();
        ORVO_EXPECT_INTERNAL(ImageFlow::Library::initialize(false), "ImageRuntime::Library::isInitialized()");
        ImageRuntime::Library::initialize(static_cast<OGL::Context const*>(nullptr),
                                          VideoMemory::Configuration());
    }
    EXPECT_TRUE(QuorClient::isLive());
    Core::Library::setQuorGetAddressProc(nullptr);
    ImageFlow::AutoInitializer const imageFlow(false);
    EXPECT_FALSE(QuorClient::isLive());
}

TEST(ColourStart, AnEngineThatLacksABaseInterfaceFailsTheStart) {
    FakeEngine::reset();
    FakeEngine::missing() = {"QuorStringInterface/NewStringAtom"};
    LayersBelow const below;
    Core::Library::setQuorGetAddressProc(&FakeEngine::address);
    ORVO_EXPECT_INTERNAL(ImageFlow::Library::initialize(false), "nResult != 0");
    EXPECT_FALSE(ImageFlow::Library::isInitialized());
    FakeEngine::missing().clear();
    ImageFlow::AutoInitializer const imageFlow(false);
    EXPECT_TRUE(CVantle::isAvailable());
}

} // namespace
