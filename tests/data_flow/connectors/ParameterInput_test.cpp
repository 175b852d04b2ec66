#include "orvo/data_flow/connectors/ParameterInput.h"

#include "orvo/core/math/Float.h"
#include "orvo/core/memory/AllocationFailure.h"
#include "orvo/data_flow/connectors/Connect.h"
#include "tests/data_flow/nodes/TestNode.h"
#include "tests/support/DataFlowLayers.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

#include <memory>
#include <new>
#include <typeinfo>

namespace {

using namespace ORVO::DataFlow;
using ORVO::Test::TestNode;

using OwnedInput = std::unique_ptr<InputConnector, ORVO::ORVODeleter<InputConnector>>;

class ParameterInputTest : public testing::Test {
protected:
    void SetUp() override {
        oNode_.registerParameter(&oRadius_);
        oProducer_.pfnWork_ = [this] { oOutput_.setData(ORVO_NEW float(fNext_)); };
    }

    ORVO::Test::DataFlowLayers oLayers_;
    Parameter<float> oRadius_{1.0f, "radius"};
    TestNode oNode_{"blur"};
    TestNode oProducer_{"lfo"};
    ConstOutput<float>& oOutput_ = oProducer_.addConstOutput<float>("value");
    float fNext_ = 5.0f;
};

TEST_F(ParameterInputTest, ConvertingAppendsAnInputOfTheParametersNameAndType) {
    oNode_.addConstInput("image");
    OwnedInput const spInput(oNode_.convertToConnector(&oRadius_));
    ASSERT_NE(nullptr, spInput);
    EXPECT_EQ(2u, oNode_.numberOfInputs());
    EXPECT_EQ(spInput.get(), oNode_.input(1));
    EXPECT_EQ(spInput.get(), oNode_.input("radius"));
    EXPECT_EQ(&oNode_, spInput->node());
    EXPECT_TRUE(spInput->datatype() == typeid(float));
    EXPECT_EQ(1u, oNode_.numberOfParameters());
}

TEST_F(ParameterInputTest, EveryRunSetsTheParameter) {
    OwnedInput const spInput(oNode_.convertToConnector(&oRadius_));
    Connect(*spInput, oOutput_);
    for (float const fValue : {5.0f, 7.0f}) {
        fNext_ = fValue;
        oProducer_.process();
        oNode_.process();
        EXPECT_EQ(fValue, oRadius_.value());
        EXPECT_FALSE(spInput->hasData());
        EXPECT_FALSE(oOutput_.hasData());
    }
    spInput->disconnect();
}

TEST_F(ParameterInputTest, AnUnchangedValueTouchesNoFlag) {
    OwnedInput const spInput(oNode_.convertToConnector(&oRadius_));
    Connect(*spInput, oOutput_);
    oRadius_.setClean();
    oRadius_.setCleanSimpleCaching();
    oRadius_.setCleanGlyphcast();
    fNext_ = 1.0f;
    oProducer_.process();
    oNode_.process();
    EXPECT_FALSE(oRadius_.isDirty() || oRadius_.isDirtySimpleCaching() || oRadius_.isDirtyGlyphcast());
    fNext_ = 2.0f;
    oProducer_.process();
    oNode_.process();
    EXPECT_TRUE(oRadius_.isDirty() && oRadius_.isDirtySimpleCaching() && oRadius_.isDirtyGlyphcast());
    spInput->disconnect();
}

TEST_F(ParameterInputTest, AKeptValueIsShared) {
    OwnedInput const spInput(oNode_.convertToConnector(&oRadius_));
    Connect(*spInput, oOutput_);
    oOutput_.keepCache(true);
    oProducer_.process();
    oNode_.process();
    EXPECT_EQ(5.0f, oRadius_.value());
    EXPECT_TRUE(oOutput_.hasData());
    spInput->disconnect();
}

TEST_F(ParameterInputTest, AMutableOutputFeedsItToo) {
    Output<float> oMutable("value", nullptr);
    OwnedInput const spInput(oNode_.convertToConnector(&oRadius_));
    Connect(*spInput, oMutable);
    oMutable.setData(ORVO_NEW float(8.0f));
    spInput->fetchInput();
    EXPECT_EQ(8.0f, oRadius_.value());
    spInput->disconnect();
}

TEST_F(ParameterInputTest, FetchingNeedsAPartnerAndAValue) {
    OwnedInput const spInput(oNode_.convertToConnector(&oRadius_));
    ORVO_EXPECT_INTERNAL(spInput->fetchInput(), "Enforce pConnectedOutput_ != NULL");
    Connect(*spInput, oOutput_);
    ORVO_EXPECT_INTERNAL(spInput->fetchInput(), "Enforce spData_.get() != NULL");
    EXPECT_EQ(1.0f, oRadius_.value());
    spInput->disconnect();
}

TEST_F(ParameterInputTest, NullParametersAreRefused) {
    ORVO_EXPECT_INTERNAL(oNode_.convertToConnector(nullptr), "Enforce pParameter != NULL");
    ORVO_EXPECT_INTERNAL(ParameterInput<float>("x", &oNode_, nullptr), "Enforce pParameter != NULL");
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
