#include "orvo/data_flow/connectors/Connector.h"

#include "orvo/data_flow/connectors/ConnectorNameEquals.h"
#include "tests/data_flow/connectors/Payload.h"
#include "tests/data_flow/nodes/TestNode.h"
#include "tests/support/DataFlowLayers.h"
#include "tests/support/Expect.h"
#include "tests/support/Slots.h"

#include <gtest/gtest.h>

#include <string>
#include <typeinfo>

namespace {

using namespace ORVO::DataFlow;
using ORVO::Test::Payload;
using ORVO::Test::TestNode;

class ConnectorTest : public testing::Test {
protected:
    ORVO::Test::DataFlowLayers oLayers_;
};

TEST(ConnectorSlotsTest, HaveTheirOperationsInOrder) {
    using ORVO::Test::constSlotOf;
    using ORVO::Test::slotOf;
    // The destructor stands first.
    EXPECT_EQ(2, constSlotOf(&Connector::datatype));
    EXPECT_EQ(3, slotOf(&Connector::setBoundData));
    EXPECT_EQ(4, slotOf(&InputConnector::fetchInput));
    EXPECT_EQ(5, slotOf(&InputConnector::removeData));
    EXPECT_EQ(6, slotOf(&InputConnector::canConnect));
    EXPECT_EQ(7, slotOf(&InputConnector::flushInput));
    EXPECT_EQ(4, slotOf(&OutputConnector::flushOutput));
    using AnyOutput = OutputTemplate<Payload>;
    EXPECT_EQ(5, slotOf(static_cast<void (AnyOutput::*)(Input<Payload>&)>(&AnyOutput::moveTo)));
    EXPECT_EQ(6, slotOf(static_cast<void (AnyOutput::*)(ConstInput<Payload>&)>(&AnyOutput::moveTo)));
}

TEST_F(ConnectorTest, KnowsItsNameNodeAndType) {
    TestNode oNode("n");
    ConstInput<Payload> oInput("in", &oNode);
    ConstOutput<Payload> oOutput("out", &oNode);
    EXPECT_EQ("in", oInput.name());
    EXPECT_EQ(&oNode, oInput.node());
    EXPECT_TRUE(oInput.datatype() == typeid(Payload));
    EXPECT_EQ("out", oOutput.name());
    EXPECT_EQ(&oNode, oOutput.node());
    EXPECT_TRUE(oOutput.datatype() == typeid(Payload));
    for (Connector const* const pConnector :
         {static_cast<Connector const*>(&oInput), static_cast<Connector const*>(&oOutput)}) {
        EXPECT_EQ(nullptr, pConnector->data());
        EXPECT_FALSE(pConnector->hasData());
        EXPECT_FALSE(pConnector->bound());
    }
    EXPECT_EQ(nullptr, oInput.connectedOutput());
    EXPECT_EQ(nullptr, oOutput.connectedInput());
}

TEST_F(ConnectorTest, SetDataPtrWritesTheAddressAlone) {
    ConstOutput<Payload> oOutput("out", nullptr);
    Payload const oPayload(1);
    oOutput.setDataPtr(&oPayload);
    EXPECT_EQ(&oPayload, oOutput.data());
    EXPECT_TRUE(oOutput.hasData());
    EXPECT_FALSE(oOutput.bound());
    EXPECT_EQ(nullptr, oOutput.get());
}

TEST_F(ConnectorTest, ACopyHasNameNodeAndBoundMarkButNoData) {
    TestNode oNode("n");
    Payload oPayload(1);
    ConstOutput<Payload> oOutput("out", &oNode);
    oOutput.setData(ORVO_NEW Payload(2));
    ConstOutput<Payload> const oPlainCopy(oOutput);
    EXPECT_EQ("out", oPlainCopy.name());
    EXPECT_EQ(&oNode, oPlainCopy.node());
    EXPECT_FALSE(oPlainCopy.bound());
    EXPECT_EQ(nullptr, oPlainCopy.data());
    EXPECT_EQ(nullptr, oPlainCopy.get());

    oOutput.setBoundData(&oPayload);
    ConstOutput<Payload> const oBoundCopy(oOutput);
    EXPECT_TRUE(oBoundCopy.bound());
    EXPECT_FALSE(oBoundCopy.hasData());
    EXPECT_EQ(nullptr, oBoundCopy.get());

    ConstInput<Payload> oInput("in", &oNode);
    oInput.setData(ORVO_NEW Payload(3));
    ConstInput<Payload> const oInputCopy(oInput);
    EXPECT_EQ("in", oInputCopy.name());
    EXPECT_EQ(&oNode, oInputCopy.node());
    EXPECT_FALSE(oInputCopy.hasData());
    EXPECT_EQ(nullptr, oInputCopy.get());
}

TEST_F(ConnectorTest, ACopyIsNotConnectedAndNotAskedToKeep) {
    TestNode oProducer("p");
    TestNode oConsumer("c");
    auto& oOutput = oProducer.addConstOutput("out");
    auto& oInput = oConsumer.addConstInput("in");
    ASSERT_TRUE(oInput.connect(&oOutput));
    oOutput.keepCache(true);

    ConstOutput<Payload> const oOutputCopy(oOutput);
    ConstInput<Payload> const oInputCopy(oInput);
    EXPECT_EQ(nullptr, oOutputCopy.connectedInput());
    EXPECT_EQ(nullptr, oInputCopy.connectedOutput());
    EXPECT_FALSE(oOutputCopy.keepsCache());
    EXPECT_EQ(&oInput, oOutput.connectedInput());
    EXPECT_EQ(&oOutput, oInput.connectedOutput());
}

TEST_F(ConnectorTest, BindingAnOutputHoldsTheClientsObjectWithoutOwning) {
    Payload::resetCounts();
    Payload oClients(4);
    {
        ConstOutput<Payload> oOutput("out", nullptr);
        oOutput.setData(ORVO_NEW Payload(1));
        oOutput.setBoundData(&oClients);
        EXPECT_TRUE(oOutput.bound());
        EXPECT_EQ(&oClients, oOutput.data());
        EXPECT_EQ(&oClients, oOutput.get());
        EXPECT_EQ(1, Payload::nAlive);
        oOutput.flushOutput();
        EXPECT_EQ(&oClients, oOutput.get());
        oOutput.setBoundData(nullptr);
        EXPECT_TRUE(oOutput.bound());
        EXPECT_FALSE(oOutput.hasData());
    }
    EXPECT_EQ(1, Payload::nAlive);
}

TEST_F(ConnectorTest, BindingAnInputMarksItAndKeepsTheAddress) {
    Payload const oClients(4);
    ConstInput<Payload> oInput("in", nullptr);
    oInput.setBoundData(&oClients);
    EXPECT_TRUE(oInput.bound());
    EXPECT_EQ(&oClients, oInput.data());
    ORVO_EXPECT_INTERNAL(oInput.setData(nullptr), "!this->bound()");
    ORVO_EXPECT_INTERNAL(oInput.setData(ConstDataPointer<Payload>()), "!this->bound()");
    // It owns nothing, so there is nothing to drop.
    oInput.removeData();
    EXPECT_EQ(&oClients, oInput.data());
}

TEST_F(ConnectorTest, NamesAreComparedByteForByte) {
    ConstOutput<Payload> const oOutput("out", nullptr);
    ConstOutput<Payload> const oEmpty("", nullptr);
    std::string const sWithZero("out\0", 4);
    EXPECT_TRUE(ConnectorNameEquals("out")(&oOutput));
    EXPECT_FALSE(ConnectorNameEquals("Out")(&oOutput));
    EXPECT_FALSE(ConnectorNameEquals("ou")(&oOutput));
    EXPECT_FALSE(ConnectorNameEquals("out ")(&oOutput));
    EXPECT_FALSE(ConnectorNameEquals(sWithZero)(&oOutput));
    EXPECT_FALSE(ConnectorNameEquals("")(&oOutput));
    EXPECT_TRUE(ConnectorNameEquals("")(&oEmpty));
    EXPECT_FALSE(ConnectorNameEquals("")(nullptr));
}

} // namespace
