// Whole graphs of nodes, run frame after frame by a controller.

#include "orvo/data_flow/connectors/Connect.h"
#include "orvo/data_flow/connectors/ParameterInput.h"
#include "orvo/data_flow/controllers/Controller.h"
#include "orvo/data_flow/nodes/Node.h"
#include "orvo/data_flow/parameters/Parameter.h"
#include "tests/data_flow/nodes/TestNode.h"
#include "tests/support/DataFlowLayers.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <random>
#include <string>
#include <vector>

namespace {

using namespace ORVO::DataFlow;
using ORVO::Test::TestNode;

using Number = std::uint64_t;

/// Computes 31 * (sum of what it fetches, times position + 1) + its value, and hands the result to every
/// consumer.
class SumNode : public Node {
public:
    SumNode(std::string const& sName, Number iValue) : Node(sName), oValue_(iValue, "value") {
        registerParameter(&oValue_);
    }
    ~SumNode() override { disconnect(); }

    /// Takes its next term from `oProducer`: each kind of input and of output occurs.
    void feedFrom(SumNode& oProducer, bool bConstOutput, bool bConstInput) {
        std::unique_ptr<OutputConnector> spOutput;
        if (bConstOutput) {
            spOutput = std::make_unique<ConstOutput<Number>>("out", &oProducer);
        } else {
            spOutput = std::make_unique<Output<Number>>("out", &oProducer);
        }
        std::unique_ptr<InputConnector> spInput;
        if (bConstInput) {
            spInput = std::make_unique<ConstInput<Number>>("in", this);
        } else {
            spInput = std::make_unique<Input<Number>>("in", this);
        }
        Connect(*spInput, *spOutput);
        addInput(spInput.get());
        oProducer.addOutput(spOutput.get());
        aProducers_.push_back(&oProducer);
        aOwnedInputs_.push_back(std::move(spInput));
        oProducer.aOwnedOutputs_.push_back(std::move(spOutput));
    }

    /// An output without a consumer, for the result of the graph.
    ConstOutput<Number>& addResult() {
        auto spOutput = std::make_unique<ConstOutput<Number>>("result", this);
        ConstOutput<Number>& oOutput = *spOutput;
        addOutput(&oOutput);
        aOwnedOutputs_.push_back(std::move(spOutput));
        return oOutput;
    }

    /// What the node must give, by definition.
    Number expected() const {
        Number iSum = 0;
        for (std::size_t i = 0; i < aProducers_.size(); ++i) {
            iSum += (i + 1) * aProducers_[i]->iExpected_;
        }
        return 31 * iSum + oValue_.value();
    }

    Parameter<Number> oValue_;
    Number iExpected_ = 0;
    int nRuns_ = 0;

protected:
    void internalProcess() override {
        ++nRuns_;
        Number iSum = 0;
        for (std::size_t i = 0; i < numberOfInputs(); ++i) {
            iSum += (i + 1) * *static_cast<Number const*>(input(i)->data());
            if (auto* const pMutable = dynamic_cast<Input<Number>*>(input(i))) {
                // It may do with the object what it likes: nobody else must notice.
                **pMutable = ~Number(0);
            }
        }
        ConstDataPointer<Number> const spResult(ORVO_NEW Number(31 * iSum + oValue_.value()));
        for (auto const& spOutput : aOwnedOutputs_) {
            if (auto* const pShared = dynamic_cast<ConstOutput<Number>*>(spOutput.get())) {
                *pShared = spResult;
            } else {
                dynamic_cast<Output<Number>&>(*spOutput) = spResult;
            }
        }
    }

private:
    std::vector<SumNode*> aProducers_;
    std::vector<std::unique_ptr<InputConnector>> aOwnedInputs_;
    std::vector<std::unique_ptr<OutputConnector>> aOwnedOutputs_;
};

/// A graph whose nodes stand in producer-first order; the last is the sink.
struct Graph {
    SumNode& add(Number iValue) {
        aNodes_.push_back(std::make_unique<SumNode>("sum", iValue));
        oController_.addNode(aNodes_.back().get());
        return *aNodes_.back();
    }

    void finish() {
        pResult_ = &aNodes_.back()->addResult();
        oController_.setSinkNode(aNodes_.back().get());
    }

    /// The dirty pass, then what is stale goes: the results of dirty nodes, and those that are left of a node
    /// which must run again for another consumer.
    void prepareFrame() {
        for (auto const& spNode : aNodes_) {
            spNode->updateDirtyState();
            std::size_t nFull = 0;
            for (std::size_t i = 0; i < spNode->numberOfOutputs(); ++i) {
                nFull += spNode->output(i)->hasData() ? 1 : 0;
            }
            if (spNode->isDirty() || nFull < spNode->numberOfOutputs()) {
                spNode->flushOutputs();
            }
            spNode->iExpected_ = spNode->expected();
        }
    }

    Number runFrame() {
        prepareFrame();
        oController_.process();
        return pResult_->hasData() ? **pResult_ : 0;
    }

