// What makes a node dirty, and what its outputs keep because of it.

#include "orvo/data_flow/connectors/Connect.h"
#include "orvo/data_flow/nodes/Node.h"
#include "orvo/data_flow/parameters/Parameter.h"
#include "tests/data_flow/connectors/Payload.h"
#include "tests/data_flow/nodes/TestNode.h"
#include "tests/support/DataFlowLayers.h"

#include <gtest/gtest.h>

#include <array>
#include <memory>

namespace {

using namespace ORVO::DataFlow;
using ORVO::Test::Payload;
using ORVO::Test::TestNode;

/// producer -> consumer -> last, with one parameter each.
class NodeDirtyStateTest : public testing::Test {
protected:
    void SetUp() override {
        oProducer_.registerParameter(&oProducerValue_);
        oConsumer_.registerParameter(&oConsumerValue_);
        oLast_.registerParameter(&oLastValue_);
        Connect(oInput_, oOutput_);
        Connect(oLastInput_, oConsumerOutput_);
        // The first pass sees new parameters everywhere.
        updateAll();
        updateAll();
    }

    void updateAll() {
        oProducer_.updateDirtyState();
        oConsumer_.updateDirtyState();
        oLast_.updateDirtyState();
    }

    std::array<bool, 3> dirty() const {
        return {oProducer_.isDirty(), oConsumer_.isDirty(), oLast_.isDirty()};
    }

