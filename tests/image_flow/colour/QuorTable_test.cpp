#include "orvo/image_flow/colour/QuorTable.h"

#include "orvo/image_flow/colour/CQuorError.h"
#include "orvo/image_flow/colour/QuorClient.h"
#include "orvo/image_flow/colour/QuorInterfaces.h"
#include "orvo/image_flow/colour/QuorMethodTable.h"
#include "tests/image_flow/colour/FakeEngine.h"

#include <gtest/gtest.h>

#include <array>
#include <iterator>
#include <memory>

namespace {

using namespace ORVO;
using namespace ORVO::ImageFlow;
using Quor_T_MT::CQuorError;
using Test::FakeBinding;
using Test::FakeEngine;
using Names = std::vector<std::string>;

constexpr QuorRow aTestRows[] = {
    {0, "NewShader", "VantleNewShaderProc"},
    {2, "Strings", "VantleStringsProc"},
    {5, "CopyData", "VantleCopyDataProc"},
};

/// A table of three rows.
struct TestTable {
    std::array<std::atomic<void*>, 6> aSlots_{};
    QuorTable oTable_{"VantleShaderInterface", aTestRows, std::size(aTestRows), aSlots_.data()};
};

/// What the engine itself says, so that calls and asks of the test are not mixed up.
void* procedureOf(char const* pSelector, char const* pProcName) {
    void* const pProcedure = FakeEngine::address("VantleShaderInterface", pSelector, pProcName);
    FakeEngine::asked().pop_back();
    return pProcedure;
}

TEST(QuorTable, LoadsFromTheLastRowToTheFirst) {
    FakeBinding const binding;
    TestTable test;
    EXPECT_EQ(1, test.oTable_.load());
    EXPECT_EQ((Names{"VantleShaderInterface/CopyData/VantleCopyDataProc",
                     "VantleShaderInterface/Strings/VantleStringsProc",
                     "VantleShaderInterface/NewShader/VantleNewShaderProc"}),
              FakeEngine::asked());
    EXPECT_EQ(procedureOf("NewShader", "VantleNewShaderProc"), test.oTable_.procedure(0));
    EXPECT_EQ(procedureOf("CopyData", "VantleCopyDataProc"), test.oTable_.procedure(5));
    EXPECT_EQ(nullptr, test.oTable_.procedure(1));
    EXPECT_EQ(7u, test.oTable_.loadCount());
    EXPECT_STREQ("VantleShaderInterface", test.oTable_.interfaceName());
}

TEST(QuorTable, AStrictLoadThrowsAndLeavesTheTablePartlyFilledFromTheEnd) {
    FakeBinding const binding;
    TestTable test;
    FakeEngine::missing() = {"VantleShaderInterface/Strings"};
    try {
        test.oTable_.load();
        FAIL() << "nothing thrown";
    } catch (CQuorError const& error) {
        EXPECT_STREQ("", error.what());
        EXPECT_EQ(reinterpret_cast<QuorError*>(&FakeEngine::error()), error.error());
        EXPECT_EQ(1, FakeEngine::error().nReferences_) << "the exception alone holds it";
    }
    EXPECT_EQ((Names{"NewError '' Quor"}), FakeEngine::calls());
    EXPECT_EQ("Quor", FakeEngine::error().sComponent_);
    EXPECT_EQ(0, FakeEngine::error().nReferences_);
    EXPECT_NE(nullptr, test.oTable_.procedure(5));
    EXPECT_EQ(nullptr, test.oTable_.procedure(2));
    EXPECT_EQ(nullptr, test.oTable_.procedure(0));
    EXPECT_EQ(2u, FakeEngine::asked().size()) << "the row before the missing one is not asked for";
}

TEST(QuorTable, AStrictLoadWithoutErrorObjectsSaysThatAnInterfaceIsMissing) {
    FakeBinding const binding;
    TestTable test;
    FakeEngine::missing() = {"VantleShaderInterface/Strings", "QuorErrorInterface/NewError"};
    // The interface of errors is loaded again, in vain.
    FakeEngine::unregister();
    try {
        test.oTable_.load();
        FAIL() << "nothing thrown";
    } catch (CQuorError const& error) {
        EXPECT_STREQ("Missing Interface", error.what());
        EXPECT_EQ(nullptr, error.error());
    }
    EXPECT_EQ(Names(), FakeEngine::calls()) << "no error object is made";
    EXPECT_EQ(nullptr, test.oTable_.procedure(0));
}

TEST(QuorTable, ALenientLoadReportsAndLeavesTheEarlierRowsAsTheyAre) {
    FakeEngine::reset();
    ASSERT_FALSE(QuorClient::isStrict());
    TestTable test;
    EXPECT_EQ(0, test.oTable_.load()) << "nothing is bound";
    // The base interfaces are loaded before the strict mode.
    ASSERT_EQ(nullptr, quorContainerInterface().procedure(QUOR_CONTAINER_GET_METHOD));
    FakeEngine::missing() = {"QuorContainerInterface/Release"};
    EXPECT_NO_THROW(EXPECT_EQ(0, QuorClient::start(&FakeEngine::address)));
    EXPECT_EQ(Names(), FakeEngine::calls()) << "no error object is made";
    EXPECT_NE(nullptr, quorContainerInterface().procedure(QUOR_CONTAINER_GET_METHOD));
    EXPECT_EQ(nullptr, quorContainerInterface().procedure(QUOR_CONTAINER_RELEASE));
    EXPECT_EQ(nullptr, quorContainerInterface().procedure(QUOR_CONTAINER_ADD_REF));
}

TEST(QuorTable, StaysAsItIsUntilTheCounterMoves) {
    FakeBinding const binding;
    TestTable test;
    EXPECT_TRUE(test.oTable_.refresh());
    EXPECT_EQ(3u, FakeEngine::asked().size());
    EXPECT_TRUE(test.oTable_.refresh());
    EXPECT_EQ(3u, FakeEngine::asked().size());
    FakeEngine::unregister();
    EXPECT_TRUE(test.oTable_.refresh());
    EXPECT_EQ(6u, FakeEngine::asked().size());
    EXPECT_EQ(8u, test.oTable_.loadCount());
}

TEST(QuorTable, AnEngineThatIsReplacedDuringTheLoadIsLoadedAgain) {
    FakeBinding const binding;
    TestTable test;
    FakeEngine::whenAsked([](std::string const& sName) {
        // The last row that is asked for; the others are the old engine's.
        if (sName == "VantleShaderInterface/NewShader" && FakeEngine::unregistered() == 7) {
            FakeEngine::unregister();
        }
    });
    EXPECT_TRUE(test.oTable_.refresh());
    EXPECT_EQ(6u, FakeEngine::asked().size());
    EXPECT_EQ(8u, test.oTable_.loadCount());
    EXPECT_TRUE(test.oTable_.refresh());
    EXPECT_EQ(6u, FakeEngine::asked().size()) << "and then it rests";
}

TEST(QuorTable, AnEngineThatIsReplacedAllTheTimeEndsTheLoadAndIsLoadedAtTheNextUse) {
    FakeBinding const binding;
    TestTable test;
    FakeEngine::whenAsked([](std::string const&) { FakeEngine::unregister(); });
    EXPECT_EQ(1, test.oTable_.load());
    EXPECT_EQ(12u, FakeEngine::asked().size()) << "four times three rows";
    EXPECT_NE(FakeEngine::unregistered(), test.oTable_.loadCount());
    FakeEngine::whenAsked(nullptr);
    EXPECT_TRUE(test.oTable_.refresh());
    EXPECT_EQ(15u, FakeEngine::asked().size());
    EXPECT_EQ(FakeEngine::unregistered(), test.oTable_.loadCount());
}

TEST(QuorTable, AnEngineThatGoesAwayDuringTheLoadIsAbsent) {
    FakeBinding const binding;
    TestTable test;
    FakeEngine::whenAsked([](std::string const& sName) {
        if (sName == "VantleShaderInterface/NewShader") {
            FakeEngine::unregister();
            FakeEngine::missing() = {"VantleShaderInterface/CopyData"};
        }
    });
    EXPECT_FALSE(test.oTable_.refresh());
    EXPECT_EQ(nullptr, test.oTable_.procedure(0));
}

TEST(QuorTable, AnEngineThatGoesAwayNullsTheFirstWordAndMayComeBack) {
    FakeBinding const binding;
    TestTable test;
    EXPECT_TRUE(test.oTable_.refresh());
    FakeEngine::unregister();
    FakeEngine::missing() = {"VantleShaderInterface/CopyData"};
    EXPECT_FALSE(test.oTable_.refresh());
    EXPECT_EQ(nullptr, test.oTable_.procedure(0));
    EXPECT_FALSE(test.oTable_.refresh());
    EXPECT_EQ(Names(), FakeEngine::calls()) << "a refresh makes no error objects";
    FakeEngine::missing().clear();
    // The counter tells of what goes, not of what comes.
    EXPECT_TRUE(test.oTable_.refresh());
    EXPECT_NE(nullptr, test.oTable_.procedure(0));
}

TEST(QuorTable, ANewBindingLoadsAgainAlsoWithTheSameCounter) {
    TestTable test;
    {
        FakeBinding const binding;
        EXPECT_TRUE(test.oTable_.refresh());
    }
    EXPECT_FALSE(test.oTable_.refresh());
    FakeBinding const binding;
    EXPECT_TRUE(test.oTable_.refresh());
    EXPECT_EQ(3u, FakeEngine::asked().size());
}

TEST(CQuorError, HoldsTheErrorObjectAndItsText) {
    FakeBinding const binding;
    EXPECT_NO_THROW(Quor_T_MT::checkQuorResult(0));
    try {
        Quor_T_MT::checkQuorResult(FakeEngine::failure());
        FAIL() << "nothing thrown";
    } catch (CQuorError const& error) {
        EXPECT_STREQ("no such thing", error.what());
        EXPECT_EQ(2, FakeEngine::error().nReferences_);
        CQuorError copy(error);
        EXPECT_EQ(3, FakeEngine::error().nReferences_);
        CQuorError other("Missing Interface");
        EXPECT_EQ(nullptr, other.error());
        other = error;
        EXPECT_STREQ("no such thing", other.what());
        EXPECT_EQ(4, FakeEngine::error().nReferences_);
        copy = CQuorError("Missing Interface");
        EXPECT_STREQ("Missing Interface", copy.what());
        EXPECT_EQ(3, FakeEngine::error().nReferences_);
    }
    EXPECT_EQ(1, FakeEngine::error().nReferences_);
    EXPECT_STREQ("Invalid CQuorError", CQuorError(FakeEngine::handle<QuorError>(8)).what());
    EXPECT_STREQ("Invalid CQuorError", CQuorError(static_cast<QuorError*>(nullptr)).what());
    std::exception const& base = CQuorError("Missing Interface");
    EXPECT_STREQ("Missing Interface", base.what());
}

TEST(CQuorError, OutlivesItsEngine) {
    std::unique_ptr<CQuorError> apError;
    {
        FakeBinding const binding;
        apError = std::make_unique<CQuorError>(reinterpret_cast<QuorError*>(&FakeEngine::error()));
    }
    EXPECT_STREQ("no such thing", apError->what());
    FakeBinding const next; // its error object stands at the same address
    apError.reset();
    EXPECT_EQ(1, FakeEngine::error().nReferences_);
}

constexpr Quor_T_MT::QuorVTabGeneric::Method aMethods[] = {{"Draw", "DrawProc"}, {"Erase", "EraseProc"}};

TEST(QuorVTabGeneric, BindsTheMethodsOfAnObjectByName) {
    FakeBinding const binding;
    std::array<void*, 2> aSlots{};
    Quor_T_MT::QuorVTabGeneric table(aMethods, 2, aSlots.data());
    int method = 0;
    FakeEngine::setMethod(&method);
    EXPECT_TRUE(table.bind(FakeEngine::handle<QuorContainer>(77), true));
    EXPECT_EQ((Names{"GetMethod 77 Draw DrawProc 0", "GetMethod 77 Erase EraseProc 0"}), FakeEngine::calls());
    EXPECT_EQ(&method, aSlots[0]);
    EXPECT_EQ(&method, aSlots[1]);
    EXPECT_EQ(0, FakeEngine::atoms());
}

TEST(QuorVTabGeneric, ANullMethodStopsARequiredBindingAlone) {
    FakeBinding const binding;
    std::array<void*, 2> aSlots{};
    Quor_T_MT::QuorVTabGeneric table(aMethods, 2, aSlots.data());
    EXPECT_FALSE(table.bind(FakeEngine::handle<QuorContainer>(77), true));
    EXPECT_EQ((Names{"GetMethod 77 Draw DrawProc 0"}), FakeEngine::calls());
    FakeEngine::calls().clear();
    EXPECT_TRUE(table.bind(FakeEngine::handle<QuorContainer>(77), false));
    EXPECT_EQ((Names{"GetMethod 77 Draw DrawProc 1", "GetMethod 77 Erase EraseProc 1"}), FakeEngine::calls());
    EXPECT_EQ(0, FakeEngine::atoms());
}

TEST(QuorVTabGeneric, AFailureRaisesTheEnginesError) {
    FakeBinding const binding;
    std::array<void*, 2> aSlots{};
    Quor_T_MT::QuorVTabGeneric table(aMethods, 2, aSlots.data());
    FakeEngine::results()["GetMethod"] = FakeEngine::failure();
    try {
        table.bind(FakeEngine::handle<QuorContainer>(77), true);
        FAIL() << "nothing thrown";
    } catch (CQuorError const& error) {
        EXPECT_STREQ("no such thing", error.what());
    }
    EXPECT_EQ(0, FakeEngine::atoms());
    QuorClient::stop();
    try {
        table.bind(FakeEngine::handle<QuorContainer>(77), true);
        FAIL() << "nothing thrown";
    } catch (CQuorError const& error) {
        EXPECT_STREQ("Missing Interface", error.what());
    }
}

} // namespace
