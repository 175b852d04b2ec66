#include "orvo/data_flow/connectors/ParameterInput.h"

#include "orvo/core/math/Float.h"
#include "orvo/core/memory/AllocationFailure.h"
#include "orvo/data_flow/connectors/Connect.h"
#include "tests/data_flow/nodes/TestNode.h"
#include "tests/data_flow/parameters/ParameterFlags.h"
#include "tests/support/DataFlowLayers.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

#include <memory>
#include <new>
#include <typeinfo>

namespace {

using namespace ORVO::DataFlow;
using ORVO::Test::expectAllFlags;
using ORVO::Test::setAllClean;
using ORVO::Test::TestNode;

using OwnedInput = std::unique_ptr<InputConnector, ORVO::ORVODeleter<InputConnector>>;

class ParameterInputTest : public testing::Test {
protected:
    void SetUp() override {
        oNode_.registerParameter(&oRadius_);
        oProducer_.pfnWork_ = [this] { oOutput_.setData(ORVO_NEW float(fNext_)); };
    }

    ORVO::Test::DataFlowLayers oLayers_;
    /// Makes the parameter an input of the node.
    InputConnector& convert() {
        spInput_.reset(oNode_.convertToConnector(&oRadius_));
        return *spInput_;
    }

    Parameter<float> oRadius_{1.0f, "radius"};
    // Lives longer than the node that lists it.
    OwnedInput spInput_;
    TestNode oNode_{"blur"};
    TestNode oProducer_{"lfo"};
    ConstOutput<float>& oOutput_ = oProducer_.addConstOutput<float>("value");
    float fNext_ = 5.0f;
};

TEST_F(ParameterInputTest, ConvertingAppendsAnInputOfTheParametersNameAndType) {
    oNode_.addConstInput("image");
    InputConnector& oInput = convert();
    EXPECT_EQ(2u, oNode_.numberOfInputs());
    EXPECT_EQ(&oInput, oNode_.input(1));
    EXPECT_EQ(&oInput, oNode_.input("radius"));
    EXPECT_EQ(&oNode_, oInput.node());
    EXPECT_TRUE(oInput.datatype() == typeid(float));
    EXPECT_EQ(1u, oNode_.numberOfParameters());
}

TEST_F(ParameterInputTest, EveryRunSetsTheParameter) {
    InputConnector& oInput = convert();
    Connect(oInput, oOutput_);
    for (float const fValue : {5.0f, 7.0f}) {
        fNext_ = fValue;
        oProducer_.process();
        oNode_.process();
        EXPECT_EQ(fValue, oRadius_.value());
        EXPECT_FALSE(oInput.hasData());
        EXPECT_FALSE(oOutput_.hasData());
    }
}

TEST_F(ParameterInputTest, AnUnchangedValueTouchesNoFlag) {
    InputConnector& oInput = convert();
    Connect(oInput, oOutput_);
    setAllClean(oRadius_);
    fNext_ = 1.0f;
    oProducer_.process();
    oNode_.process();
    expectAllFlags(oRadius_, false);
    fNext_ = 2.0f;
    oProducer_.process();
    oNode_.process();
    expectAllFlags(oRadius_, true);
}

TEST_F(ParameterInputTest, AKeptValueIsShared) {
    InputConnector& oInput = convert();
    Connect(oInput, oOutput_);
    oOutput_.keepCache(true);
    oProducer_.process();
    oNode_.process();
    EXPECT_EQ(5.0f, oRadius_.value());
    EXPECT_TRUE(oOutput_.hasData());
}

TEST_F(ParameterInputTest, AMutableOutputFeedsItToo) {
    Output<float> oMutable("value", nullptr);
    InputConnector& oInput = convert();
    Connect(oInput, oMutable);
    oMutable.setData(ORVO_NEW float(8.0f));
    oInput.fetchInput();
    EXPECT_EQ(8.0f, oRadius_.value());
    oInput.disconnect();
}

TEST_F(ParameterInputTest, FetchingNeedsAPartnerAndAValue) {
    InputConnector& oInput = convert();
    ORVO_EXPECT_INTERNAL(oInput.fetchInput(), "Enforce pConnectedOutput_ != NULL");
    Connect(oInput, oOutput_);
    ORVO_EXPECT_INTERNAL(oInput.fetchInput(), "Enforce spData_.get() != NULL");
    EXPECT_EQ(1.0f, oRadius_.value());
}

TEST_F(ParameterInputTest, NullParametersAreRefused) {
    ORVO_EXPECT_INTERNAL(oNode_.convertToConnector(nullptr), "Enforce pParameter != NULL");
    ORVO_EXPECT_INTERNAL(ParameterInput<float>("x", &oNode_, nullptr), "Enforce pParameter != NULL");
    EXPECT_EQ(0u, oNode_.numberOfInputs());
}

TEST_F(ParameterInputTest, AParameterThatMakesNoInputIsRefused) {
    struct Closed : Parameter<float> {
        Closed() : Parameter<float>(1.0f, "closed") {}
        InputConnector* createProxyConnector(Node*) override { return nullptr; }
    };
    Closed oClosed;
    ORVO_EXPECT_INTERNAL(oNode_.convertToConnector(&oClosed), "Enforce pInput != NULL");
    EXPECT_EQ(0u, oNode_.numberOfInputs());
}

TEST_F(ParameterInputTest, AFailedConversionLeavesTheNodeAsItWas) {
    {
        ORVO::Core::AllocationFailure oFailure(1);
        EXPECT_THROW(oNode_.convertToConnector(&oRadius_), std::bad_alloc);
    }
    EXPECT_EQ(0u, oNode_.numberOfInputs());
}

TEST_F(ParameterInputTest, TheProxyNamesTheParameterForAnyNode) {
    Parameter<ORVO::float4> oColour(ORVO::float4(1.0f), "colour");
    OwnedInput const spInput(oColour.createProxyConnector(nullptr));
    EXPECT_EQ("colour", spInput->name());
    EXPECT_EQ(nullptr, spInput->node());
    ConstOutput<ORVO::float4> oOutput("value", nullptr);
    Connect(*spInput, oOutput);
    oOutput.setData(ORVO_NEW ORVO::float4(1.0f, 2.0f, 3.0f, 4.0f));
    spInput->fetchInput();
    EXPECT_EQ(ORVO::float4(1.0f, 2.0f, 3.0f, 4.0f), oColour.value());
    EXPECT_EQ(ORVO::float4(1.0f), oColour.defaultValue());
    spInput->disconnect();
}

} // namespace