    Controller oController_;
    std::vector<std::unique_ptr<SumNode>> aNodes_;
    ConstOutput<Number>* pResult_ = nullptr;
};

class NodeGraphTest : public testing::Test {
protected:
    ORVO::Test::DataFlowLayers oLayers_;
};

TEST_F(NodeGraphTest, OnlyTheChangedEndOfAChainRunsAgain) {
    Graph oGraph;
    for (Number i = 0; i < 5; ++i) {
        oGraph.add(i);
        if (i > 0) {
            oGraph.aNodes_[i]->feedFrom(*oGraph.aNodes_[i - 1], true, true);
        }
    }
    oGraph.finish();
    auto const runs = [&oGraph] {
        std::vector<int> aRuns;
        for (auto const& spNode : oGraph.aNodes_) {
            aRuns.push_back(spNode->nRuns_);
        }
        return aRuns;
    };
    oGraph.runFrame();
    EXPECT_EQ((std::vector<int>{1, 1, 1, 1, 1}), runs());
    // Nothing changed and the sink holds its result, so it does not run; but its input is empty, and is
    // pulled.
    oGraph.runFrame();
    EXPECT_EQ((std::vector<int>{2, 2, 2, 2, 1}), runs());
    // The first change finds nothing kept upstream of it; from then on the clean producer of the changed node
    // keeps.
    oGraph.aNodes_[3]->oValue_.setValue(10);
    EXPECT_EQ(oGraph.runFrame(), oGraph.aNodes_.back()->iExpected_);
    EXPECT_EQ((std::vector<int>{3, 3, 3, 3, 2}), runs());
    for (Number iValue = 11; iValue < 13; ++iValue) {
        oGraph.aNodes_[3]->oValue_.setValue(iValue);
        EXPECT_EQ(oGraph.runFrame(), oGraph.aNodes_.back()->iExpected_);
    }
    EXPECT_EQ((std::vector<int>{3, 3, 3, 5, 4}), runs());
}

TEST_F(NodeGraphTest, RandomGraphsGiveTheSameAsTheirDefinition) {
    std::mt19937 oRandom(20240607);
    auto const below = [&oRandom](std::size_t n) {
        return std::uniform_int_distribution<std::size_t>(0, n - 1)(oRandom);
    };
    for (int iGraph = 0; iGraph < 60; ++iGraph) {
        Graph oGraph;
        std::size_t const nNodes = 2 + below(12);
        for (std::size_t i = 0; i < nNodes; ++i) {
            SumNode& oNode = oGraph.add(below(1000));
            // Every node but the sink must have a consumer: the one before always feeds the one after.
            for (std::size_t nInputs = i == 0 ? 0 : 1 + below(3), j = 0; j < nInputs; ++j) {
                SumNode& oProducer = *oGraph.aNodes_[j == 0 ? i - 1 : below(i)];
                oNode.feedFrom(oProducer, below(2) == 0, below(2) == 0);
            }
        }
        oGraph.finish();
        EXPECT_TRUE(oGraph.oController_.findUnconnectedNodes() ==
                    std::vector<Node*>{oGraph.aNodes_.back().get()});
        for (int iFrame = 0; iFrame < 12; ++iFrame) {
            Number const iResult = oGraph.runFrame();
            ASSERT_EQ(oGraph.aNodes_.back()->iExpected_, iResult)
                << "graph " << iGraph << ", frame " << iFrame;
            for (std::size_t nChanges = below(3); nChanges > 0; --nChanges) {
                oGraph.aNodes_[below(nNodes)]->oValue_.setValue(below(1000));
            }
        }
    }
}

TEST_F(NodeGraphTest, AParameterFedByANodeTakesItsValueInTheFrame) {
    // The input that is made below lives longer than the node that lists it.
    std::unique_ptr<InputConnector, ORVO::ORVODeleter<InputConnector>> spInput;
    Graph oGraph;
    TestNode oCurve("curve");
    Number iNext = 5;
    auto& oCurveOutput = oCurve.addConstOutput<Number>("value");
    oCurve.pfnWork_ = [&] { oCurveOutput.setData(ORVO_NEW Number(iNext)); };
    SumNode& oSource = oGraph.add(1);
    SumNode& oSink = oGraph.add(2);
    spInput.reset(oSource.convertToConnector(&oSource.oValue_));
    Connect(*spInput, oCurveOutput);
    oSink.feedFrom(oSource, true, true);
    oGraph.finish();
    oGraph.oController_.addNode(&oCurve);
    for (iNext = 5; iNext < 8; ++iNext) {
        oGraph.oController_.flushGraph();
        oGraph.oController_.process();
        // The fed input counts as a term of the sum too: 31 * iNext + iNext, then 31 times that + 2.
        EXPECT_EQ(31 * (31 * iNext + iNext) + 2, **oGraph.pResult_);
        EXPECT_EQ(iNext, oSource.oValue_.value());
    }
    spInput->disconnect();
}

} // namespace
