#include "orvo/data_flow/connectors/Outputs.h"

#include "orvo/core/memory/AllocationFailure.h"
#include "orvo/data_flow/connectors/Connect.h"
#include "tests/data_flow/connectors/Payload.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

#include <new>
#include <string>
#include <type_traits>
#include <utility>

namespace {

using namespace ORVO::DataFlow;
using ORVO::Test::Payload;

class OutputsTest : public testing::Test {
protected:
    void SetUp() override { Payload::resetCounts(); }
    void TearDown() override { EXPECT_EQ(0, Payload::nAlive); }

    /// The object in the connector and the address that it shows must be one.
    template <typename AnyConnector>
    static void expectHolds(AnyConnector const& oConnector, Payload const* pPayload) {
        EXPECT_EQ(pPayload, oConnector.get());
        EXPECT_EQ(pPayload, oConnector.data());
        EXPECT_EQ(pPayload != nullptr, oConnector.hasData());
    }
};

/// An output and an input that are connected, and an object in the output.
template <template <typename> class AnyOutput, template <typename> class AnyInput>
struct Edge {
    explicit Edge(bool bKeepCache) {
        Connect(oOutput_, oInput_);
        oOutput_.keepCache(bKeepCache);
        oOutput_.setData(pPayload_);
    }
    ~Edge() { oOutput_.disconnect(); }

