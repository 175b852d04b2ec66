#include "orvo/image_flow/colour/QuorClient.h"

#include "orvo/image_flow/colour/CVantle.h"
#include "orvo/image_flow/colour/CVantleShader.h"
#include "orvo/image_flow/colour/LazyClient.h"
#include "orvo/image_flow/colour/QuorInterfaces.h"
#include "orvo/image_flow/colour/ScopedQuorInitializer.h"
#include "tests/image_flow/colour/FakeEngine.h"
#include "tests/support/Expect.h"

#include <memory>
#include <stdexcept>

namespace {

using namespace ORVO;
using namespace ORVO::ImageFlow;
using Test::FakeEngine;
using Names = std::vector<std::string>;

/// Nothing bound before and after.
struct QuorClientTest : testing::Test {
    QuorClientTest() { FakeEngine::reset(); }
    ~QuorClientTest() override {
        QuorClient::stop();
        EXPECT_FALSE(QuorClient::isLive());
    }
};

Names const aCoreNames = {
    "Quor/QuorRegisterProcAddress/QuorRegisterProcAddress",
    "Quor/QuorReportError/QuorReportError",
    "Quor/QuorUnregisterInterface/QuorUnregisterInterface",
    "Quor/QuorGetUnregisterCountAddr/QuorGetUnregisterCountAddr",
    "Quor/QuorIsMultiThreaded/QuorIsMultiThreaded",
};

/// Container, error, string, memory, each from its last row to its first.
Names const aBaseNames = {
    "QuorContainerInterface/GetMethod/QuorGetMethodV3Proc",
    "QuorContainerInterface/Release/QuorReleaseProc",
    "QuorContainerInterface/AddRef/QuorAddRefProc",
    "QuorErrorInterface/GetComponent/QuorGetComponentProc",
    "QuorErrorInterface/GetErrorMessage/QuorGetErrorMessageProc",
    "QuorErrorInterface/Release/QuorErrorReleaseProc",
    "QuorErrorInterface/AddRef/QuorErrorAddRefProc",
    "QuorErrorInterface/NewError/QuorNewErrorProc",
    "QuorStringInterface/AddRef/QuorStringAtomAddRefProc",
    "QuorStringInterface/GetCString/QuorGetCStringProc",
    "QuorStringInterface/DeleteStringAtom/QuorDeleteStringAtomProc",
    "QuorStringInterface/NewStringAtom/QuorNewStringAtomProc",
    "QuorMemoryInterface/GetBlockSize/QuorGetBlockSizeProc",
    "QuorMemoryInterface/Free/QuorFreeProc",
    "QuorMemoryInterface/Realloc/QuorReallocProc",
    "QuorMemoryInterface/Alloc/QuorAllocProc",
};

TEST_F(QuorClientTest, ANullProcedureFails) {
    EXPECT_EQ(0, QuorClient::start(nullptr));
    EXPECT_FALSE(QuorClient::isLive());
    EXPECT_EQ(nullptr, QuorClient::resolve("Quor", "QuorReportError", "QuorReportError"));
    EXPECT_EQ(0u, QuorClient::unregisterCount());
}

TEST_F(QuorClientTest, FetchesTheCoreProceduresAndThenTheBaseInterfacesInOrder) {
    EXPECT_FALSE(QuorClient::isStrict());
    EXPECT_EQ(1, QuorClient::start(&FakeEngine::address));
    Names expected = aCoreNames;
    expected.insert(expected.end(), aBaseNames.begin(), aBaseNames.end());
    EXPECT_EQ(expected, FakeEngine::asked());
    EXPECT_TRUE(QuorClient::isLive());
    EXPECT_TRUE(QuorClient::isStrict());
    EXPECT_EQ(7u, QuorClient::unregisterCount());
    FakeEngine::unregister();
    EXPECT_EQ(8u, QuorClient::unregisterCount());
    EXPECT_NE(nullptr, quorContainerInterface().procedure(4));
    EXPECT_EQ(nullptr, quorContainerInterface().procedure(5)) << "a slot that no row names";
    EXPECT_EQ(7u, quorMemoryInterface().loadCount());
}

/// An entry of an interface: where it stands and how it is asked for.
struct Slot {
    std::size_t number_;
    char const* pSelector_;
    char const* pProcName_;
};

/// The table holds the engine's procedures at these slots, and nothing at any other.
void expectSlots(QuorTable const& table, std::size_t nSlots, std::vector<Slot> const& aSlots) {
    std::vector<void*> aExpected(nSlots, nullptr);
    for (Slot const& slot : aSlots) {
        aExpected.at(slot.number_) =
            FakeEngine::address(table.interfaceName(), slot.pSelector_, slot.pProcName_);
        EXPECT_NE(nullptr, aExpected.at(slot.number_)) << slot.pSelector_;
    }
    for (std::size_t i = 0; i < nSlots; ++i) {
        EXPECT_EQ(aExpected[i], table.procedure(i)) << table.interfaceName() << " " << i;
    }
}

TEST_F(QuorClientTest, ProceduresStandAtTheSlotsOfTheirInterfaces) {
    EXPECT_EQ(1, QuorClient::start(&FakeEngine::address));
    expectSlots(quorContainerInterface(), 16,
                {{3, "AddRef", "QuorAddRefProc"},
                 {4, "Release", "QuorReleaseProc"},
                 {9, "GetMethod", "QuorGetMethodV3Proc"}});
    expectSlots(quorErrorInterface(), 8,
                {{0, "NewError", "QuorNewErrorProc"},
                 {2, "AddRef", "QuorErrorAddRefProc"},
                 {3, "Release", "QuorErrorReleaseProc"},
                 {4, "GetErrorMessage", "QuorGetErrorMessageProc"},
                 {5, "GetComponent", "QuorGetComponentProc"}});
    expectSlots(quorStringInterface(), 4,
                {{0, "NewStringAtom", "QuorNewStringAtomProc"},
                 {1, "DeleteStringAtom", "QuorDeleteStringAtomProc"},
                 {2, "GetCString", "QuorGetCStringProc"},
                 {3, "AddRef", "QuorStringAtomAddRefProc"}});
    expectSlots(quorMemoryInterface(), 4,
                {{0, "Alloc", "QuorAllocProc"},
                 {1, "Realloc", "QuorReallocProc"},
                 {2, "Free", "QuorFreeProc"},
                 {3, "GetBlockSize", "QuorGetBlockSizeProc"}});
    ASSERT_TRUE(CVantle::isAvailable());
    expectSlots(CVantle::table(), 150,
                {{18, "ProfileFromCode", "Vantle_ProfileFromCodeProc2"},
                 {32, "UnReferenceProfile", "Vantle_UnReferenceProfileProc2"},
                 {50, "UnReferenceString", "Vantle_UnReferenceStringProc2"},
                 {51, "StringASCII", "Vantle_StringASCIIProc2"},
                 {53, "MakeColorTransform", "Vantle_MakeColorTransformProc2"},
                 {55, "ReferenceTransform", "Vantle_ReferenceTransformProc2"},
                 {56, "UnReferenceTransform", "Vantle_UnReferenceTransformProc2"},
                 {62, "ApplyGeneral", "Vantle_ApplyGeneralProc2"},
                 {67, "OptimizeTransform", "Vantle_OptimizeTransformProc2"}});
    std::uint32_t nFamily = 0;
    EXPECT_EQ(0u, CVantleShader::Family(nullptr, &nFamily)); // the table is loaded on first use
    expectSlots(CVantleShader::table(), 6,
                {{0, "NewShader", "VantleNewShaderProc"},
                 {1, "Family", "VantleFamilyProc"},
                 {2, "Strings", "VantleStringsProc"},
                 {3, "NumParameters", "VantleNumParametersProc"},
                 {4, "Parameter", "VantleParameterProc"},
                 {5, "CopyData", "VantleCopyDataProc"}});
}

TEST_F(QuorClientTest, ASecondStartKeepsWhatIsBound) {
    EXPECT_EQ(1, QuorClient::start(&FakeEngine::address));
    FakeEngine::asked().clear();
    EXPECT_EQ(1, QuorClient::start(&FakeEngine::address));
    EXPECT_EQ(1, QuorClient::start(nullptr));
    EXPECT_EQ(Names(), FakeEngine::asked());
    EXPECT_TRUE(QuorClient::isLive());
}

TEST_F(QuorClientTest, AnyMissingProcedureFailsTheStartAndTheNextOneMayTryAgain) {
    Names all = aCoreNames;
    all.insert(all.end(), aBaseNames.begin(), aBaseNames.end());
    for (std::string const& sName : all) {
        std::string const sMissing = sName.substr(0, sName.rfind('/'));
        FakeEngine::missing() = {sMissing};
        EXPECT_EQ(0, QuorClient::start(&FakeEngine::address)) << sMissing;
        EXPECT_FALSE(QuorClient::isLive()) << sMissing;
        EXPECT_FALSE(QuorClient::isStrict()) << sMissing;
        EXPECT_EQ(sName, FakeEngine::asked().back()) << "asked on after a missing procedure";
    }
    FakeEngine::missing().clear();
    EXPECT_EQ(1, QuorClient::start(&FakeEngine::address));
}

TEST_F(QuorClientTest, ARefusedCounterFailsTheStart) {
    FakeEngine::refuseCount();
    EXPECT_EQ(0, QuorClient::start(&FakeEngine::address));
    EXPECT_EQ(aCoreNames, FakeEngine::asked());
}

std::vector<std::string> aEvents;

TEST_F(QuorClientTest, InitialisesClientsInOrderAndFinishesInTheOpposite) {
    aEvents.clear();
    static Quor_T_MT::LazyTerminate oFirst([](void* p) { aEvents.emplace_back(static_cast<char const*>(p)); },
                                           const_cast<char*>("end of first"));
    static Quor_T_MT::LazyTerminate oSecond(
        [](void* p) { aEvents.emplace_back(static_cast<char const*>(p)); },
        const_cast<char*>("end of second"));
    Quor_T_MT::LazyClient const first([] {
        aEvents.emplace_back("first");
        EXPECT_TRUE(QuorClient::isStrict());
        EXPECT_TRUE(QuorClient::isLive());
        EXPECT_TRUE(CVantle::isAvailable()) << "an initialiser may call the engine";
        oFirst.add();
        oFirst.add();
    });
    Quor_T_MT::LazyClient const second([] {
        aEvents.emplace_back("second");
        oSecond.add();
    });
    for (int iRound = 0; iRound < 2; ++iRound) {
        EXPECT_EQ(1, QuorClient::start(&FakeEngine::address));
        QuorClient::stop();
        EXPECT_EQ((Names{"first", "second", "end of second", "end of first"}), aEvents);
        aEvents.clear();
    }
}

TEST_F(QuorClientTest, AClientThatFailsToInitialiseFailsTheStart) {
    auto apClient = std::make_unique<Quor_T_MT::LazyClient>([] { throw std::runtime_error("not today"); });
    EXPECT_THROW(QuorClient::start(&FakeEngine::address), std::runtime_error);
    EXPECT_FALSE(QuorClient::isLive());
    apClient.reset();
    EXPECT_EQ(1, QuorClient::start(&FakeEngine::address));
}

TEST_F(QuorClientTest, TheScopedInitializerDemandsThatTheStartSucceeds) {
    ScopedQuorInitializer initializer;
    ORVO_EXPECT_INTERNAL(initializer.initialize(nullptr), "nResult != 0");
    FakeEngine::missing() = {"QuorErrorInterface/AddRef"};
    ORVO_EXPECT_INTERNAL(initializer.initialize(&FakeEngine::address), "nResult != 0");
    EXPECT_FALSE(initializer.isInitialized());
    FakeEngine::missing().clear();
    {
        ScopedQuorInitializer inner;
        inner.initialize(&FakeEngine::address);
        EXPECT_TRUE(inner.isInitialized());
        FakeEngine::asked().clear();
        inner.initialize(nullptr);
        EXPECT_EQ(Names(), FakeEngine::asked());
        EXPECT_TRUE(QuorClient::isLive());
    }
    EXPECT_FALSE(QuorClient::isLive());
}

} // namespace
