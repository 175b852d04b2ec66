#include "orvo/data_flow/connectors/Connect.h"

#include "tests/data_flow/connectors/Payload.h"
#include "tests/data_flow/nodes/TestNode.h"
#include "tests/support/DataFlowLayers.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

namespace {

using namespace ORVO::DataFlow;
using ORVO::Test::OtherPayload;
using ORVO::Test::Payload;
using ORVO::Test::TestNode;

class ConnectTest : public testing::Test {
protected:
    /// Neither end of either pair knows of another partner.
    template <typename Out, typename In>
    static void expectPair(Out const& oOutput, In const& oInput) {
        EXPECT_EQ(static_cast<InputConnector const*>(&oInput), oOutput.connectedInput());
        EXPECT_EQ(static_cast<OutputConnector const*>(&oOutput), oInput.connectedOutput());
    }

    ORVO::Test::DataFlowLayers oLayers_;
    TestNode oFirst_{"first"};
    TestNode oSecond_{"second"};
    ConstOutput<Payload>& oOutput_ = oFirst_.addConstOutput("out");
    ConstOutput<Payload>& oOutput2_ = oFirst_.addConstOutput("out2");
    ConstInput<Payload>& oInput_ = oSecond_.addConstInput("in");
    Input<Payload>& oInput2_ = oSecond_.addMutableInput("in2");
    ConstInput<OtherPayload>& oOtherInput_ = oSecond_.addConstInput<OtherPayload>("other");
};

TEST_F(ConnectTest, BothArgumentOrdersDoTheSame) {
    Connect(oInput_, oOutput_);
    expectPair(oOutput_, oInput_);
    Connect(oOutput2_, oInput2_);
    expectPair(oOutput2_, oInput2_);
}

TEST_F(ConnectTest, ConnectingAgainChangesNothing) {
    Connect(oInput_, oOutput_);
    Connect(oInput_, oOutput_);
    expectPair(oOutput_, oInput_);
}

TEST_F(ConnectTest, AnInputLeavesItsFormerOutput) {
    Connect(oInput_, oOutput_);
    Connect(oInput_, oOutput2_);
    EXPECT_EQ(nullptr, oOutput_.connectedInput());
    expectPair(oOutput2_, oInput_);
}

TEST_F(ConnectTest, AnOutputLeavesItsFormerInput) {
    Connect(oInput_, oOutput_);
    Connect(oInput2_, oOutput_);
    EXPECT_EQ(nullptr, oInput_.connectedOutput());
    expectPair(oOutput_, oInput2_);
}

TEST_F(ConnectTest, BothEndsLeaveTheirFormerPartners) {
    Connect(oInput_, oOutput_);
    Connect(oInput2_, oOutput2_);
    Connect(oInput2_, oOutput_);
    EXPECT_EQ(nullptr, oInput_.connectedOutput());
    EXPECT_EQ(nullptr, oOutput2_.connectedInput());
    expectPair(oOutput_, oInput2_);
}

TEST_F(ConnectTest, RefusesAnotherTypeAndChangesNothing) {
    Connect(oInput_, oOutput_);
    EXPECT_FALSE(ConnectorsAreCompatible(oOutput_, oOtherInput_));
    ORVO_EXPECT_INTERNAL(Connect(oOtherInput_, oOutput_), "ConnectorsAreCompatible(out, in)");
    ORVO_EXPECT_INTERNAL(Connect(oOutput_, oOtherInput_), "ConnectorsAreCompatible(out, in)");
    expectPair(oOutput_, oInput_);
    EXPECT_EQ(nullptr, oOtherInput_.connectedOutput());
    EXPECT_FALSE(oOtherInput_.connect(&oOutput_));
    expectPair(oOutput_, oInput_);
    EXPECT_EQ(nullptr, oOtherInput_.connectedOutput());
}

TEST_F(ConnectTest, CompatibilityIsThatOfTheTypes) {
    EXPECT_TRUE(ConnectorsAreCompatible(oOutput_, oInput_));
    EXPECT_TRUE(ConnectorsAreCompatible(oInput_, oOutput_));
    EXPECT_TRUE(ConnectorsAreCompatible(oInput_, oInput2_));
    EXPECT_FALSE(ConnectorsAreCompatible(oInput_, oOtherInput_));
    EXPECT_TRUE(oInput_.canConnect(&oOutput_));
    EXPECT_TRUE(oInput2_.canConnect(&oOutput_));
    EXPECT_FALSE(oOtherInput_.canConnect(&oOutput_));
    EXPECT_FALSE(oInput_.canConnect(nullptr));
}

TEST_F(ConnectTest, ConnectMethodConnects) {
    EXPECT_TRUE(oInput_.connect(&oOutput_));
    expectPair(oOutput_, oInput_);
}

TEST_F(ConnectTest, ConnectingToNullClearsTheInputsEndAlone) {
    Connect(oInput_, oOutput_);
    EXPECT_TRUE(oInput_.connect(nullptr));
    EXPECT_EQ(nullptr, oInput_.connectedOutput());
    EXPECT_EQ(&oInput_, oOutput_.connectedInput());
    // The one-sided rest goes with the output's own disconnect.
    oOutput_.disconnect();
    EXPECT_EQ(nullptr, oOutput_.connectedInput());
}

TEST_F(ConnectTest, DisconnectOfTheInputClearsBothEnds) {
    Connect(oInput_, oOutput_);
    oInput_.disconnect();
    EXPECT_EQ(nullptr, oInput_.connectedOutput());
    EXPECT_EQ(nullptr, oOutput_.connectedInput());
    oInput_.disconnect();
    EXPECT_EQ(nullptr, oInput_.connectedOutput());
}

TEST_F(ConnectTest, DisconnectOfTheOutputClearsBothEnds) {
    Connect(oInput_, oOutput_);
    oOutput_.disconnect();
    EXPECT_EQ(nullptr, oInput_.connectedOutput());
    EXPECT_EQ(nullptr, oOutput_.connectedInput());
    oOutput_.disconnect();
    EXPECT_EQ(nullptr, oOutput_.connectedInput());
}

TEST_F(ConnectTest, ANodeMayFeedItself) {
    auto& oOwnInput = oFirst_.addConstInput("in");
    Connect(oOwnInput, oOutput_);
    expectPair(oOutput_, oOwnInput);
    EXPECT_FALSE(oFirst_.isReady());
    oFirst_.updateDirtyState();
    EXPECT_FALSE(oFirst_.isDirty());
    oFirst_.disconnect();
    EXPECT_EQ(nullptr, oOutput_.connectedInput());
    EXPECT_EQ(nullptr, oOwnInput.connectedOutput());
}

TEST_F(ConnectTest, TwoNodesMayFeedEachOther) {
    auto& oBackInput = oFirst_.addConstInput("back");
    auto& oBackOutput = oSecond_.addConstOutput("back");
    Connect(oInput_, oOutput_);
    Connect(oBackInput, oBackOutput);
    expectPair(oOutput_, oInput_);
    expectPair(oBackOutput, oBackInput);
    EXPECT_FALSE(oFirst_.isReady());
    EXPECT_FALSE(oSecond_.isReady());
    oSecond_.disconnect();
    EXPECT_EQ(nullptr, oOutput_.connectedInput());
    EXPECT_EQ(nullptr, oBackInput.connectedOutput());
    EXPECT_EQ(nullptr, oBackOutput.connectedInput());
}

TEST_F(ConnectTest, DataAvailableLooksAtTheProducer) {
    ORVO_EXPECT_INTERNAL((void)oInput_.dataAvailable(), "Enforce pConnectedOutput_ != NULL");
    Connect(oInput_, oOutput_);
    EXPECT_FALSE(oInput_.dataAvailable());
    oOutput_.setData(ORVO_NEW Payload(1));
    EXPECT_TRUE(oInput_.dataAvailable());
    EXPECT_FALSE(oInput_.hasData());
}

TEST_F(ConnectTest, ConnectorsWithoutANodeConnectToo) {
    ConstOutput<Payload> oOutput("", nullptr);
    Input<Payload> oInput("", nullptr);
    Connect(oOutput, oInput);
    EXPECT_FALSE(oOutput.keepsCache());
    oOutput.setData(ORVO_NEW Payload(3));
    oInput.fetchInput();
    EXPECT_EQ(3, oInput->iValue_);
    oInput.disconnect();
}

} // namespace
