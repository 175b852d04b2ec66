#include "orvo/image_flow/colour/QuorClient.h"

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
