#include "orvo/colour_engine/EmbeddedEngine.h"

#include "orvo/colour_engine/ProfileCodes.h"
#include "orvo/colour_engine/ProfileRegistry.h"
#include "orvo/colour_engine/VantleShaderParameterData.h"
#include "tests/colour_engine/support/Engine.h"
#include "tests/colour_engine/support/ICCProfiles.h"

#include <array>
#include <atomic>
#include <cstring>
#include <thread>
#include <vector>

namespace {

using namespace ORVO;
using namespace ORVO::ColourEngine;
using Test::Engine;
using Test::engineProcedure;
using Test::NothingLeft;

constexpr std::array aCodes = {0x41533938u, 0x73524742u, 0x50332020u, 0x32303230u, 0x4c6e5247u, 0x47524159u};

TEST(EmbeddedEngine, FindsProceduresByAllThreeNamesAlone) {
    QuorGetAddressProc const pAddress = embeddedEngine();
    EXPECT_NE(nullptr, pAddress("VantleInterface2", "ProfileFromCode", "Vantle_ProfileFromCodeProc2"));
    EXPECT_EQ(nullptr, pAddress("VantleInterface", "ProfileFromCode", "Vantle_ProfileFromCodeProc2"));
    EXPECT_EQ(nullptr, pAddress("VantleInterface2", "ProfileFromCod", "Vantle_ProfileFromCodeProc2"));
    EXPECT_EQ(nullptr, pAddress("VantleInterface2", "ProfileFromCode", "Vantle_ProfileFromCodeProc3"));
    EXPECT_EQ(nullptr, pAddress(nullptr, "", ""));
    EXPECT_EQ(nullptr, pAddress("Quor", nullptr, ""));
    EXPECT_EQ(nullptr, pAddress("Quor", "", nullptr));
}

TEST(EmbeddedEngine, KnowsItsCodesByTheirCharacters) {
    EXPECT_EQ(0x41533938u, PROFILE_WIDE_GAMUT);
    EXPECT_EQ(0x73524742u, PROFILE_SRGB);
    EXPECT_EQ(0x50332020u, PROFILE_DISPLAY_P3);
    EXPECT_EQ(0x32303230u, PROFILE_BT_2020);
    EXPECT_EQ(0x4c6e5247u, PROFILE_LINEAR_SRGB);
    EXPECT_EQ(0x47524159u, PROFILE_GRAY);
}

TEST(EmbeddedEngine, MakesProfilesThatEndWithTheirLastReference) {
    NothingLeft const nothingLeft;
    Engine const engine;
    std::size_t const nBefore = engineStatistics().nProfiles;
    std::vector<VantleProfile*> aProfiles;
    for (std::uint32_t const code : aCodes) {
        aProfiles.push_back(engine.profile(code));
    }
    EXPECT_EQ(nBefore + aCodes.size(), engineStatistics().nProfiles);
    for (VantleProfile* const pProfile : aProfiles) {
        EXPECT_EQ(0u, engine.UnReferenceProfile(pProfile));
        EXPECT_EQ("Invalid handle", engine.failureText(engine.UnReferenceProfile(pProfile)));
    }
}

TEST(EmbeddedEngine, RefusesAnUnknownCode) {
    NothingLeft const nothingLeft;
    Engine const engine;
    VantleProfile* pProfile = nullptr;
    for (std::uint32_t const code : {0u, 0x58585858u, 0xffffffffu, 0x41533939u}) {
        VantleResult const result = engine.ProfileFromCode(&pProfile, code);
        EXPECT_NE(0u, result);
        EXPECT_EQ("Unknown profile code", engine.failureText(result));
        EXPECT_EQ(nullptr, pProfile);
    }
    EXPECT_EQ("Invalid argument", engine.failureText(engine.ProfileFromCode(nullptr, aCodes[0])));
}

TEST(EmbeddedEngine, ReferencesOfATransformEndAtZero) {
    NothingLeft const nothingLeft;
    Engine const engine;
    VantleProfile* const pProfile = engine.profile(PROFILE_SRGB);
    VantleTransform* pTransform = nullptr;
    ASSERT_EQ(0u, engine.MakeColorTransform(&pTransform, pProfile, pProfile, 3, 0));
    // A transform keeps what it was made from.
    EXPECT_EQ(0u, engine.UnReferenceProfile(pProfile));
    EXPECT_EQ(0u, engine.ReferenceTransform(pTransform));
    EXPECT_EQ(0u, engine.UnReferenceTransform(pTransform));
    EXPECT_EQ(0u, engine.UnReferenceTransform(pTransform));
    EXPECT_EQ("Invalid handle", engine.failureText(engine.UnReferenceTransform(pTransform)));
    EXPECT_EQ("Invalid handle", engine.failureText(engine.ReferenceTransform(pTransform)));
}

TEST(EmbeddedEngine, RefusesWhatIsNoTransform) {
    NothingLeft const nothingLeft;
    Engine const engine;
    VantleProfile* const pProfile = engine.profile(PROFILE_SRGB);
    VantleTransform* pTransform = nullptr;
    auto const make = [&](VantleTransform** pOut, VantleProfile* pSource, VantleProfile* pDestination,
                          std::uint32_t intent, std::uint32_t options) {
        return engine.failureText(engine.MakeColorTransform(pOut, pSource, pDestination, intent, options));
    };
    auto* const pWrongKind = reinterpret_cast<VantleTransform*>(pProfile);
    EXPECT_EQ("Invalid handle", make(&pTransform, nullptr, pProfile, 0, 0));
    EXPECT_EQ("Invalid handle", make(&pTransform, pProfile, nullptr, 0, 0));
    EXPECT_EQ("Invalid argument", make(nullptr, pProfile, pProfile, 0, 0));
    EXPECT_EQ("Invalid argument", make(&pTransform, pProfile, pProfile, 4, 0));
    EXPECT_EQ("Invalid argument", make(&pTransform, pProfile, pProfile, 0, 2));
    EXPECT_EQ("Invalid handle", engine.failureText(engine.OptimizeTransform(&pTransform, nullptr, 0)));
    EXPECT_EQ("Invalid handle", engine.failureText(engine.OptimizeTransform(&pTransform, pWrongKind, 0)));
    EXPECT_EQ(nullptr, pTransform);
    ASSERT_EQ(0u, engine.MakeColorTransform(&pTransform, pProfile, pProfile, 0, 1));
    EXPECT_EQ("Invalid argument", engine.failureText(engine.OptimizeTransform(nullptr, pTransform, 0)));
    VantleTransform* pOther = nullptr;
    EXPECT_EQ("Invalid argument", engine.failureText(engine.OptimizeTransform(&pOther, pTransform, 1)));
    auto spec = ORVO::Test::packedRGB8(nullptr, 0);
    EXPECT_EQ("Invalid handle",
              engine.failureText(engine.ApplyGeneral(nullptr, &spec, &spec, 0, 0, nullptr)));
    EXPECT_EQ("Invalid argument",
              engine.failureText(engine.ApplyGeneral(pTransform, nullptr, &spec, 0, 0, nullptr)));
    EXPECT_EQ("Invalid argument",
              engine.failureText(engine.ApplyGeneral(pTransform, &spec, nullptr, 0, 0, nullptr)));
    spec.bytesPerChannel = 3;
    EXPECT_EQ("Unsupported pixels",
              engine.failureText(engine.ApplyGeneral(pTransform, &spec, &spec, 0, 0, nullptr)));
    EXPECT_EQ(0u, engine.UnReferenceTransform(pTransform));
    EXPECT_EQ(0u, engine.UnReferenceProfile(pProfile));
}

TEST(EmbeddedEngine, OptimisedTransformsAreTheSameHandleForTheSameDemand) {
    NothingLeft const nothingLeft;
    Engine const engine;
    VantleTransform* const pFirst = engine.transform(PROFILE_SRGB, PROFILE_BT_2020);
    EngineStatistics const statistics = engineStatistics();
    for (int i = 0; i < 1000; ++i) {
        ASSERT_EQ(pFirst, engine.transform(PROFILE_SRGB, PROFILE_BT_2020));
    }
    EXPECT_EQ(statistics.nTransforms, engineStatistics().nTransforms);
    EXPECT_EQ(statistics.nReferences + 1000, engineStatistics().nReferences);
    EXPECT_EQ(statistics.nResolved, engineStatistics().nResolved) << "worked out once";

    VantleTransform* const pBack = engine.transform(PROFILE_BT_2020, PROFILE_SRGB);
    VantleTransform* const pIntent = engine.transform(PROFILE_SRGB, PROFILE_BT_2020, 1);
    EXPECT_NE(pFirst, pBack);
    EXPECT_NE(pFirst, pIntent);
    // What is optimised already stays the same.
    VantleTransform* pAgain = nullptr;
    EXPECT_EQ(0u, engine.OptimizeTransform(&pAgain, pFirst, 0));
    EXPECT_EQ(pFirst, pAgain);

    for (int i = 0; i < 1002; ++i) {
        EXPECT_EQ(0u, engine.UnReferenceTransform(pFirst));
    }
    EXPECT_EQ(0u, engine.UnReferenceTransform(pBack));
    EXPECT_EQ(0u, engine.UnReferenceTransform(pIntent));
    // A handle is never given to another transform, so that one kept too long is told from a new one.
    VantleTransform* const pNew = engine.transform(PROFILE_SRGB, PROFILE_BT_2020);
    EXPECT_NE(pFirst, pNew);
    EXPECT_EQ("Invalid handle", engine.failureText(engine.UnReferenceTransform(pFirst)));
    EXPECT_EQ(0u, engine.UnReferenceTransform(pNew));
}

TEST(EmbeddedEngine, ServesManyThreadsWithOneTransform) {
    NothingLeft const nothingLeft;
    Engine const engine;
    // Linear 0.5 and black and white; by hand: the sRGB code of linear 128/255 is 188.
    std::array<std::uint8_t, 9> const aSource = {0, 0, 0, 128, 128, 128, 255, 255, 255};
    std::array<std::uint8_t, 9> const aExpected = {0, 0, 0, 188, 188, 188, 255, 255, 255};
    VantleTransform* const pShared = engine.transform(PROFILE_LINEAR_SRGB, PROFILE_SRGB);
    std::atomic<int> nWrong{0};
    auto const work = [&] {
        for (int i = 0; i < 50; ++i) {
            VantleTransform* const pOwn = engine.transform(PROFILE_LINEAR_SRGB, PROFILE_SRGB);
            VantleTransform* const pOther =
                engine.transform(PROFILE_SRGB, aCodes[static_cast<std::size_t>(i) % 6]);
            std::array<std::uint8_t, 9> aPixels = aSource;
            auto const spec = ORVO::Test::packedRGB8(aPixels.data(), 3);
            nWrong +=
                engine.ApplyGeneral(i % 2 == 0 ? pOwn : pShared, &spec, &spec, 1, 3, nullptr) == 0 ? 0 : 1;
            nWrong += aPixels == aExpected && pOwn == pShared ? 0 : 1;
            nWrong +=
                engine.UnReferenceTransform(pOwn) == 0 && engine.UnReferenceTransform(pOther) == 0 ? 0 : 1;
        }
    };
    std::vector<std::thread> aThreads;
    for (int i = 0; i < 6; ++i) {
        aThreads.emplace_back(work);
    }
    for (std::thread& thread : aThreads) {
        thread.join();
    }
    EXPECT_EQ(0, nWrong);
    EXPECT_EQ(0u, engine.UnReferenceTransform(pShared));
}

std::string textOf(Engine const& engine, VantleString* pString) {
    std::uint32_t size = 0;
    EXPECT_EQ(0u, engine.StringASCII(pString, nullptr, &size, 0));
    std::string sText(size, '?');
    EXPECT_EQ(0u, engine.StringASCII(pString, sText.data(), &size, size));
    return sText;
}

TEST(EmbeddedEngine, DescribesATransformAsAShader) {
    NothingLeft const nothingLeft;
    Engine const engine;
    // Curves that are given as tables stay tables in the shader.
    constexpr std::uint32_t iCode = profileCode("File");
    auto const aBytes = ORVO::Test::sampledProfile();
    registerProfile(iCode, aBytes.data(), aBytes.size());
    VantleTransform* const pTransform = engine.transform(iCode, PROFILE_WIDE_GAMUT);
    EXPECT_TRUE(unregisterProfile(iCode));
    VantleShader* pShader = nullptr;
    ASSERT_EQ(0u, engine.NewShader(VANTLE_SHADER_FAMILY, pTransform, nullptr, &pShader));
    // The shader needs its transform no more.
    EXPECT_EQ(0u, engine.UnReferenceTransform(pTransform));
    std::uint32_t family = 0;
    EXPECT_EQ(0u, engine.Family(pShader, &family));
    EXPECT_EQ(0x73616673u, family);

    VantleString* pEntryPoint = nullptr;
    VantleString* pCode = nullptr;
    ASSERT_EQ(0u, engine.Strings(pShader, &pEntryPoint, &pCode));
    std::string const sEntryPoint = textOf(engine, pEntryPoint);
    std::string const sCode = textOf(engine, pCode);
    EXPECT_FALSE(sEntryPoint.empty());
    EXPECT_NE(std::string::npos, sCode.find("void " + sEntryPoint + "(inout vec4"));
    std::array<char, 3> aStart{'?', '?', '?'};
    std::uint32_t size = 0;
    EXPECT_EQ(0u, engine.StringASCII(pCode, aStart.data(), &size, 2));
    EXPECT_EQ(sCode.size(), size) << "the length of the text, also where less was copied";
    EXPECT_EQ(sCode.substr(0, 2) + "?", std::string(aStart.data(), 3));
    EXPECT_EQ(0u, engine.UnReferenceString(pEntryPoint));
    EXPECT_EQ(0u, engine.UnReferenceString(pCode));
    EXPECT_EQ("Invalid handle", engine.failureText(engine.StringASCII(pCode, nullptr, &size, 0)));

    std::uint32_t nParameters = 0;
    EXPECT_EQ(0u, engine.NumParameters(pShader, &nParameters));
    ASSERT_EQ(2u, nParameters) << "the table of the input curves, and the matrix";
    for (std::uint32_t i = 0; i < nParameters; ++i) {
        _t_Vantle_ShaderParameterData data{};
        ASSERT_EQ(0u, engine.Parameter(pShader, i, &data));
        EXPECT_NE(std::string::npos, sCode.find(textOf(engine, data.name)));
        EXPECT_EQ(0u, engine.UnReferenceString(data.name));
        ASSERT_EQ(0u, engine.CopyData(pShader, i, nullptr, &size));
        std::vector<float> aData(size / sizeof(float));
        ASSERT_EQ(0u, engine.CopyData(pShader, i, aData.data(), &size));
        if (data.kind == _t_Vantle_ShaderParameterData::KIND_MATRIX_3X3) {
            EXPECT_EQ(36u, size);
            EXPECT_EQ(nullptr, data.data);
            EXPECT_NEAR(1.0, aData[0] + aData[3] + aData[6], 1e-4) << "white stays white";
        } else {
            EXPECT_EQ(0, std::memcmp(data.data, aData.data(), size));
        }
    }
    EXPECT_EQ(0u, engine.AddRef(reinterpret_cast<QuorContainer*>(pShader)));
    EXPECT_EQ(0u, engine.Release(reinterpret_cast<QuorContainer*>(pShader)));
    EXPECT_EQ(0u, engine.Release(reinterpret_cast<QuorContainer*>(pShader)));
    EXPECT_EQ("Invalid handle",
              engine.failureText(engine.Release(reinterpret_cast<QuorContainer*>(pShader))));
}

TEST(EmbeddedEngine, RefusesWhatIsNoShader) {
    NothingLeft const nothingLeft;
    Engine const engine;
    VantleTransform* const pTransform = engine.transform(PROFILE_SRGB, PROFILE_SRGB);
    VantleShader* pShader = nullptr;
    EXPECT_EQ("Unknown shader family",
              engine.failureText(engine.NewShader(1, pTransform, nullptr, &pShader)));
    EXPECT_EQ("Invalid handle",
              engine.failureText(engine.NewShader(VANTLE_SHADER_FAMILY, nullptr, nullptr, &pShader)));
    EXPECT_EQ("Invalid argument",
              engine.failureText(engine.NewShader(VANTLE_SHADER_FAMILY, pTransform, nullptr, nullptr)));
    std::uint32_t number = 0;
    VantleString* pString = nullptr;
    _t_Vantle_ShaderParameterData data{};
    EXPECT_EQ("Invalid handle", engine.failureText(engine.Family(nullptr, &number)));
    EXPECT_EQ("Invalid handle", engine.failureText(engine.Strings(nullptr, &pString, &pString)));
    EXPECT_EQ("Invalid handle", engine.failureText(engine.NumParameters(nullptr, &number)));
    EXPECT_EQ("Invalid handle", engine.failureText(engine.Parameter(nullptr, 0, &data)));
    EXPECT_EQ("Invalid handle", engine.failureText(engine.CopyData(nullptr, 0, nullptr, &number)));
    ASSERT_EQ(0u, engine.NewShader(VANTLE_SHADER_FAMILY, pTransform, nullptr, &pShader));
    EXPECT_EQ("Invalid argument", engine.failureText(engine.Family(pShader, nullptr)));
    EXPECT_EQ("Invalid argument", engine.failureText(engine.Strings(pShader, nullptr, &pString)));
    EXPECT_EQ("Invalid argument", engine.failureText(engine.Strings(pShader, &pString, nullptr)));
    EXPECT_EQ("Invalid argument", engine.failureText(engine.NumParameters(pShader, nullptr)));
    EXPECT_EQ("Invalid argument", engine.failureText(engine.Parameter(pShader, 0, nullptr)));
    EXPECT_EQ("Invalid argument", engine.failureText(engine.CopyData(pShader, 0, nullptr, nullptr)));
    EXPECT_EQ("Invalid index", engine.failureText(engine.Parameter(pShader, 1000, &data)));
    EXPECT_EQ("Invalid index", engine.failureText(engine.CopyData(pShader, 1000, nullptr, &number)));
    EXPECT_EQ(0u, engine.Release(reinterpret_cast<QuorContainer*>(pShader)));
    EXPECT_EQ(0u, engine.UnReferenceTransform(pTransform));
}

TEST(EmbeddedEngine, ServesAtomsAndMethodsOfContainers) {
    NothingLeft const nothingLeft;
    Engine const engine;
    auto* const pNew = engineProcedure<QuorNewStringAtomProc>("QuorStringInterface", "NewStringAtom",
                                                              "QuorNewStringAtomProc");
    auto* const pDelete = engineProcedure<QuorDeleteStringAtomProc>("QuorStringInterface", "DeleteStringAtom",
                                                                    "QuorDeleteStringAtomProc");
    auto* const pGet =
        engineProcedure<QuorGetCStringProc>("QuorStringInterface", "GetCString", "QuorGetCStringProc");
    auto* const pAddRef = engineProcedure<QuorStringAtomAddRefProc>("QuorStringInterface", "AddRef",
                                                                    "QuorStringAtomAddRefProc");
    QuorStringAtom* pAtom = nullptr;
    ASSERT_EQ(0u, pNew(&pAtom, "Draw"));
    EXPECT_EQ("Invalid argument", engine.failureText(pNew(nullptr, "Draw")));
    EXPECT_EQ("Invalid argument", engine.failureText(pNew(&pAtom, nullptr)));
    char const* pText = nullptr;
    EXPECT_EQ(0u, pGet(pAtom, &pText));
    EXPECT_STREQ("Draw", pText);
    EXPECT_EQ("Invalid argument", engine.failureText(pGet(pAtom, nullptr)));

    VantleTransform* const pTransform = engine.transform(PROFILE_SRGB, PROFILE_SRGB);
    VantleShader* pShader = nullptr;
    ASSERT_EQ(0u, engine.NewShader(VANTLE_SHADER_FAMILY, pTransform, nullptr, &pShader));
    auto* const pObject = reinterpret_cast<QuorContainer*>(pShader);
    void* pMethod = &pText;
    EXPECT_EQ(0u, engine.GetMethod(&pMethod, pObject, pAtom, pAtom, 1));
    EXPECT_EQ(nullptr, pMethod);
    EXPECT_EQ("Missing method", engine.failureText(engine.GetMethod(&pMethod, pObject, pAtom, pAtom, 0)));
    EXPECT_EQ("Invalid handle", engine.failureText(engine.GetMethod(&pMethod, nullptr, pAtom, pAtom, 0)));
    EXPECT_EQ("Invalid argument", engine.failureText(engine.GetMethod(nullptr, pObject, pAtom, pAtom, 0)));
    EXPECT_EQ(0u, engine.Release(pObject));
    EXPECT_EQ(0u, engine.UnReferenceTransform(pTransform));

    EXPECT_EQ(0u, pAddRef(pAtom));
    EXPECT_EQ(0u, pDelete(pAtom));
    EXPECT_EQ(0u, pDelete(pAtom));
    EXPECT_EQ("Invalid handle", engine.failureText(pDelete(pAtom)));
    EXPECT_EQ("Invalid handle", engine.failureText(pGet(pAtom, &pText)));
}

TEST(EmbeddedEngine, ServesErrors) {
    NothingLeft const nothingLeft;
    Engine const engine;
    auto* const pNew =
        engineProcedure<QuorNewErrorProc>("QuorErrorInterface", "NewError", "QuorNewErrorProc");
    auto* const pAddRef =
        engineProcedure<QuorErrorAddRefProc>("QuorErrorInterface", "AddRef", "QuorErrorAddRefProc");
    auto* const pRelease =
        engineProcedure<QuorErrorReleaseProc>("QuorErrorInterface", "Release", "QuorErrorReleaseProc");
    auto* const pComponent =
        engineProcedure<QuorGetComponentProc>("QuorErrorInterface", "GetComponent", "QuorGetComponentProc");
    auto* const pReport = engineProcedure<QuorReportErrorProc>("Quor", "QuorReportError", "QuorReportError");
    QuorError* pError = nullptr;
    ASSERT_EQ(0u, pNew(&pError, "out of paint", "Brush"));
    char const* pText = nullptr;
    EXPECT_EQ(0u, engine.GetErrorMessage(pError, &pText));
    EXPECT_STREQ("out of paint", pText);
    EXPECT_EQ(0u, pComponent(pError, &pText));
    EXPECT_STREQ("Brush", pText);
    std::uint64_t const nReported = engineStatistics().nErrorsReported;
    EXPECT_EQ(0u, pReport(pError));
    EXPECT_EQ(nReported + 1, engineStatistics().nErrorsReported);
    EXPECT_EQ(0u, pAddRef(pError));
    EXPECT_EQ(0u, pRelease(pError));
    EXPECT_EQ(0u, pRelease(pError));
    EXPECT_EQ("Invalid handle", engine.failureText(pRelease(pError)));
    EXPECT_EQ("Invalid handle", engine.failureText(pReport(pError)));
    EXPECT_EQ("Invalid handle", engine.failureText(engine.GetErrorMessage(pError, &pText)));
    EXPECT_EQ("Invalid argument", engine.failureText(pNew(nullptr, "", "")));

    // The engine's own errors stay, whatever their receivers do.
    auto* const pOwn = reinterpret_cast<QuorError*>(engine.UnReferenceProfile(nullptr));
    EXPECT_EQ(0u, pRelease(pOwn));
    EXPECT_EQ(0u, pRelease(pOwn));
    EXPECT_EQ(0u, engine.GetErrorMessage(pOwn, &pText));
    EXPECT_STREQ("Invalid handle", pText);
    EXPECT_EQ(0u, pComponent(pOwn, &pText));
    EXPECT_STREQ("Vantle", pText);
}

TEST(EmbeddedEngine, ServesMemory) {
    NothingLeft const nothingLeft;
    Engine const engine;
    auto* const pAlloc = engineProcedure<QuorAllocProc>("QuorMemoryInterface", "Alloc", "QuorAllocProc");
    auto* const pRealloc =
        engineProcedure<QuorReallocProc>("QuorMemoryInterface", "Realloc", "QuorReallocProc");
    auto* const pFree = engineProcedure<QuorFreeProc>("QuorMemoryInterface", "Free", "QuorFreeProc");
    auto* const pSizeOf =
        engineProcedure<QuorGetBlockSizeProc>("QuorMemoryInterface", "GetBlockSize", "QuorGetBlockSizeProc");
    void* pBlock = nullptr;
    std::size_t size = 0;
    ASSERT_EQ(0u, pAlloc(&pBlock, 5));
    EXPECT_EQ(0u, reinterpret_cast<std::uintptr_t>(pBlock) % alignof(std::max_align_t));
    std::memcpy(pBlock, "abcd", 5);
    EXPECT_EQ(0u, pSizeOf(pBlock, &size));
    EXPECT_EQ(5u, size);
    EXPECT_EQ(0u, pRealloc(&pBlock, 5000));
    EXPECT_STREQ("abcd", static_cast<char const*>(pBlock));
    EXPECT_EQ(0u, pSizeOf(pBlock, &size));
    EXPECT_EQ(5000u, size);
    EXPECT_EQ("Out of memory", engine.failureText(pRealloc(&pBlock, ~std::size_t{0})));
    EXPECT_STREQ("abcd", static_cast<char const*>(pBlock));
    EXPECT_EQ(0u, pFree(pBlock));
    EXPECT_EQ(0u, pFree(nullptr));
    EXPECT_EQ("Invalid argument", engine.failureText(pAlloc(nullptr, 1)));
    EXPECT_EQ("Invalid argument", engine.failureText(pSizeOf(nullptr, &size)));
}

TEST(EmbeddedEngine, TakesInterfacesOfOthersAndCountsThoseThatGo) {
    Engine const engine;
    auto* const pRegister = engineProcedure<QuorRegisterProcAddressProc>("Quor", "QuorRegisterProcAddress",
                                                                         "QuorRegisterProcAddress");
    auto* const pUnregister = engineProcedure<QuorUnregisterInterfaceProc>("Quor", "QuorUnregisterInterface",
                                                                           "QuorUnregisterInterface");
    auto* const pGetCount = engineProcedure<QuorGetUnregisterCountAddrProc>(
        "Quor", "QuorGetUnregisterCountAddr", "QuorGetUnregisterCountAddr");
    auto* const pIsMultiThreaded =
        engineProcedure<QuorIsMultiThreadedProc>("Quor", "QuorIsMultiThreaded", "QuorIsMultiThreaded");
    EXPECT_EQ(1u, pIsMultiThreaded());
    std::uint32_t* pCount = nullptr;
    ASSERT_EQ(0u, pGetCount(&pCount));
    EXPECT_EQ("Invalid argument", engine.failureText(pGetCount(nullptr)));
    std::uint32_t const nBefore = *pCount;
    int procedure = 0;
    EXPECT_EQ(0u, pRegister("PaintInterface", "Draw", "DrawProc", &procedure));
    EXPECT_EQ(&procedure, embeddedEngine()("PaintInterface", "Draw", "DrawProc"));
    EXPECT_EQ("Invalid argument",
              engine.failureText(pRegister("PaintInterface", "Draw", "DrawProc", nullptr)));
    EXPECT_EQ("Missing Interface", engine.failureText(pUnregister("EraseInterface")));
    EXPECT_EQ("Invalid argument", engine.failureText(pUnregister(nullptr)));
    EXPECT_EQ(nBefore, *pCount);
    EXPECT_EQ(0u, pUnregister("PaintInterface"));
    EXPECT_EQ(nBefore + 1, *pCount);
    EXPECT_EQ(nullptr, embeddedEngine()("PaintInterface", "Draw", "DrawProc"));
}

} // namespace