    ORVO::Test::DataFlowLayers oLayers_;
    Parameter<int> oProducerValue_{0, "value"};
    Parameter<int> oConsumerValue_{0, "value"};
    Parameter<int> oLastValue_{0, "value"};
    TestNode oProducer_{"producer"};
    TestNode oConsumer_{"consumer"};
    TestNode oLast_{"last"};
    ConstOutput<Payload>& oOutput_ = oProducer_.addConstOutput("out");
    ConstInput<Payload>& oInput_ = oConsumer_.addConstInput("in");
    ConstOutput<Payload>& oConsumerOutput_ = oConsumer_.addConstOutput("out");
    ConstInput<Payload>& oLastInput_ = oLast_.addConstInput("in");
};

using Flags = std::array<bool, 3>;

TEST_F(NodeDirtyStateTest, NewParametersMakeTheFirstPassDirty) {
    Parameter<int> oValue(0, "value");
    TestNode oNode("n");
    oNode.registerParameter(&oValue);
    oNode.updateDirtyState();
    EXPECT_TRUE(oNode.isDirty());
    EXPECT_FALSE(oValue.isDirtySimpleCaching());
    EXPECT_TRUE(oValue.isDirty());
    EXPECT_TRUE(oValue.isDirtyGlyphcast());
    oNode.updateDirtyState();
    EXPECT_FALSE(oNode.isDirty());
}

TEST_F(NodeDirtyStateTest, ANodeWithoutParametersLooksAtItsProducersAlone) {
    TestNode oNode("n");
    oNode.updateDirtyState();
    EXPECT_FALSE(oNode.isDirty());
    EXPECT_FALSE(oNode.hasDirtyProducer());
}

TEST_F(NodeDirtyStateTest, DirtSpreadsDownstreamForOnePass) {
    EXPECT_EQ((Flags{false, false, false}), dirty());
    oConsumerValue_.setValue(1);
    updateAll();
    EXPECT_EQ((Flags{false, true, true}), dirty());
    updateAll();
    EXPECT_EQ((Flags{false, false, false}), dirty());
    oProducerValue_.setValue(1);
    updateAll();
    EXPECT_EQ((Flags{true, true, true}), dirty());
}

TEST_F(NodeDirtyStateTest, ADirtyNodeClearsItsOwnParametersToo) {
    oProducerValue_.setValue(1);
    oConsumerValue_.setValue(1);
    updateAll();
    EXPECT_FALSE(oConsumerValue_.isDirtySimpleCaching());
    updateAll();
    EXPECT_EQ((Flags{false, false, false}), dirty());
}

TEST_F(NodeDirtyStateTest, OneDirtyProducerOfSeveralIsEnough) {
    TestNode oJoin("join");
    auto& oFirst = oJoin.addConstInput("first");
    auto& oSecond = oJoin.addConstInput("second");
    TestNode oOther("other");
    Connect(oFirst, oOther.addConstOutput("out"));
    EXPECT_FALSE(oJoin.hasDirtyProducer()) << "an input without a partner has no producer";
    Connect(oSecond, oProducer_.addConstOutput("second"));
    EXPECT_FALSE(oJoin.hasDirtyProducer());
    oProducerValue_.setValue(1);
    oProducer_.updateDirtyState();
    EXPECT_TRUE(oJoin.hasDirtyProducer());
    oJoin.updateDirtyState();
    EXPECT_TRUE(oJoin.isDirty());
}

TEST_F(NodeDirtyStateTest, HasDirtyParametersConsumesThePlainFlagAlone) {
    Parameter<int> oSecond(0, "second");
    Parameter<int> oThird(0, "third");
    oProducer_.registerParameter(&oSecond);
    oProducer_.registerParameter(&oThird);
    EXPECT_TRUE(oProducer_.hasDirtyParameters());
    EXPECT_FALSE(oProducerValue_.isDirty() || oSecond.isDirty() || oThird.isDirty());
    EXPECT_TRUE(oThird.isDirtySimpleCaching());
    EXPECT_FALSE(oProducer_.hasDirtyParameters());
    oThird.setValue(5);
    EXPECT_TRUE(oProducer_.hasDirtyParameters());
    EXPECT_FALSE(oProducer_.hasDirtyParameters());
}

TEST_F(NodeDirtyStateTest, SimpleCachingFlagsAreReadWithoutClearing) {
    EXPECT_FALSE(oProducer_.hasDirtyParametersSimpleCaching());
    oProducerValue_.setValue(1);
    EXPECT_TRUE(oProducer_.hasDirtyParametersSimpleCaching());
    EXPECT_TRUE(oProducer_.hasDirtyParametersSimpleCaching());
    oProducer_.setCleanAllParametersSimpleCaching();
    EXPECT_FALSE(oProducer_.hasDirtyParametersSimpleCaching());
    EXPECT_TRUE(oProducerValue_.isDirty());
}

struct KeepsCacheRow {
    char const* pName;
    bool bKeepCache;
    bool bProducerDirty;
    bool bConnected;
    bool bConsumerDirty;
    bool bKeeps;
};

TEST_F(NodeDirtyStateTest, WhatAnOutputKeeps) {
    // In the order of the rules: asked to; stale anyway; nobody fetches; only the consumer must run again.
    KeepsCacheRow const aRows[] = {
        {"clean, clean", false, false, true, false, false},
        {"clean, dirty consumer", false, false, true, true, true},
        {"both dirty", false, true, true, true, false},
        {"unconnected", false, false, false, true, false},
        {"unconnected, dirty", false, true, false, true, false},
        {"asked to, clean", true, false, true, false, true},
        {"asked to, both dirty", true, true, true, true, true},
        {"asked to, unconnected", true, false, false, false, true},
    };
    int iValue = 0;
    for (KeepsCacheRow const& oRow : aRows) {
        SCOPED_TRACE(oRow.pName);
        Connect(oInput_, oOutput_);
        oOutput_.keepCache(oRow.bKeepCache);
        updateAll();
        ++iValue;
        if (oRow.bProducerDirty) {
            oProducerValue_.setValue(iValue);
        }
        if (oRow.bConsumerDirty) {
            oConsumerValue_.setValue(iValue);
        }
        updateAll();
        ASSERT_EQ(oRow.bProducerDirty, oProducer_.isDirty());
        ASSERT_EQ(oRow.bConsumerDirty, oConsumer_.isDirty());
        if (!oRow.bConnected) {
            oInput_.disconnect();
        }
        EXPECT_EQ(oRow.bKeeps, oOutput_.keepsCache());
        EXPECT_EQ(oRow.bKeeps, oProducer_.keepsCache());
        Connect(oInput_, oOutput_);
        updateAll();
    }
}

TEST_F(NodeDirtyStateTest, ANodeKeepsIfAnyOutputDoes) {
    EXPECT_FALSE(oProducer_.keepsCache());
    oProducer_.addConstOutput("second").keepCache(true);
    EXPECT_TRUE(oProducer_.keepsCache());
}

TEST_F(NodeDirtyStateTest, ACleanProducerKeepsForADirtyConsumer) {
    oOutput_.setData(ORVO_NEW Payload(1));
    oConsumerValue_.setValue(1);
    updateAll();
    oConsumer_.process();
    EXPECT_TRUE(oOutput_.hasData());
    EXPECT_FALSE(oProducer_.isReady()) << "the result need not be made again";

    oProducerValue_.setValue(1);
    updateAll();
    oConsumer_.process();
    EXPECT_FALSE(oOutput_.hasData()) << "a dirty producer gives its result away";
}

} // namespace
