#include "orvo/data_flow/nodes/Node.h"

#include "orvo/data_flow/connectors/Connect.h"
#include "orvo/data_flow/controllers/Controller.h"
#include "orvo/data_flow/parameters/Parameter.h"
#include "tests/data_flow/connectors/Payload.h"
#include "tests/data_flow/nodes/TestNode.h"
#include "tests/support/DataFlowLayers.h"
#include "tests/support/Expect.h"
#include "tests/support/Slots.h"

#include <gtest/gtest.h>

#include <memory>
#include <sstream>
#include <stdexcept>
#include <string>
#include <thread>
#include <utility>
#include <vector>

namespace {

using namespace ORVO::DataFlow;
using ORVO::Test::OtherPayload;
using ORVO::Test::Payload;
using ORVO::Test::TestNode;

class NodeTest : public testing::Test {
protected:
    void SetUp() override { Payload::resetCounts(); }

    ORVO::Test::DataFlowLayers oLayers_;
};

TEST(NodeSlotsTest, HasItsOperationsInOrder) {
    using ORVO::Test::constSlotOf;
    using ORVO::Test::slotOf;
    struct OpenNode : Node {
        using Node::internalProcess;
        using Node::postProcess;
        using Node::preProcess;
    };
    // The destructor stands first.
    EXPECT_EQ(2, constSlotOf(&Node::debugWrite));
    EXPECT_EQ(3, slotOf(&Node::setController));
    EXPECT_EQ(4, slotOf(&Node::emit));
    EXPECT_EQ(5, constSlotOf(&Node::canEmit));
    EXPECT_EQ(6, slotOf(&Node::hasBufferChanged));
    EXPECT_EQ(7, slotOf(&Node::flush));
    EXPECT_EQ(8, slotOf(&Node::disconnect));
    EXPECT_EQ(9, slotOf(&Node::flushOutputs));
    EXPECT_EQ(10, slotOf(&Node::flushInputs));
    EXPECT_EQ(11, constSlotOf(&Node::isReady));
    EXPECT_EQ(12, slotOf(&Node::process));
    EXPECT_EQ(13, slotOf(&Node::processSlice));
    EXPECT_EQ(14, constSlotOf<Node>(&Node::asImageFilter));
    EXPECT_EQ(15, slotOf<Node>(&Node::asImageFilter));
    EXPECT_EQ(16, slotOf(&Node::rangeToProcess));
    EXPECT_EQ(17, slotOf(&OpenNode::preProcess));
    EXPECT_EQ(18, slotOf(&OpenNode::internalProcess));
    EXPECT_EQ(19, slotOf(&OpenNode::postProcess));
}

TEST_F(NodeTest, StartsIdleCleanAndEmpty) {
    Node oNode("n");
    EXPECT_EQ("n", oNode.name());
    EXPECT_EQ(nullptr, oNode.controller());
    EXPECT_EQ(0u, oNode.priority());
    EXPECT_EQ(Node::COLOR_NOT_VISITED, oNode.color());
    EXPECT_FALSE(oNode.isProcessing());
    EXPECT_FALSE(oNode.isDirty());
    EXPECT_EQ(0u, oNode.numberOfInputs());
    EXPECT_EQ(0u, oNode.numberOfOutputs());
    EXPECT_EQ(0u, oNode.numberOfParameters());
    EXPECT_TRUE(oNode.isReady());
    EXPECT_FALSE(oNode.keepsCache());
    EXPECT_FALSE(oNode.hasDirtyParameters());
}

TEST_F(NodeTest, TheMarksHaveTheirNumbers) {
    EXPECT_EQ(0, Node::COLOR_NOT_VISITED);
    EXPECT_EQ(1, Node::COLOR_DISCOVERED);
    EXPECT_EQ(2, Node::COLOR_FINISHED);
    Node oNode("n");
    oNode.setColor(Node::COLOR_FINISHED);
    EXPECT_EQ(Node::COLOR_FINISHED, oNode.color());
    oNode.setPriority(4000000000u);
    EXPECT_EQ(4000000000u, oNode.priority());
    oNode.setProcessing(true);
    EXPECT_TRUE(oNode.isProcessing());
    oNode.setProcessing(false);
    EXPECT_FALSE(oNode.isProcessing());
}

TEST_F(NodeTest, TheBaseOperationsDoNothing) {
    Node oNode("n");
    oNode.emit();
    EXPECT_FALSE(oNode.canEmit());
    EXPECT_TRUE(oNode.hasBufferChanged());
    EXPECT_EQ(nullptr, oNode.asImageFilter());
    EXPECT_EQ(nullptr, std::as_const(oNode).asImageFilter());
    Node::BlockedRange const oRange = oNode.rangeToProcess();
    EXPECT_EQ(0u, oRange.unitsPerItem);
    EXPECT_EQ(0u, oRange.items);
    EXPECT_EQ(0u, oRange.reserved);
    oNode.process();
    ORVO_EXPECT_INTERNAL(oNode.processSlice(0, 1), "0");
}

TEST_F(NodeTest, RemembersTheControllerItWasAddedToLast) {
    Controller oFirst;
    Controller oSecond;
    Node oNode("n");
    oNode.setController(oFirst);
    EXPECT_EQ(&oFirst, oNode.controller());
    oNode.setController(oSecond);
    EXPECT_EQ(&oSecond, oNode.controller());
}

TEST_F(NodeTest, FindsConnectorsByNumber) {
    TestNode oNode("n");
    auto& oInput = oNode.addConstInput("a");
    auto& oInput2 = oNode.addMutableInput<OtherPayload>("b");
    auto& oOutput = oNode.addConstOutput("a");
    EXPECT_EQ(2u, oNode.numberOfInputs());
    EXPECT_EQ(1u, oNode.numberOfOutputs());
    EXPECT_EQ(&oInput, oNode.input(0));
    EXPECT_EQ(&oInput2, std::as_const(oNode).input(1));
    EXPECT_EQ(&oOutput, oNode.output(0));
    EXPECT_EQ(&oOutput, std::as_const(oNode).output(0));
    for (std::size_t const i : {std::size_t(2), std::size_t(5), ~std::size_t(0)}) {
        ORVO_EXPECT_INTERNAL(oNode.input(i), "Range error: iInput < aInputs_.size()");
        ORVO_EXPECT_INTERNAL(std::as_const(oNode).input(i), "Range error: iInput < aInputs_.size()");
        ORVO_EXPECT_INTERNAL(oNode.output(i), "Range error: iOutput < aOutputs_.size()");
        ORVO_EXPECT_INTERNAL(std::as_const(oNode).output(i), "Range error: iOutput < aOutputs_.size()");
    }
}

TEST_F(NodeTest, FindsTheFirstConnectorOfAName) {
    TestNode oNode("n");
    auto& oInput = oNode.addConstInput("a");
    oNode.addConstInput("a");
    auto& oEmpty = oNode.addConstInput("");
    auto& oOutput = oNode.addConstOutput("a");
    oNode.addConstOutput("a");
    EXPECT_EQ(&oInput, oNode.input("a"));
    EXPECT_EQ(&oInput, std::as_const(oNode).input("a"));
    EXPECT_EQ(&oEmpty, oNode.input(""));
    EXPECT_EQ(&oOutput, oNode.output("a"));
    EXPECT_EQ(&oOutput, std::as_const(oNode).output("a"));
    EXPECT_EQ(nullptr, oNode.input("x"));
    EXPECT_EQ(nullptr, std::as_const(oNode).input("A"));
    EXPECT_EQ(nullptr, oNode.output("x"));
    EXPECT_EQ(nullptr, std::as_const(oNode).output(""));
}

TEST_F(NodeTest, RefusesNullConnectorsAndParameters) {
    TestNode oNode("n");
    ORVO_EXPECT_INTERNAL(oNode.addInput(nullptr), "Enforce pInput != NULL");
    ORVO_EXPECT_INTERNAL(oNode.addOutput(nullptr), "Enforce pOutput != NULL");
    ORVO_EXPECT_INTERNAL(oNode.registerParameter(nullptr), "Enforce pParameter != NULL");
    EXPECT_EQ(0u, oNode.numberOfInputs());
    EXPECT_EQ(0u, oNode.numberOfOutputs());
    EXPECT_EQ(0u, oNode.numberOfParameters());
}

TEST_F(NodeTest, RunsItsThreePhasesInOrder) {
    TestNode oProducer("p");
    auto& oOutput = oProducer.addConstOutput("out");
    TestNode oConsumer("c");
    auto& oInput = oConsumer.addConstInput("in");
    Connect(oInput, oOutput);
    oOutput.setData(ORVO_NEW Payload(3));
    int iSeen = 0;
    oConsumer.pfnWork_ = [&] {
        iSeen = oInput->iValue_;
        EXPECT_FALSE(oOutput.hasData());
    };
    oConsumer.process();
    EXPECT_EQ((std::vector<std::string>{"preProcess", "internalProcess", "postProcess"}), oConsumer.aCalls_);
    EXPECT_EQ(3, iSeen);
    EXPECT_FALSE(oInput.hasData());
    EXPECT_EQ(0, Payload::nAlive);
}

/// An input that notes what its node does with it.
class LoggedInput : public ConstInput<Payload> {
public:
    explicit LoggedInput(std::string const& sName) : ConstInput<Payload>(sName, nullptr) {}
    void fetchInput() override { pCalls_->push_back("fetch " + name()); }
    void removeData() override { pCalls_->push_back("remove " + name()); }
    void flushInput() override { pCalls_->push_back("flush " + name()); }

