#include "orvo/image_flow/colour/CVantle.h"

#include "orvo/colour_engine/VantlePackingSpec.h"
#include "orvo/colour_engine/VantleShaderParameterData.h"
#include "orvo/image_flow/colour/CVantleShader.h"
#include "orvo/image_flow/colour/QuorClient.h"
#include "orvo/image_flow/colour/TrelException.h"
#include "tests/image_flow/colour/FakeEngine.h"

#include <gtest/gtest.h>

namespace {

using namespace ORVO;
using Test::FakeBinding;
using Test::FakeEngine;
using Names = std::vector<std::string>;

template <typename Handle>
Handle* handle(std::uintptr_t number) {
    return FakeEngine::handle<Handle>(number);
}

std::string number(void const* pPointer) {
    return std::to_string(reinterpret_cast<std::uintptr_t>(pPointer));
}

/// The statement throws what an absent engine throws.
template <typename Statement>
void expectAbsent(Statement const& statement) {
    try {
        statement();
        ADD_FAILURE() << "nothing thrown";
    } catch (TrelException const& exception) {
        EXPECT_STREQ("couldn't init CVantle", exception.what());
    }
}

TEST(CVantle, WithoutABindingEveryOperationSaysSo) {
    FakeEngine::reset();
    EXPECT_FALSE(CVantle::isAvailable());
    VantleProfile* pProfile = nullptr;
    VantleTransform* pTransform = nullptr;
    VantleShader* pShader = nullptr;
    std::uint32_t size = 0;
    expectAbsent([&] { CVantle::ProfileFromCode(&pProfile, 1); });
    expectAbsent([&] { CVantle::UnReferenceProfile(pProfile); });
    expectAbsent([&] { CVantle::UnReferenceString(nullptr); });
    expectAbsent([&] { CVantle::StringASCII(nullptr, nullptr, &size, 0); });
    expectAbsent([&] { CVantle::MakeColorTransform(&pTransform, pProfile, pProfile, 0, 0); });
    expectAbsent([&] { CVantle::ReferenceTransform(pTransform); });
    expectAbsent([&] { CVantle::UnReferenceTransform(pTransform); });
    expectAbsent([&] { CVantle::ApplyGeneral(pTransform, nullptr, nullptr, 0, 0, nullptr); });
    expectAbsent([&] { CVantle::OptimizeTransform(&pTransform, pTransform, 0); });
    expectAbsent([&] { CVantle::makeTransform(&pTransform, 1, 2); });
    expectAbsent([&] { CVantleShader::NewShader(VANTLE_SHADER_FAMILY, pTransform, nullptr, &pShader); });
    expectAbsent([&] { CVantleShader::Family(pShader, &size); });
    expectAbsent([&] { CVantleShader::Strings(pShader, nullptr, nullptr); });
    expectAbsent([&] { CVantleShader::NumParameters(pShader, &size); });
    expectAbsent([&] { CVantleShader::Parameter(pShader, 0, nullptr); });
    expectAbsent([&] { CVantleShader::CopyData(pShader, 0, nullptr, &size); });
    EXPECT_NO_THROW(CVantleShader::release(handle<VantleShader>(5)));
}

TEST(CVantle, BindsItsNineRowsOnFirstUseFromTheLast) {
    FakeBinding const binding;
    EXPECT_TRUE(CVantle::isAvailable());
    EXPECT_EQ((Names{"VantleInterface2/OptimizeTransform/Vantle_OptimizeTransformProc2",
                     "VantleInterface2/ApplyGeneral/Vantle_ApplyGeneralProc2",
                     "VantleInterface2/UnReferenceTransform/Vantle_UnReferenceTransformProc2",
                     "VantleInterface2/ReferenceTransform/Vantle_ReferenceTransformProc2",
                     "VantleInterface2/MakeColorTransform/Vantle_MakeColorTransformProc2",
                     "VantleInterface2/StringASCII/Vantle_StringASCIIProc2",
                     "VantleInterface2/UnReferenceString/Vantle_UnReferenceStringProc2",
                     "VantleInterface2/UnReferenceProfile/Vantle_UnReferenceProfileProc2",
                     "VantleInterface2/ProfileFromCode/Vantle_ProfileFromCodeProc2"}),
              FakeEngine::asked());
    FakeEngine::asked().clear();
    EXPECT_EQ(0u, CVantle::ReferenceTransform(handle<VantleTransform>(1)));
    EXPECT_EQ(Names(), FakeEngine::asked());
}

TEST(CVantle, HandsArgumentsAndResultsThrough) {
    FakeBinding const binding;
    VantleProfile* pProfile = nullptr;
    VantleTransform* pTransform = nullptr;
    std::uint32_t size = 0;
    char text[4] = {};
    _t_Vantle_PackingSpec const source{};
    _t_Vantle_PackingSpec const destination{};
    EXPECT_EQ(0u, CVantle::ProfileFromCode(&pProfile, 0x41533938));
    EXPECT_EQ(handle<VantleProfile>(1000 + 0x41533938), pProfile);
    CVantle::UnReferenceProfile(handle<VantleProfile>(11));
    CVantle::UnReferenceString(handle<VantleString>(12));
    CVantle::StringASCII(handle<VantleString>(13), text, &size, 4);
    CVantle::MakeColorTransform(&pTransform, handle<VantleProfile>(14), handle<VantleProfile>(15), 2, 9);
    EXPECT_EQ(handle<VantleTransform>(2000), pTransform);
    CVantle::ReferenceTransform(handle<VantleTransform>(16));
    CVantle::UnReferenceTransform(handle<VantleTransform>(17));
    CVantle::ApplyGeneral(handle<VantleTransform>(18), &source, &destination, 19, 20,
                          handle<_t_Vantle_Options>(21));
    CVantle::OptimizeTransform(&pTransform, handle<VantleTransform>(22), 0);
    EXPECT_EQ(handle<VantleTransform>(3000), pTransform);
    EXPECT_EQ((Names{"ProfileFromCode 1095973176", "UnReferenceProfile 11", "UnReferenceString 12",
                     "StringASCII 13 " + number(text) + " " + number(&size) + " 4",
                     "MakeColorTransform 14 15 2 9", "ReferenceTransform 16", "UnReferenceTransform 17",
                     "ApplyGeneral 18 " + number(&source) + " " + number(&destination) + " 19 20 21",
                     "OptimizeTransform 22 0"}),
              FakeEngine::calls());
    FakeEngine::results()["ReferenceTransform"] = FakeEngine::failure();
    EXPECT_EQ(FakeEngine::failure(), CVantle::ReferenceTransform(handle<VantleTransform>(16)));
}

TEST(CVantleShader, HandsArgumentsAndResultsThrough) {
    FakeBinding const binding;
    VantleShader* pShader = nullptr;
    VantleString* pName = nullptr;
    VantleString* pCode = nullptr;
    std::uint32_t count = 0;
    _t_Vantle_ShaderParameterData data{};
    float target[9] = {};
    CVantleShader::NewShader(VANTLE_SHADER_FAMILY, handle<VantleTransform>(31), handle<_t_Vantle_Options>(32),
                             &pShader);
    EXPECT_EQ(handle<VantleShader>(4000), pShader);
    EXPECT_EQ((Names{"VantleShaderInterface/CopyData/VantleCopyDataProc",
                     "VantleShaderInterface/Parameter/VantleParameterProc",
                     "VantleShaderInterface/NumParameters/VantleNumParametersProc",
                     "VantleShaderInterface/Strings/VantleStringsProc",
                     "VantleShaderInterface/Family/VantleFamilyProc",
                     "VantleShaderInterface/NewShader/VantleNewShaderProc"}),
              FakeEngine::asked());
    CVantleShader::Family(pShader, &count);
    CVantleShader::Strings(pShader, &pName, &pCode);
    CVantleShader::NumParameters(pShader, &count);
    CVantleShader::Parameter(pShader, 3, &data);
    CVantleShader::CopyData(pShader, 2, target, &count);
    CVantleShader::release(pShader);
    CVantleShader::release(nullptr);
    // "safs" is 0x73616673.
    EXPECT_EQ((Names{"NewShader 1935763059 31 32", "Family 4000 " + number(&count),
                     "Strings 4000 " + number(&pName) + " " + number(&pCode),
                     "NumParameters 4000 " + number(&count), "Parameter 4000 3 " + number(&data),
                     "CopyData 4000 2 " + number(target) + " " + number(&count), "Release 4000"}),
              FakeEngine::calls());
}

TEST(CVantle, AnEngineMayGoAndComeBackUnderARunningSystem) {
    FakeBinding const binding;
    EXPECT_EQ(0u, CVantle::ReferenceTransform(handle<VantleTransform>(1)));
    FakeEngine::missing() = {"VantleInterface2/ApplyGeneral"};
    EXPECT_EQ(0u, CVantle::ReferenceTransform(handle<VantleTransform>(2))) << "nothing is unregistered yet";
    FakeEngine::unregister();
    EXPECT_FALSE(CVantle::isAvailable());
    expectAbsent([] { CVantle::ReferenceTransform(handle<VantleTransform>(3)); });
    expectAbsent([] { CVantle::ReferenceTransform(handle<VantleTransform>(3)); });
    FakeEngine::missing().clear();
    FakeEngine::serveNewVersion();
    EXPECT_TRUE(CVantle::isAvailable());
    EXPECT_EQ(0u, CVantle::ReferenceTransform(handle<VantleTransform>(4)));
    EXPECT_EQ((Names{"ReferenceTransform 1", "ReferenceTransform 2", "ReferenceTransformAnew 4"}),
              FakeEngine::calls());
}

TEST(CVantle, CallsTheNewProceduresOnceTheCounterMoved) {
    FakeBinding const binding;
    CVantle::ReferenceTransform(handle<VantleTransform>(1));
    FakeEngine::serveNewVersion();
    CVantle::ReferenceTransform(handle<VantleTransform>(2));
    FakeEngine::unregister();
    CVantle::ReferenceTransform(handle<VantleTransform>(3));
    EXPECT_EQ((Names{"ReferenceTransform 1", "ReferenceTransform 2", "ReferenceTransformAnew 3"}),
              FakeEngine::calls());
}

TEST(CVantle, CallsTheNewProceduresOfAnEngineThatIsReplacedDuringTheLoad) {
    FakeBinding const binding;
    FakeEngine::whenAsked([](std::string const& sName) {
        if (sName == "VantleInterface2/ProfileFromCode" && FakeEngine::unregistered() == 7) {
            FakeEngine::unregister();
            FakeEngine::serveNewVersion();
        }
    });
    CVantle::ReferenceTransform(handle<VantleTransform>(1));
    EXPECT_EQ((Names{"ReferenceTransformAnew 1"}), FakeEngine::calls());
}

TEST(CVantle, AStoppedBindingIsAnAbsentEngine) {
    {
        FakeBinding const binding;
        EXPECT_TRUE(CVantle::isAvailable());
    }
    EXPECT_FALSE(CVantle::isAvailable());
    FakeBinding const binding;
    EXPECT_TRUE(CVantle::isAvailable());
    EXPECT_EQ(9u, FakeEngine::asked().size()) << "the table is loaded anew";
}

TEST(CVantle, MakesATransformFromTwoCodes) {
    FakeBinding const binding;
    VantleTransform* pTransform = nullptr;
    EXPECT_EQ(0u, CVantle::makeTransform(&pTransform, 1, 2));
    EXPECT_EQ(handle<VantleTransform>(3000), pTransform);
    EXPECT_EQ((Names{"ProfileFromCode 1", "ProfileFromCode 2", "MakeColorTransform 1001 1002 3 0",
                     "OptimizeTransform 2000 0", "UnReferenceTransform 2000", "UnReferenceProfile 1002",
                     "UnReferenceProfile 1001"}),
              FakeEngine::calls());
}

TEST(CVantle, AFailedTransformLeavesNothingReferenced) {
    struct Case {
        char const* pSelector;
        Names aCalls;
    };
    Case const aCases[] = {
        {"ProfileFromCode", {"ProfileFromCode 1"}},
        {"MakeColorTransform",
         {"ProfileFromCode 1", "ProfileFromCode 2", "MakeColorTransform 1001 1002 3 0",
          "UnReferenceProfile 1002", "UnReferenceProfile 1001"}},
        {"OptimizeTransform",
         {"ProfileFromCode 1", "ProfileFromCode 2", "MakeColorTransform 1001 1002 3 0",
          "OptimizeTransform 2000 0", "UnReferenceTransform 2000", "UnReferenceProfile 1002",
          "UnReferenceProfile 1001"}},
    };
    for (Case const& test : aCases) {
        FakeBinding const binding;
        FakeEngine::results()[test.pSelector] = 5;
        auto* pTransform = handle<VantleTransform>(99);
        EXPECT_EQ(5u, CVantle::makeTransform(&pTransform, 1, 2)) << test.pSelector;
        EXPECT_EQ(nullptr, pTransform) << test.pSelector;
        EXPECT_EQ(test.aCalls, FakeEngine::calls()) << test.pSelector;
    }
}

TEST(CVantle, AnEngineThatGoesMidwayLeavesNothingReferencedOnceItIsBack) {
    for (char const* const pLast : {"ProfileFromCode", "MakeColorTransform"}) {
        SCOPED_TRACE(pLast);
        FakeBinding const binding;
        static std::string sLast;
        sLast = pLast;
        FakeEngine::whenCalled([](std::string const& sSelector) {
            if (sSelector == sLast && FakeEngine::unregistered() == 7) {
                FakeEngine::unregister();
                FakeEngine::missing() = {"VantleInterface2/ApplyGeneral"};
            }
        });
        auto* pTransform = handle<VantleTransform>(99);
        // Away for one load.
        FakeEngine::whenAsked([](std::string const& sName) {
            static int nAsked = 0;
            if (sName == "VantleInterface2/ApplyGeneral" && FakeEngine::unregistered() == 8 &&
                ++nAsked % 2 == 0) {
                FakeEngine::missing().clear();
            }
        });
        expectAbsent([&] { CVantle::makeTransform(&pTransform, 1, 2); });
        EXPECT_EQ(nullptr, pTransform);
        EXPECT_EQ(0, FakeEngine::references());
    }
}

TEST(CVantle, AnEngineThatGoesForGoodMidwayIsToldOf) {
    FakeBinding const binding;
    FakeEngine::whenCalled([](std::string const&) {
        FakeEngine::unregister();
        FakeEngine::missing() = {"VantleInterface2/ApplyGeneral"};
    });
    auto* pTransform = handle<VantleTransform>(99);
    expectAbsent([&] { CVantle::makeTransform(&pTransform, 1, 2); });
    EXPECT_EQ(nullptr, pTransform);
    EXPECT_EQ((Names{"ProfileFromCode 1"}), FakeEngine::calls());
}

TEST(CVantle, AMadeTransformIsTheOneReferenceThatIsLeft) {
    FakeBinding const binding;
    VantleTransform* pTransform = nullptr;
    EXPECT_EQ(0u, CVantle::makeTransform(&pTransform, 1, 2));
    EXPECT_EQ(1, FakeEngine::references());
    CVantle::UnReferenceTransform(pTransform);
    EXPECT_EQ(0, FakeEngine::references());
}

} // namespace