    Payload* pPayload_ = ORVO_NEW Payload(1);
    AnyOutput<Payload> oOutput_{"out", nullptr};
    AnyInput<Payload> oInput_{"in", nullptr};
};

TEST_F(OutputsTest, ConstToConstSharesWhileItKeeps) {
    Edge<ConstOutput, ConstInput> oEdge(true);
    oEdge.oInput_.fetchInput();
    expectHolds(oEdge.oOutput_, oEdge.pPayload_);
    expectHolds(oEdge.oInput_, oEdge.pPayload_);
    EXPECT_EQ(2, oEdge.oOutput_.dataPointer().useCount());
    EXPECT_EQ(0, Payload::nCopies);
    oEdge.oInput_.removeData();
    expectHolds(oEdge.oInput_, nullptr);
    expectHolds(oEdge.oOutput_, oEdge.pPayload_);
    EXPECT_EQ(1, Payload::nAlive);
}

TEST_F(OutputsTest, ConstToMutableCopiesASharedObjectWhereItDoesNotKeep) {
    Edge<ConstOutput, Input> oEdge(false);
    ConstOutput<Payload> oClone(oEdge.oOutput_);
    oClone.cloneDataFrom(oEdge.oOutput_);
    expectHolds(oClone, oEdge.pPayload_);
    oEdge.oInput_.fetchInput();
    expectHolds(oEdge.oOutput_, nullptr);
    ASSERT_TRUE(oEdge.oInput_.hasData());
    EXPECT_NE(oEdge.pPayload_, oEdge.oInput_.get());
    oEdge.oInput_->iValue_ = 2;
    EXPECT_EQ(1, oClone->iValue_);
    EXPECT_EQ(1, Payload::nCopies);
}

TEST_F(OutputsTest, FetchingDropsWhatTheInputHeld) {
    Edge<ConstOutput, ConstInput> oEdge(false);
    oEdge.oInput_.setData(ORVO_NEW Payload(9));
    oEdge.oInput_.fetchInput();
    expectHolds(oEdge.oInput_, oEdge.pPayload_);
    EXPECT_EQ(1, Payload::nAlive);
}

template <typename AnyEdge>
class EveryEdgeTest : public OutputsTest {};

using AllEdges = testing::Types<Edge<ConstOutput, ConstInput>, Edge<ConstOutput, Input>,
                                Edge<Output, ConstInput>, Edge<Output, Input>>;
TYPED_TEST_SUITE(EveryEdgeTest, AllEdges);

TYPED_TEST(EveryEdgeTest, GivesTheOnlyReferenceWhereItDoesNotKeep) {
    TypeParam oEdge(false);
    oEdge.oInput_.fetchInput();
    this->expectHolds(oEdge.oOutput_, nullptr);
    this->expectHolds(oEdge.oInput_, oEdge.pPayload_);
    EXPECT_EQ(0, Payload::nCopies);
    oEdge.oInput_.removeData();
    EXPECT_EQ(0, Payload::nAlive);
}

TYPED_TEST(EveryEdgeTest, ABoundOutputCannotBeMovedFrom) {
    for (bool const bKeepCache : {false, true}) {
        Payload oClients(3);
        TypeParam oEdge(bKeepCache);
        oEdge.oOutput_.setBoundData(&oClients);
        ORVO_EXPECT_INTERNAL(oEdge.oInput_.fetchInput(), "!this->bound()");
        this->expectHolds(oEdge.oOutput_, &oClients);
        this->expectHolds(oEdge.oInput_, nullptr);
    }
}

TYPED_TEST(EveryEdgeTest, ABoundInputTakesNeitherShareNorCopy) {
    Payload const oClients(3);
    TypeParam oEdge(true);
    oEdge.oInput_.setBoundData(&oClients);
    ORVO_EXPECT_INTERNAL(oEdge.oInput_.fetchInput(), "!this->bound()");
    this->expectHolds(oEdge.oOutput_, oEdge.pPayload_);
    EXPECT_EQ(nullptr, oEdge.oInput_.get());
    EXPECT_EQ(&oClients, oEdge.oInput_.data());
    EXPECT_EQ(0, Payload::nCopies);
}

TYPED_TEST(EveryEdgeTest, ABoundInputTakesWhatIsGivenAway) {
    Payload const oClients(3);
    TypeParam oEdge(false);
    oEdge.oInput_.setBoundData(&oClients);
    oEdge.oInput_.fetchInput();
    this->expectHolds(oEdge.oInput_, oEdge.pPayload_);
    this->expectHolds(oEdge.oOutput_, nullptr);
}

TYPED_TEST(EveryEdgeTest, AnEmptyOutputGivesNothingOrIsRefused) {
    TypeParam oEdge(false);
    oEdge.oOutput_.flushOutput();
    oEdge.oInput_.setData(ORVO_NEW Payload(9));
    oEdge.oInput_.fetchInput();
    this->expectHolds(oEdge.oInput_, nullptr);
    EXPECT_EQ(0, Payload::nAlive);

    oEdge.oOutput_.keepCache(true);
    bool constexpr bShares = std::is_same_v<TypeParam, Edge<ConstOutput, ConstInput>>;
    if (bShares) {
        oEdge.oInput_.fetchInput();
    } else {
        ORVO_EXPECT_INTERNAL(oEdge.oInput_.fetchInput(), "Enforce spData_.get() != NULL");
    }
    this->expectHolds(oEdge.oInput_, nullptr);
}

TYPED_TEST(EveryEdgeTest, AFailedCopyLeavesBothEndsAsTheyWere) {
    TypeParam oEdge(true);
    oEdge.oInput_.setData(ORVO_NEW Payload(9));
    Payload const* const pHeld = oEdge.oInput_.get();
    bool constexpr bShares = std::is_same_v<TypeParam, Edge<ConstOutput, ConstInput>>;
    if (!bShares) {
        Payload::bCopiesFail = true;
        EXPECT_THROW(oEdge.oInput_.fetchInput(), std::runtime_error);
        Payload::bCopiesFail = false;
        ORVO::Core::AllocationFailure oFailure(1);
        EXPECT_THROW(oEdge.oInput_.fetchInput(), std::bad_alloc);
        this->expectHolds(oEdge.oInput_, pHeld);
    }
    this->expectHolds(oEdge.oOutput_, oEdge.pPayload_);
}

template <typename AnyEdge>
class CopyingEdgeTest : public OutputsTest {};

/// All but the one whose ends may share.
using CopyingEdges = testing::Types<Edge<ConstOutput, Input>, Edge<Output, ConstInput>, Edge<Output, Input>>;
TYPED_TEST_SUITE(CopyingEdgeTest, CopyingEdges);

TYPED_TEST(CopyingEdgeTest, GivesACopyOfItsOwnWhileItKeeps) {
    TypeParam oEdge(true);
    oEdge.oInput_.fetchInput();
    this->expectHolds(oEdge.oOutput_, oEdge.pPayload_);
    EXPECT_EQ(1, oEdge.oOutput_.dataPointer().useCount());
    ASSERT_TRUE(oEdge.oInput_.hasData());
    EXPECT_NE(oEdge.pPayload_, oEdge.oInput_.get());
    this->expectHolds(oEdge.oInput_, oEdge.oInput_.get());
    EXPECT_EQ(1, Payload::nCopies);
    oEdge.pPayload_->iValue_ = 2;
    EXPECT_EQ(1, oEdge.oInput_->iValue_) << "neither end sees what the other does";
    // The copy is releasable.
    ORVO::trackedDelete(oEdge.oInput_.releaseData());
}

TEST_F(OutputsTest, TheCommonBaseCannotBeMovedFrom) {
    OutputTemplate<Payload> oOutput("out", nullptr);
    ConstInput<Payload> oConstInput("in", nullptr);
    Input<Payload> oInput("in", nullptr);
    oOutput.setData(ORVO_NEW Payload(1));
    ORVO_EXPECT_INTERNAL(oOutput.moveTo(oConstInput), "0");
    ORVO_EXPECT_INTERNAL(oOutput.moveTo(oInput), "0");
    EXPECT_TRUE(oOutput.hasData());
    EXPECT_FALSE(oInput.hasData());
    Connect(oOutput, oInput);
    ORVO_EXPECT_INTERNAL(oInput.fetchInput(), "0");
    oInput.disconnect();
}

TEST_F(OutputsTest, AccessNeedsAnObject) {
    Output<Payload> oOutput("out", nullptr);
    expectHolds(oOutput, nullptr);
    ORVO_EXPECT_INTERNAL((void)oOutput->iValue_, "Enforce spData_.get() != NULL");
    ORVO_EXPECT_INTERNAL(*oOutput, "Enforce spData_.get() != NULL");
    ORVO_EXPECT_INTERNAL((void)std::as_const(oOutput)->iValue_, "Enforce spData_.get() != NULL");
    ORVO_EXPECT_INTERNAL(*std::as_const(oOutput), "Enforce spData_.get() != NULL");
    ConstOutput<Payload> oConstOutput("out", nullptr);
    ORVO_EXPECT_INTERNAL((void)oConstOutput->iValue_, "Enforce spData_.get() != NULL");
    ORVO_EXPECT_INTERNAL(*oConstOutput, "Enforce spData_.get() != NULL");
    oOutput.setData(ORVO_NEW Payload(4));
    oOutput->iValue_ = 5;
    EXPECT_EQ(5, (*std::as_const(oOutput)).iValue_);
}

TEST_F(OutputsTest, OnlyAnOutputThatMayWriteHandsOutAMutableObject) {
    static_assert(std::is_same_v<decltype(std::declval<Output<Payload>&>().get()), Payload*>);
    static_assert(std::is_same_v<decltype(std::declval<ConstOutput<Payload>&>().get()), Payload const*>);
    static_assert(std::is_same_v<decltype(std::declval<Input<Payload>&>().get()), Payload*>);
    static_assert(std::is_same_v<decltype(std::declval<ConstInput<Payload>&>().get()), Payload const*>);
    static_assert(std::is_same_v<decltype(*std::declval<Output<Payload> const&>()), Payload const&>);
    static_assert(std::is_same_v<decltype(*std::declval<Input<Payload> const&>()), Payload const&>);
}

TEST_F(OutputsTest, FlushDropsTheObject) {
    ConstOutput<Payload> oOutput("out", nullptr);
    oOutput.setData(ORVO_NEW Payload(1));
    oOutput.flushOutput();
    expectHolds(oOutput, nullptr);
    EXPECT_EQ(0, Payload::nAlive);
    oOutput.flushOutput();
    expectHolds(oOutput, nullptr);
}

TEST_F(OutputsTest, SetDataTakesOrShares) {
    ConstOutput<Payload> oOutput("out", nullptr);
    Payload* const pPayload = ORVO_NEW Payload(1);
    oOutput.setData(pPayload);
    expectHolds(oOutput, pPayload);
    ConstDataPointer<Payload> const spOther(ORVO_NEW Payload(2));
    oOutput.setData(spOther);
    expectHolds(oOutput, spOther.get());
    EXPECT_EQ(2, spOther.useCount());
    EXPECT_EQ(1, Payload::nAlive);
    oOutput.setData(nullptr);
    expectHolds(oOutput, nullptr);
    EXPECT_EQ(1, spOther.useCount());
}

TEST_F(OutputsTest, ConstOutputSharesWhatIsAssigned) {
    ConstDataPointer<Payload> const spSource(ORVO_NEW Payload(2));
    ConstInput<Payload> oInput("in", nullptr);
    oInput.setData(spSource);
    ConstOutput<Payload> oFromPointer("out", nullptr);
    ConstOutput<Payload> oFromInput("out", nullptr);
    ConstOutput<Payload> oFromOutput("out", nullptr);
    oFromPointer = spSource;
    oFromInput = oInput;
    oFromOutput.cloneDataFrom(oFromInput);
    expectHolds(oFromPointer, spSource.get());
    expectHolds(oFromInput, spSource.get());
    expectHolds(oFromOutput, spSource.get());
    EXPECT_EQ(5, spSource.useCount());
    EXPECT_EQ(0, Payload::nCopies);
    oFromOutput.cloneDataFrom(ConstOutput<Payload>("empty", nullptr));
    expectHolds(oFromOutput, nullptr);
}

TEST_F(OutputsTest, MutableOutputCopiesWhatIsAssigned) {
    ConstDataPointer<Payload> const spSource(ORVO_NEW Payload(2));
    ConstInput<Payload> oInput("in", nullptr);
    oInput.setData(spSource);
    Output<Payload> oFromPointer("out", nullptr);
    Output<Payload> oFromInput("out", nullptr);
    oFromPointer = spSource;
    oFromInput = oInput;
    for (Output<Payload>* const pOutput : {&oFromPointer, &oFromInput}) {
        ASSERT_TRUE(pOutput->hasData());
        EXPECT_NE(spSource.get(), pOutput->get());
        expectHolds(*pOutput, pOutput->get());
        EXPECT_EQ(2, (*pOutput)->iValue_);
    }
    EXPECT_EQ(2, Payload::nCopies);
    // The copy can be given up again.
    ConstDataPointer<Payload> spCopy(oFromPointer.dataPointer());
    Payload* const pCopy = spCopy.get();
    EXPECT_FALSE(spCopy.release());
    oFromPointer.flushOutput();
    EXPECT_EQ(2, pCopy->iValue_);
    ORVO::trackedDelete(pCopy);
}

TEST_F(OutputsTest, AssigningNothingIsRefused) {
    Output<Payload> oOutput("out", nullptr);
    oOutput.setData(ORVO_NEW Payload(1));
    ConstDataPointer<Payload> const spEmpty;
    ConstInput<Payload> const oEmptyInput("in", nullptr);
    ORVO_EXPECT_INTERNAL(oOutput = spEmpty, "Enforce spData_.get() != NULL");
    ORVO_EXPECT_INTERNAL(oOutput = oEmptyInput, "Enforce spData_.get() != NULL");
    EXPECT_EQ(1, oOutput->iValue_);
}

TEST_F(OutputsTest, AssigningToABoundOutputKeepsTheAddress) {
    Payload oClients(1);
    Output<Payload> oOutput("out", nullptr);
    oOutput.setBoundData(&oClients);
    ConstDataPointer<Payload> const spSource(ORVO_NEW Payload(2));
    oOutput = spSource;
    expectHolds(oOutput, &oClients);
    EXPECT_EQ(2, oClients.iValue_);
    ConstInput<Payload> oInput("in", nullptr);
    oInput.setData(ORVO_NEW Payload(3));
    oOutput = oInput;
    expectHolds(oOutput, &oClients);
    EXPECT_EQ(3, oClients.iValue_);
    EXPECT_EQ(3, Payload::nAlive);
    // Also from itself.
    oOutput = oOutput.dataPointer();
    EXPECT_EQ(3, oClients.iValue_);
    EXPECT_EQ(3, Payload::nAlive);
}

TEST_F(OutputsTest, AFailedCopyLeavesTheBoundObjectAlive) {
    Payload oClients(1);
    Output<Payload> oOutput("out", nullptr);
    oOutput.setBoundData(&oClients);
    ConstDataPointer<Payload> const spSource(ORVO_NEW Payload(2));
    Payload::bCopiesFail = true;
    EXPECT_THROW(oOutput = spSource, std::runtime_error);
    EXPECT_EQ(1, oClients.iValue_);
    EXPECT_EQ(2, Payload::nAlive);
}

TEST_F(OutputsTest, AnObjectWithMembersOfItsOwnIsReplacedWithoutLoss) {
    std::string sClients(100, 'a');
    Output<std::string> oOutput("out", nullptr);
    oOutput.setBoundData(&sClients);
    ConstDataPointer<std::string> const spSource(ORVO_NEW std::string(200, 'b'));
    oOutput = spSource;
    EXPECT_EQ(std::string(200, 'b'), sClients);
    EXPECT_EQ(std::string(200, 'b'), *spSource);
}

TEST_F(OutputsTest, AssigningToABoundOutputWithoutAnObjectIsRefused) {
    Output<Payload> oOutput("out", nullptr);
    oOutput.setBoundData(nullptr);
    ConstDataPointer<Payload> const spSource(ORVO_NEW Payload(2));
    ORVO_EXPECT_INTERNAL(oOutput = spSource, "Enforce spData_.get() != NULL");
}

} // namespace