    void addTo(TestNode& oNode) {
        pCalls_ = &oNode.aCalls_;
        oNode.addInput(this);
    }

private:
    std::vector<std::string>* pCalls_ = nullptr;
};

TEST_F(NodeTest, FetchesAndDropsInInputOrder) {
    // They live longer than the node, which disconnects them when it dies.
    LoggedInput oFirst("first");
    LoggedInput oSecond("second");
    TestNode oNode("n");
    oFirst.addTo(oNode);
    oSecond.addTo(oNode);
    oNode.process();
    oNode.flushInputs();
    EXPECT_EQ((std::vector<std::string>{"preProcess", "fetch first", "fetch second", "internalProcess",
                                        "postProcess", "remove first", "remove second", "flush first",
                                        "flush second"}),
              oNode.aCalls_);
}

TEST_F(NodeTest, AFailedFetchLeavesTheInputsBeforeItForTheFlush) {
    TestNode oProducer("p");
    auto& oOutput = oProducer.addConstOutput("out");
    TestNode oConsumer("c");
    auto& oFirst = oConsumer.addConstInput("first");
    oConsumer.addConstInput("second");
    Connect(oFirst, oOutput);
    oOutput.setData(ORVO_NEW Payload(3));
    ORVO_EXPECT_INTERNAL(oConsumer.process(), "Enforce pConnectedOutput_ != NULL");
    EXPECT_TRUE(oFirst.hasData());
    EXPECT_EQ((std::vector<std::string>{"preProcess"}), oConsumer.aCalls_);
    oConsumer.flush();
    EXPECT_FALSE(oFirst.hasData());
}

TEST_F(NodeTest, AThrowLeavesTheInputsForTheFlush) {
    TestNode oProducer("p");
    auto& oOutput = oProducer.addConstOutput("out");
    TestNode oConsumer("c");
    auto& oInput = oConsumer.addConstInput("in");
    auto& oResult = oConsumer.addConstOutput("result");
    Connect(oInput, oOutput);
    oOutput.setData(ORVO_NEW Payload(3));
    oConsumer.pfnWork_ = [&] {
        oResult.setData(ORVO_NEW Payload(4));
        throw std::runtime_error("broken");
    };
    oConsumer.setProcessing(true);
    EXPECT_THROW(oConsumer.process(), std::runtime_error);
    EXPECT_TRUE(oInput.hasData());
    EXPECT_TRUE(oConsumer.isProcessing());
    oConsumer.flush();
    EXPECT_FALSE(oInput.hasData());
    EXPECT_FALSE(oResult.hasData());
    EXPECT_FALSE(oConsumer.isProcessing());
    EXPECT_EQ(0, Payload::nAlive);
}

TEST_F(NodeTest, FlushesItsInputsThenItsOutputsAndThenCountsAsIdle) {
    struct Flushed : TestNode {
        using TestNode::TestNode;
        void flushInputs() override {
            EXPECT_TRUE(isProcessing());
            aCalls_.emplace_back("inputs");
        }
        void flushOutputs() override {
            EXPECT_TRUE(isProcessing());
            aCalls_.emplace_back("outputs");
        }
    };
    Flushed oNode("n");
    oNode.setProcessing(true);
    oNode.flush();
    EXPECT_EQ((std::vector<std::string>{"inputs", "outputs"}), oNode.aCalls_);
    EXPECT_FALSE(oNode.isProcessing());
}

TEST_F(NodeTest, FlushSparesBoundOutputs) {
    Payload oClients(1);
    TestNode oNode("n");
    auto& oBound = oNode.addConstOutput("bound");
    auto& oOutput = oNode.addConstOutput("out");
    auto& oInput = oNode.addConstInput("in");
    oBound.setBoundData(&oClients);
    oOutput.setData(ORVO_NEW Payload(2));
    oInput.setData(ORVO_NEW Payload(3));
    oNode.flushOutputs();
    EXPECT_TRUE(oBound.hasData());
    EXPECT_FALSE(oOutput.hasData());
    EXPECT_TRUE(oInput.hasData());
    oNode.flushInputs();
    EXPECT_FALSE(oInput.hasData());
    EXPECT_EQ(1, Payload::nAlive);
}

TEST_F(NodeTest, IsReadyWhenItsInputsAreAndItsResultIsNot) {
    Payload oClients(1);
    TestNode oProducer("p");
    auto& oFirst = oProducer.addConstOutput("first");
    auto& oSecond = oProducer.addConstOutput("second");
    TestNode oNode("n");
    auto& oIn1 = oNode.addConstInput("in1");
    auto& oIn2 = oNode.addConstInput("in2");
    auto& oOut1 = oNode.addConstOutput("out1");
    auto& oOut2 = oNode.addConstOutput("out2");

    EXPECT_FALSE(oNode.isReady()) << "inputs without partners";
    Connect(oIn1, oFirst);
    Connect(oIn2, oSecond);
    EXPECT_FALSE(oNode.isReady()) << "no data";
    oFirst.setData(ORVO_NEW Payload(1));
    EXPECT_FALSE(oNode.isReady()) << "data for one of two";
    oSecond.setData(ORVO_NEW Payload(1));
    EXPECT_TRUE(oNode.isReady());
    oOut2.setData(ORVO_NEW Payload(1));
    EXPECT_FALSE(oNode.isReady()) << "the result is there";
    oOut2.flushOutput();
    EXPECT_TRUE(oNode.isReady());
    oOut1.setBoundData(&oClients);
    EXPECT_TRUE(oNode.isReady()) << "a bound output always holds data";
    oIn2.disconnect();
    EXPECT_FALSE(oNode.isReady()) << "a partner lost";
}

TEST_F(NodeTest, ABoundResultOfTheProducerCountsAsData) {
    Payload oClients(1);
    TestNode oProducer("p");
    auto& oOutput = oProducer.addConstOutput("out");
    TestNode oNode("n");
    Connect(oNode.addConstInput("in"), oOutput);
    oOutput.setBoundData(&oClients);
    EXPECT_TRUE(oNode.isReady());
    ORVO_EXPECT_INTERNAL(oNode.process(), "!this->bound()");
}

TEST_F(NodeTest, DisconnectClearsBothEndsOfAllConnectors) {
    TestNode oProducer("p");
    auto& oOutput = oProducer.addConstOutput("out");
    auto& oOutput2 = oProducer.addConstOutput("out2");
    TestNode oNode("n");
    auto& oIn1 = oNode.addConstInput("in1");
    auto& oIn2 = oNode.addConstInput("in2");
    auto& oResult = oNode.addConstOutput("result");
    auto& oSpare = oNode.addConstOutput("spare");
    TestNode oConsumer("c");
    auto& oIn = oConsumer.addConstInput("in");
    Connect(oIn1, oOutput);
    Connect(oIn2, oOutput2);
    Connect(oIn, oResult);
    oNode.disconnect();
    for (OutputConnector const* const pOutput : {&oOutput, &oOutput2, &oResult, &oSpare}) {
        EXPECT_EQ(nullptr, pOutput->connectedInput());
    }
    for (InputConnector const* const pInput : {&oIn1, &oIn2, &oIn}) {
        EXPECT_EQ(nullptr, pInput->connectedOutput());
    }
    oNode.disconnect();
}

TEST_F(NodeTest, WhoeverPollsTheEndOfARunSeesWhatItWrote) {
    TestNode oNode("n");
    int iWritten = 0;
    oNode.setProcessing(true);
    std::thread oThread([&] {
        iWritten = 7;
        oNode.setProcessing(false);
    });
    while (oNode.isProcessing()) {
        std::this_thread::yield();
    }
    EXPECT_EQ(7, iWritten);
    oThread.join();
}

TEST_F(NodeTest, NeighboursMayDieInAnyOrderOnceDisconnected) {
    for (bool const bProducerFirst : {true, false}) {
        auto spProducer = std::make_unique<TestNode>("p");
        auto spConsumer = std::make_unique<TestNode>("c");
        auto& oOutput = spProducer->addConstOutput("out");
        auto& oInput = spConsumer->addConstInput("in");
        Connect(oInput, oOutput);
        oOutput.keepCache(true);
        oOutput.setData(ORVO_NEW Payload(1));
        spConsumer->pfnWork_ = [] {};
        oInput.fetchInput();
        // The node's destructor disconnects here, as that of an owner would.
        if (bProducerFirst) {
            spProducer.reset();
            EXPECT_EQ(nullptr, oInput.connectedOutput());
            EXPECT_EQ(1, oInput->iValue_);
            spConsumer.reset();
        } else {
            spConsumer.reset();
            EXPECT_EQ(nullptr, oOutput.connectedInput());
            EXPECT_EQ(1, oOutput->iValue_);
            spProducer.reset();
        }
        EXPECT_EQ(0, Payload::nAlive);
    }
}

TEST_F(NodeTest, DestructorsDoNotTouchTheirPartners) {
    // Connectors that stay connected die in any order; only their use afterwards would be an error.
    for (bool const bProducerFirst : {true, false}) {
        auto spOutput = std::make_unique<ConstOutput<Payload>>("out", nullptr);
        auto spInput = std::make_unique<ConstInput<Payload>>("in", nullptr);
        Connect(*spInput, *spOutput);
        if (bProducerFirst) {
            OutputConnector const* const pGone = spOutput.get();
            spOutput.reset();
            EXPECT_EQ(pGone, spInput->connectedOutput());
        } else {
            InputConnector const* const pGone = spInput.get();
            spInput.reset();
            EXPECT_EQ(pGone, spOutput->connectedInput());
        }
    }
}

TEST_F(NodeTest, DumpsItsConnections) {
    TestNode oProducer("src");
    auto& oOutput = oProducer.addConstOutput("image");
    TestNode oNode("blur");
    auto& oInput = oNode.addConstInput("in");
    auto& oResult = oNode.addConstOutput("out");
    oNode.addConstOutput("spare");
    TestNode oSecondBlur("blur");
    auto& oNext = oSecondBlur.addConstInput("source");
    Connect(oInput, oOutput);
    Connect(oNext, oResult);

    std::ostringstream oText;
    oText << oNode;
    EXPECT_EQ("Node blur [0]\n"
              "  1 inputs\n"
              "  src [0] : image -> blur [0] : in\n"
              "  2 outputs\n"
              "  blur [0] : out -> blur [1] : source\n"
              "  blur [0] : spare -> \n",
              oText.str());

    std::ostringstream oOther;
    oProducer.debugWrite(oOther);
    EXPECT_EQ("Node src [0]\n  0 inputs\n  1 outputs\n  src [0] : image -> blur [0] : in\n", oOther.str());
}

TEST_F(NodeTest, AnUnconnectedInputCannotBeDumped) {
    TestNode oNode("blur");
    auto& oInput = oNode.addConstInput("in");
    std::ostringstream oText;
    ORVO_EXPECT_INTERNAL(oText << oNode, "Enforce pConnectedOutput_ != NULL");
    EXPECT_EQ("", oText.str());
    ConstOutput<Payload> oOutput("out", nullptr);
    Connect(oInput, oOutput);
    ORVO_EXPECT_INTERNAL(oText << oNode, "Enforce pNode != NULL");
    EXPECT_EQ("", oText.str());
    oOutput.disconnect();
}

TEST_F(NodeTest, HoldsItsParametersWithoutOwning) {
    Parameter<int> oFirst(1, "a");
    Parameter<float> oSecond(2.0f, "b");
    Parameter<int> oThird(3, "a");
    {
        TestNode oNode("n");
        oNode.registerParameter(&oFirst);
        oNode.registerParameter(&oSecond);
        oNode.registerParameter(&oThird);
        EXPECT_EQ(3u, oNode.numberOfParameters());
        EXPECT_EQ(&oFirst, oNode.parameter(0));
        EXPECT_EQ(&oThird, std::as_const(oNode).parameter(2));
        EXPECT_EQ(&oFirst, oNode.parameter("a"));
        EXPECT_EQ(&oSecond, std::as_const(oNode).parameter("b"));
        EXPECT_EQ(nullptr, oNode.parameter("c"));
        EXPECT_EQ(nullptr, std::as_const(oNode).parameter(""));
        ORVO_EXPECT_INTERNAL(oNode.parameter(3), "Range error: iParameter < size()");
        ORVO_EXPECT_INTERNAL(std::as_const(oNode).parameter(3), "Range error: iParameter < size()");
        EXPECT_EQ(3u, oNode.parameters().size());
        EXPECT_EQ(&oSecond, std::as_const(oNode).parameters().parameter(1).get());
        EXPECT_TRUE(oNode.hasUniqueName(&oThird));
        EXPECT_TRUE(oNode.hasUniqueName(nullptr));
    }
    EXPECT_EQ(1, oFirst.value());
}

} // namespace
