#include "orvo/filter_graph/internal/ParameterForwarder.h"

#include <gtest/gtest.h>

#include "orvo/data_flow/nodes/Node.h"
#include "orvo/data_flow/parameters/Parameter.h"
#include "orvo/filter_graph/impl/Parameter.h"
#include "orvo/filter_graph/internal/ParameterSet.h"
#include "tests/filter_graph/support/PlainFilter.h"
#include "tests/support/DataFlowLayers.h"
#include "tests/support/Expect.h"

namespace ORVO::FilterGraph::Internal {
namespace {

using ORVO::Test::PlainFilter;

/// Runs its children after its own pairs, and counts.
class OpenForwarder : public ParameterForwarder {
public:
    void forwardStuff() override {
        ++nRuns;
        ParameterForwarder::forwardStuff();
        if (bForwardsChildren)
            forwardChildren();
    }

    bool bForwardsChildren = false;
    int nRuns = 0;
};

/// A node with parameters of its own.
class ParameterNode : public DataFlow::Node {
public:
    ParameterNode() : DataFlow::Node("parameters") {
        registerParameter(&oGain_);
        registerParameter(&oOffset_);
    }

    DataFlow::Parameter<float> oGain_{1.0F, "gain"};
    DataFlow::Parameter<int> oOffset_{0, "offset"};

protected:
    void internalProcess() override {}
};

PlainFilter::OwnedParameter gain(float value) {
    return PlainFilter::OwnedParameter(new Parameter<float>("gain", value, false));
}

TEST(ParameterForwarderTest, CopiesPairsInOrderSoThatTheLaterWins) {
    Parameter<int> one("one", 1, false);
    Parameter<int> two("two", 2, false);
    Parameter<int> target("target", 0, false);
    ParameterForwarder forwarder;
    forwarder.addForward(one, target);
    forwarder.addForward(two, target);
    EXPECT_EQ(target.value(), 0);
    forwarder.forwardStuff();
    EXPECT_EQ(target.value(), 2);
    two.setValue(5);
    forwarder.forwardStuff();
    EXPECT_EQ(target.value(), 5);
    forwarder.returnStuff();
    EXPECT_EQ(two.value(), 5);
}

TEST(ParameterForwarderTest, SetsNoDirtyFlagWithoutAChange) {
    Parameter<int> source("source", 1, false);
    DataFlow::Parameter<int> target(0, "target");
    ParameterForwarder forwarder;
    forwarder.addForwardPtr(ParameterSet::getDataPtr(source).get(), &target);
    forwarder.forwardStuff();
    EXPECT_TRUE(target.isDirty());
    target.setClean();
    forwarder.forwardStuff();
    EXPECT_FALSE(target.isDirty());
}

TEST(ParameterForwarderTest, RefusesNullAndOtherTypes) {
    DataFlow::Parameter<int> number(1, "number");
    DataFlow::Parameter<float> fraction(0.5F, "fraction");
    ParameterForwarder forwarder;
    ORVO_EXPECT_INTERNAL(forwarder.addForwardPtr(nullptr, &number), "Enforce source != NULL");
    ORVO_EXPECT_INTERNAL(forwarder.addForwardPtr(&number, nullptr), "Enforce destination != NULL");
    ORVO_EXPECT_INTERNAL(forwarder.addChild(nullptr), "Enforce spChild.get() != NULL");
    ORVO_EXPECT_INTERNAL(ParameterForwarder::forwardByPtr(nullptr), "Enforce spForwarder.get() != NULL");
    forwarder.forwardStuff();

    forwarder.addForwardPtr(&number, &fraction);
    ORVO_EXPECT_INTERNAL(forwarder.forwardStuff(), "isOfType<T>()");
    EXPECT_EQ(fraction.value(), 0.5F);
}

TEST(ParameterForwarderTest, PairsNamesakesOfTwoFilters) {
    PlainFilter source;
    PlainFilter target;
    source.addParameter(gain(3.0F));
    source.addParameter(PlainFilter::OwnedParameter(new Parameter<int>("only here", 1, false)));
    target.addParameter(PlainFilter::OwnedParameter(new Parameter<int>("only there", 2, false)));
    target.addParameter(gain(0.0F));
    ParameterForwarder forwarder;
    forwarder.addForward(source, target);
    forwarder.forwardStuff();
    EXPECT_EQ(target.parameter("gain")->as<float>().value(), 3.0F);
    EXPECT_EQ(target.parameter("only there")->as<int>().value(), 2);
}

TEST(ParameterForwarderTest, PairsNamesakesOfAFilterAndANode) {
    ORVO::Test::DataFlowLayers const layers;
    PlainFilter source;
    source.addParameter(gain(3.0F));
    ParameterNode node;
    ParameterForwarder forwarder;
    forwarder.addForward(source, node);
    forwarder.forwardStuff();
    EXPECT_EQ(node.oGain_.value(), 3.0F);
    EXPECT_EQ(node.oOffset_.value(), 0);
    EXPECT_EQ(node.oGain_.defaultValue(), 1.0F);
}

TEST(ParameterForwarderTest, RunsChildrenOnlyWhereADerivedForwarderDoes) {
    auto const spChild = std::make_shared<OpenForwarder>();
    Parameter<int> source("source", 4, false);
    Parameter<int> target("target", 0, false);
    spChild->addForward(source, target);

    ParameterForwarder plain;
    plain.addChild(spChild);
    plain.forwardStuff();
    EXPECT_EQ(spChild->nRuns, 0);
    EXPECT_EQ(target.value(), 0);

    OpenForwarder parent;
    parent.bForwardsChildren = true;
    parent.addChild(spChild);
    parent.addChild(spChild);
    parent.forwardStuff();
    EXPECT_EQ(spChild->nRuns, 2);
    EXPECT_EQ(target.value(), 4);
    ParameterForwarder::forwardByPtr(spChild);
    EXPECT_EQ(spChild->nRuns, 3);
}

TEST(ParameterForwarderTest, ForgetsPairsAndChildren) {
    auto const spChild = std::make_shared<OpenForwarder>();
    std::weak_ptr<OpenForwarder> const watch = spChild;
    Parameter<int> source("source", 4, false);
    Parameter<int> target("target", 0, false);
    OpenForwarder forwarder;
    forwarder.bForwardsChildren = true;
    forwarder.addForward(source, target);
    forwarder.addChild(spChild);
    forwarder.clear();
    EXPECT_EQ(watch.use_count(), 1);
    forwarder.forwardStuff();
    EXPECT_EQ(target.value(), 0);
    EXPECT_EQ(spChild->nRuns, 0);
}

} // namespace
} // namespace ORVO::FilterGraph::Internal
