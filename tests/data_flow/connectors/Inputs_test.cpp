#include "orvo/data_flow/connectors/Inputs.h"

#include "orvo/core/memory/AllocationFailure.h"
#include "orvo/data_flow/connectors/Connect.h"
#include "tests/data_flow/connectors/Payload.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

#include <new>
#include <type_traits>
#include <utility>

namespace {

using namespace ORVO::DataFlow;
using ORVO::Test::Payload;

template <typename AnyInput>
class InputsTest : public testing::Test {
protected:
    void SetUp() override { Payload::resetCounts(); }
    void TearDown() override { EXPECT_EQ(0, Payload::nAlive); }

    template <typename AnyConnector>
    static void expectHolds(AnyConnector const& oConnector, Payload const* pPayload) {
        EXPECT_EQ(pPayload, oConnector.get());
        EXPECT_EQ(pPayload, oConnector.data());
    }
};

using BothInputs = testing::Types<ConstInput<Payload>, Input<Payload>>;
TYPED_TEST_SUITE(InputsTest, BothInputs);

TYPED_TEST(InputsTest, AccessNeedsAnObject) {
    TypeParam oInput("in", nullptr);
    this->expectHolds(oInput, nullptr);
    ORVO_EXPECT_INTERNAL((void)oInput->iValue_, "Enforce spData_.get() != NULL");
    ORVO_EXPECT_INTERNAL(*oInput, "Enforce spData_.get() != NULL");
    ORVO_EXPECT_INTERNAL((void)std::as_const(oInput)->iValue_, "Enforce spData_.get() != NULL");
    ORVO_EXPECT_INTERNAL(*std::as_const(oInput), "Enforce spData_.get() != NULL");
    oInput.setData(ORVO_NEW Payload(3));
    EXPECT_EQ(3, oInput->iValue_);
    EXPECT_EQ(3, (*std::as_const(oInput)).iValue_);
}

TYPED_TEST(InputsTest, FetchingNeedsAPartner) {
    TypeParam oInput("in", nullptr);
    ORVO_EXPECT_INTERNAL(oInput.fetchInput(), "Enforce pConnectedOutput_ != NULL");
}

TYPED_TEST(InputsTest, KnowsItsPartnerByItsType) {
    struct OpenInput : TypeParam {
        using TypeParam::typedOutput;
        using TypeParam::TypeParam;
    };
    static_assert(
        std::is_same_v<decltype(std::declval<OpenInput const&>().typedOutput()), OutputTemplate<Payload>*>);
    OpenInput oInput("in", nullptr);
    ORVO_EXPECT_INTERNAL((void)oInput.typedOutput(), "Enforce pConnectedOutput_ != NULL");
    Output<Payload> oOutput("out", nullptr);
    Connect(oInput, oOutput);
    EXPECT_EQ(&oOutput, oInput.typedOutput());
    oInput.disconnect();
}

TYPED_TEST(InputsTest, SetDataTakesOrShares) {
    TypeParam oInput("in", nullptr);
    Payload* const pPayload = ORVO_NEW Payload(1);
    oInput.setData(pPayload);
    this->expectHolds(oInput, pPayload);
    ConstDataPointer<Payload> const spOther(ORVO_NEW Payload(2));
    oInput.setData(spOther);
    this->expectHolds(oInput, spOther.get());
    EXPECT_EQ(2, spOther.useCount());
    EXPECT_EQ(1, Payload::nAlive);
}

TYPED_TEST(InputsTest, RemoveAndFlushDropTheObject) {
    TypeParam oInput("in", nullptr);
    oInput.removeData();
    oInput.setData(ORVO_NEW Payload(1));
    oInput.removeData();
    this->expectHolds(oInput, nullptr);
    EXPECT_EQ(0, Payload::nAlive);
    oInput.setData(ORVO_NEW Payload(1));
    oInput.flushInput();
    this->expectHolds(oInput, nullptr);
    EXPECT_EQ(0, Payload::nAlive);
}

TYPED_TEST(InputsTest, ABoundInputIsNotSetOrEmptied) {
    Payload const oClients(5);
    TypeParam oInput("in", nullptr);
    Payload* const pHeld = ORVO_NEW Payload(1);
    oInput.setData(pHeld);
    oInput.setBoundData(&oClients);
    Payload* const pRefused = ORVO_NEW Payload(2);
    ORVO_EXPECT_INTERNAL(oInput.setData(pRefused), "!this->bound()");
    ORVO_EXPECT_INTERNAL(oInput.setData(ConstDataPointer<Payload>()), "!this->bound()");
    ORVO_EXPECT_INTERNAL(oInput.removeData(), "!this->bound()");
    ORVO_EXPECT_INTERNAL(oInput.flushInput(), "!this->bound()");
    EXPECT_EQ(&oClients, oInput.data());
    EXPECT_EQ(pHeld, oInput.get());
    // A refused object stays its giver's.
    ORVO::trackedDelete(pRefused);
}

TYPED_TEST(InputsTest, ReleaseHandsTheObjectToTheCaller) {
    TypeParam oInput("in", nullptr);
    EXPECT_EQ(nullptr, oInput.releaseData());
    Payload* const pPayload = ORVO_NEW Payload(1);
    oInput.setData(pPayload);
    EXPECT_EQ(pPayload, oInput.releaseData());
    EXPECT_EQ(nullptr, oInput.get());
    EXPECT_EQ(pPayload, oInput.data());
    EXPECT_EQ(1, Payload::nAlive);
    ORVO::trackedDelete(pPayload);
}

TYPED_TEST(InputsTest, ReleaseNeedsReleasableOwnership) {
    TypeParam oInput("in", nullptr);
    ConstDataPointer<Payload> spRegular;
    spRegular.setDataWithRegularOwnership(ORVO_NEW Payload(1));
    oInput.setData(spRegular);
    ORVO_EXPECT_INTERNAL((void)oInput.releaseData(), "Enforce deleter != NULL");
    this->expectHolds(oInput, spRegular.get());
}

TYPED_TEST(InputsTest, MovesOnIntoAPointer) {
    TypeParam oInput("in", nullptr);
    Payload* const pPayload = ORVO_NEW Payload(1);
    oInput.setData(pPayload);
    ConstDataPointer<Payload> spDestination(ORVO_NEW Payload(2));
    oInput.moveTo(spDestination);
    EXPECT_EQ(pPayload, spDestination.get());
    this->expectHolds(oInput, nullptr);
    EXPECT_EQ(1, Payload::nAlive);
}

TYPED_TEST(InputsTest, MovesOnIntoAConstOutput) {
    TypeParam oInput("in", nullptr);
    ConstDataPointer<Payload> const spShared(ORVO_NEW Payload(1));
    oInput.setData(spShared);
    ConstOutput<Payload> oOutput("out", nullptr);
    oOutput.setData(ORVO_NEW Payload(2));
    oInput.moveTo(oOutput);
    this->expectHolds(oOutput, spShared.get());
    this->expectHolds(oInput, nullptr);
    EXPECT_EQ(1, Payload::nAlive);
    EXPECT_EQ(0, Payload::nCopies);
}

TYPED_TEST(InputsTest, MovesTheOnlyReferenceOnIntoAMutableOutput) {
    TypeParam oInput("in", nullptr);
    Payload* const pPayload = ORVO_NEW Payload(1);
    oInput.setData(pPayload);
    Output<Payload> oOutput("out", nullptr);
    oInput.moveTo(oOutput);
    this->expectHolds(oOutput, pPayload);
    this->expectHolds(oInput, nullptr);
    EXPECT_EQ(0, Payload::nCopies);
}

TYPED_TEST(InputsTest, MovesNothingOn) {
    TypeParam oInput("in", nullptr);
    ConstOutput<Payload> oConstOutput("out", nullptr);
    Output<Payload> oOutput("out", nullptr);
    oConstOutput.setData(ORVO_NEW Payload(1));
    oOutput.setData(ORVO_NEW Payload(1));
    oInput.moveTo(oConstOutput);
    oInput.moveTo(oOutput);
    this->expectHolds(oConstOutput, nullptr);
    this->expectHolds(oOutput, nullptr);
}

class InputsAssignmentTest : public InputsTest<void> {};

TEST_F(InputsAssignmentTest, AConstInputThatSharesGivesAMutableOutputACopy) {
    ConstInput<Payload> oInput("in", nullptr);
    ConstDataPointer<Payload> const spShared(ORVO_NEW Payload(1));
    oInput.setData(spShared);
    Output<Payload> oOutput("out", nullptr);
    oInput.moveTo(oOutput);
    ASSERT_TRUE(oOutput.hasData());
    expectHolds(oOutput, oOutput.get());
    EXPECT_NE(spShared.get(), oOutput.get());
    expectHolds(oInput, nullptr);
    oOutput->iValue_ = 2;
    EXPECT_EQ(1, spShared->iValue_);
    EXPECT_EQ(1, spShared.useCount());
}

TEST_F(InputsAssignmentTest, AFailedCopyLeavesTheSharingInputAsItWas) {
    ConstInput<Payload> oInput("in", nullptr);
    ConstDataPointer<Payload> const spShared(ORVO_NEW Payload(1));
    oInput.setData(spShared);
    Output<Payload> oOutput("out", nullptr);
    Payload::bCopiesFail = true;
    EXPECT_THROW(oInput.moveTo(oOutput), std::runtime_error);
    expectHolds(oInput, spShared.get());
    expectHolds(oOutput, nullptr);
}

TEST_F(InputsAssignmentTest, AConstInputSharesTheOutputsObject) {
    ConstOutput<Payload> oOutput("out", nullptr);
    Payload* const pPayload = ORVO_NEW Payload(1);
    oOutput.setData(pPayload);
    ConstInput<Payload> oInput("in", nullptr);
    oInput = oOutput;
    expectHolds(oInput, pPayload);
    expectHolds(oOutput, pPayload);
    EXPECT_EQ(0, Payload::nCopies);
    oOutput.flushOutput();
    oInput = oOutput;
    expectHolds(oInput, nullptr);
}

TEST_F(InputsAssignmentTest, AMutableInputCopiesTheOutputsObject) {
    ConstOutput<Payload> oOutput("out", nullptr);
    oOutput.setData(ORVO_NEW Payload(1));
    Input<Payload> oInput("in", nullptr);
    oInput = oOutput;
    ASSERT_TRUE(oInput.hasData());
    EXPECT_NE(oOutput.get(), oInput.get());
    expectHolds(oInput, oInput.get());
    EXPECT_EQ(1, oInput->iValue_);
    EXPECT_EQ(1, Payload::nCopies);
    oOutput.flushOutput();
    ORVO_EXPECT_INTERNAL(oInput = oOutput, "Enforce spData_.get() != NULL");
    EXPECT_EQ(1, oInput->iValue_);
}

TEST_F(InputsAssignmentTest, ABoundInputIsNotAssigned) {
    Payload const oClients(5);
    ConstOutput<Payload> oOutput("out", nullptr);
    oOutput.setData(ORVO_NEW Payload(1));
    ConstInput<Payload> oConstInput("in", nullptr);
    Input<Payload> oInput("in", nullptr);
    oConstInput.setBoundData(&oClients);
    oInput.setBoundData(&oClients);
    ORVO_EXPECT_INTERNAL(oConstInput = oOutput, "!this->bound()");
    ORVO_EXPECT_INTERNAL(oInput = oOutput, "!this->bound()");
    EXPECT_EQ(0, Payload::nCopies);
}

} // namespace
