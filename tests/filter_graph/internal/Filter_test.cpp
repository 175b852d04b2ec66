// The common part of all filters: construction, copies, ownership and destruction.
#include "orvo/filter_graph/internal/Filter.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <new>
#include <vector>

#include "orvo/core/memory/AllocationFailure.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/filter_graph/impl/Connect.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/MetadataItem.h"
#include "orvo/filter_graph/impl/Output.h"
#include "orvo/filter_graph/impl/Parameter.h"
#include "orvo/filter_graph/internal/ParameterForwarder.h"
#include "tests/filter_graph/support/PlainFilter.h"
#include "tests/support/Expect.h"

namespace ORVO::FilterGraph::Internal {
namespace {

using ORVO::Test::makePlain;
using ORVO::Test::PlainFilter;

template <class T>
Filter::OwnedParameter owned(std::string const& name, T const& value) {
    return Filter::OwnedParameter(ORVO_NEW Parameter<T>(name, value, false));
}

template <class T>
MetadataItemBase const* item(std::string const& name, T const& value) {
    return ORVO_NEW MetadataItem<T>(name, value);
}

/// Fills in an input the first time that it is initialised.
class LazyFilter : public PlainFilter {
public:
    using PlainFilter::PlainFilter;
    std::shared_ptr<Filter> clone() override { return std::make_shared<LazyFilter>(*this); }

    int nSetUps = 0;

protected:
    void finishLazyInitialization() override {
        ++nSetUps;
        addInput("late", 0);
        PlainFilter::finishLazyInitialization();
    }
};

/// A filter with something of everything.
std::shared_ptr<PlainFilter> makeFull() {
    auto filter = makePlain("full", {"a", "b"}, 3);
    filter->addInput("grey", 1);
    filter->addParameter(owned<float>("gain", 2.0F));
    filter->addParameter(owned<std::string>("title", "untitled"));
    filter->addMetadataItem(item<std::string>("Name", "Full"));
    filter->addMetadataItem(item<int>("Order", 7));
    return filter;
}

TEST(FilterTest, IsEmptyAtFirst) {
    PlainFilter filter{Filter::Identifier()};
    IFilter const& constant = filter;
    EXPECT_EQ(filter.getNumberOfInputs(), 0u);
    EXPECT_FALSE(filter.inputs().isValid());
    EXPECT_FALSE(constant.inputs().isValid());
    EXPECT_EQ(filter.input("src"), nullptr);
    EXPECT_EQ(constant.input("src"), nullptr);
    EXPECT_EQ(filter.nChannel(), 0u);
    EXPECT_EQ(filter.getNumberOfParameters(), 0u);
    EXPECT_FALSE(filter.parameters().isValid());
    EXPECT_FALSE(constant.parameters().isValid());
    EXPECT_EQ(filter.parameter("gain"), nullptr);
    EXPECT_EQ(constant.parameter("gain"), nullptr);
    EXPECT_EQ(filter.getNumberOfMetadataItems(), 0u);
    EXPECT_FALSE(filter.metadata().isValid());
    EXPECT_EQ(filter.metadataItem("Name"), nullptr);
    EXPECT_EQ(filter.getTimeStamp(), 0);
    EXPECT_EQ(filter.getClonedTimeStamp(), 0);
    EXPECT_EQ(filter.getColor(), 0u);
    EXPECT_FALSE(filter.isInitialized());
    EXPECT_EQ(filter.identifier().name(), "");
}

TEST(FilterTest, HasOneOutputWhateverItsName) {
    PlainFilter filter;
    IFilter const& constant = filter;
    ASSERT_TRUE(filter.output());
    EXPECT_EQ(filter.output()->name(), "dst");
    EXPECT_EQ(filter.output("dst"), filter.output());
    EXPECT_EQ(filter.output("no such output"), filter.output());
    EXPECT_EQ(filter.output(""), filter.output());
    EXPECT_EQ(constant.output("dst"), filter.output());
    EXPECT_EQ(constant.output(), filter.output());
}

TEST(FilterTest, RefusesASecondInputOfAName) {
    PlainFilter filter("filter", {"src"});
    ORVO_EXPECT_INTERNAL(filter.addInput("src", 4), "existing==0");
    EXPECT_EQ(filter.getNumberOfInputs(), 1u);
    EXPECT_EQ(filter.input("src")->nChannel(), 0u);
}

TEST(FilterTest, ListsInputsInTheirOrder) {
    PlainFilter const filter("filter", {"z", "a", "m"});
    std::string names;
    for (Input const* pInput : filter.inputs())
        names += pInput->name();
    EXPECT_EQ(names, "zam");
    EXPECT_EQ(filter.getNumberOfInputs(), 3u);
}

TEST(FilterTest, ChangesTheChannelsOfAnInput) {
    PlainFilter filter("filter", {"src"});
    filter.updateNumChannelsOnInput(filter.input("src"), 4);
    EXPECT_EQ(filter.input("src")->nChannel(), 4u);
    ORVO_EXPECT_INTERNAL(filter.updateNumChannelsOnInput(nullptr, 4), "Enforce pInput != NULL");
}

TEST(FilterTest, CountsTimeStampsAndKeepsItsColor) {
    PlainFilter filter;
    filter.updateTimeStamp();
    filter.updateTimeStamp();
    EXPECT_EQ(filter.getTimeStamp(), 2);
    filter.setColor(2);
    EXPECT_EQ(filter.getColor(), 2u);
    filter.resetColor();
    EXPECT_EQ(filter.getColor(), 0u);
}

TEST(FilterTest, CanRunOnTheTwoTargets) {
    PlainFilter const filter;
    EXPECT_TRUE(filter.canBuildFilterExecutable(ORVO_TARGET_GL));
    EXPECT_TRUE(filter.canBuildFilterExecutable(ORVO_TARGET_CPU));
    EXPECT_FALSE(filter.canBuildFilterExecutable(ORVO_TARGET_RESERVED_2));
    EXPECT_FALSE(filter.canBuildFilterExecutable(ORVO_TARGET_RESERVED_3));
    EXPECT_FALSE(filter.canBuildFilterExecutable(ORVO_TARGET_UNSET));
}

TEST(FilterTest, DoesNotUnfoldByDefault) {
    PlainFilter filter;
    EXPECT_EQ(filter.unFold(OptimizationOptions()), nullptr);
}

TEST(FilterTest, FinishesItsSetUpOnce) {
    LazyFilter filter("lazy");
    EXPECT_FALSE(filter.isInitialized());
    EXPECT_EQ(filter.getNumberOfInputs(), 0u);
    static_cast<Filter const&>(filter).initialize();
    EXPECT_TRUE(filter.isInitialized());
    filter.initialize();
    EXPECT_EQ(filter.nSetUps, 1);
    EXPECT_EQ(filter.getNumberOfInputs(), 1u);

    PlainFilter plain;
    plain.initialize();
    EXPECT_TRUE(plain.isInitialized());
}

TEST(FilterTest, CountsAsFinishedAlsoIfTheSetUpDoesNotSaySo) {
    class ForgetfulFilter : public PlainFilter {
    public:
        int nSetUps = 0;

    protected:
        void finishLazyInitialization() override { ++nSetUps; }
    } filter;
    filter.initialize();
    EXPECT_TRUE(filter.isInitialized());
    filter.initialize();
    EXPECT_EQ(filter.nSetUps, 1);
}

/// Adds one of everything and fails at the end of its first set-up.
class StumblingFilter : public PlainFilter {
public:
    bool bStumbles = true;

protected:
    void finishLazyInitialization() override {
        addInput("late", 0);
        addParameter(owned<int>("late", 1));
        addMetadataItem(item<int>("late", 1));
        if (bStumbles)
            throw std::bad_alloc();
        PlainFilter::finishLazyInitialization();
    }
};

TEST(FilterTest, TakesBackASetUpThatFailed) {
    StumblingFilter filter;
    filter.addInput("early", 0);
    filter.addParameter(owned<int>("early", 1));
    filter.addMetadataItem(item<int>("early", 1));
    EXPECT_THROW(filter.initialize(), std::bad_alloc);
    EXPECT_FALSE(filter.isInitialized());
    EXPECT_EQ(filter.getNumberOfInputs(), 1u);
    EXPECT_EQ(filter.getNumberOfParameters(), 1u);
    EXPECT_EQ(filter.getNumberOfMetadataItems(), 1u);
    EXPECT_EQ(filter.input("late"), nullptr);
    EXPECT_EQ(filter.parameter("late"), nullptr);
    EXPECT_EQ(filter.metadataItem("late"), nullptr);
    filter.bStumbles = false;
    filter.initialize();
    EXPECT_TRUE(filter.isInitialized());
    EXPECT_TRUE(filter.input("late"));
    EXPECT_EQ(filter.getNumberOfInputs(), 2u);
}

TEST(FilterTest, CarriesTheFinishedSetUpIntoAClone) {
    LazyFilter filter("lazy");
    filter.initialize();
    auto const clone = filter.clone();
    EXPECT_TRUE(clone->isInitialized());
    clone->initialize();
    EXPECT_EQ(clone->getNumberOfInputs(), 1u);
    EXPECT_FALSE(LazyFilter("raw").clone()->isInitialized());
}

TEST(FilterTest, ClonesEverythingButConnections) {
    auto const filter = makeFull();
    filter->parameter("gain")->as<float>().setValue(9.0F);
    auto const producer = makePlain("producer");
    auto const consumer = makePlain("consumer", {"src"});
    Connect(producer, filter->input("a"));
    Connect(filter, consumer);
    filter->setColor(1);

    std::shared_ptr<Filter> const clone = filter->clone();
    EXPECT_TRUE(clone->identifier() == filter->identifier());
    EXPECT_EQ(clone->nChannel(), 3u);
    EXPECT_EQ(clone->output()->parentFilter(), clone.get());
    EXPECT_EQ(clone->output()->numConsumerInputs(), 0u);
    ASSERT_EQ(clone->getNumberOfInputs(), 3u);
    for (Input const* pInput : clone->inputs()) {
        EXPECT_EQ(pInput->producerFilter(), nullptr);
        EXPECT_EQ(pInput->parentFilter(), clone.get());
        EXPECT_EQ(pInput->nChannel(), filter->input(pInput->name())->nChannel());
        EXPECT_NE(pInput, filter->input(pInput->name()));
    }
    EXPECT_EQ(clone->getNumberOfParameters(), 2u);
    EXPECT_NE(clone->parameter("gain"), filter->parameter("gain"));
    EXPECT_EQ(clone->parameter("gain")->as<float>().value(), 9.0F);
    EXPECT_EQ(clone->parameter("title")->as<std::string>().value(), "untitled");
    ASSERT_EQ(clone->getNumberOfMetadataItems(), 2u);
    EXPECT_NE(clone->metadataItem("Order"), filter->metadataItem("Order"));
    EXPECT_EQ(clone->metadataItem("Order")->as<int>().value(), 7);
    EXPECT_EQ(clone->getColor(), 0u);
    EXPECT_EQ(filter->getTimeStamp(), 2);
    EXPECT_EQ(clone->getClonedTimeStamp(), 2);
    EXPECT_EQ(clone->getTimeStamp(), 0);
    // The original is as it was.
    EXPECT_EQ(filter->input("a")->producerFilter(), producer.get());
    EXPECT_EQ(filter->output()->numConsumerInputs(), 1u);
    EXPECT_EQ(filter->getClonedTimeStamp(), 0);
    EXPECT_EQ(filter->getColor(), 1u);
}

TEST(FilterTest, BecomesAnUnconnectedCopyByAssignment) {
    auto const filter = makeFull();
    auto const target = makePlain("target", {"src"});
    target->addParameter(owned<int>("old", 1));
    target->addMetadataItem(item<int>("Old", 1));
    auto const producer = makePlain("producer");
    auto const consumer = makePlain("consumer", {"src"});
    Connect(producer, target);
    Connect(target, consumer);
    filter->updateTimeStamp();
    int const stamp = target->getTimeStamp();

    *target = *filter;
    EXPECT_EQ(target->identifier().name(), "full");
    EXPECT_EQ(target->getNumberOfInputs(), 3u);
    EXPECT_EQ(target->input("src"), nullptr);
    EXPECT_EQ(target->parameter("old"), nullptr);
    EXPECT_EQ(target->parameter("gain")->as<float>().value(), 2.0F);
    EXPECT_EQ(target->metadataItem("Old"), nullptr);
    EXPECT_EQ(target->getNumberOfMetadataItems(), 2u);
    EXPECT_EQ(target->getClonedTimeStamp(), 1);
    EXPECT_EQ(producer->output()->numConsumerInputs(), 0u);
    EXPECT_EQ(consumer->input("src")->producerFilter(), nullptr);
    EXPECT_EQ(target->getTimeStamp(), stamp);
    EXPECT_EQ(producer->getTimeStamp(), 2) << "connected and disconnected";

    PlainFilter& same = *target;
    *target = same;
    EXPECT_EQ(target->getNumberOfInputs(), 3u);
    EXPECT_EQ(target->getNumberOfParameters(), 2u);
}

TEST(FilterTest, IsLeftAsItWasByACloneThatRunsOutOfMemory) {
    auto const filter = makeFull();
    auto const target = makePlain("target", {"src"});
    target->addParameter(owned<int>("old", 1));
    auto const producer = makePlain("producer");
    Connect(producer, target);
    std::uint64_t nFailures = 0;
    for (bool done = false; !done; nFailures += done ? 0u : 1u) {
        Core::AllocationFailure const failure(nFailures + 1);
        try {
            *target = *filter;
        } catch (std::bad_alloc const&) {
            EXPECT_EQ(target->identifier().name(), "target");
            EXPECT_EQ(target->input("src")->producerFilter(), producer.get());
            EXPECT_EQ(target->parameter("old")->as<int>().value(), 1);
        }
        done = !failure.hasFired();
    }
    // Two parameters, three inputs, an output and two metadata items are allocated at the least.
    EXPECT_GE(nFailures, 8u);
    EXPECT_EQ(target->identifier().name(), "full");
}

TEST(FilterTest, FindsMetadataByName) {
    PlainFilter filter;
    filter.addMetadataItem(item<int>("Order", 1));
    filter.addMetadataItem(item<int>("Order", 2));
    EXPECT_EQ(filter.metadataItem("Order")->as<int>().value(), 1);
    EXPECT_EQ(filter.metadataItem("order"), nullptr);
    EXPECT_EQ(filter.getNumberOfMetadataItems(), 2u);
    ORVO_EXPECT_INTERNAL(filter.addMetadataItem(nullptr), "Enforce pItem != NULL");
    std::string values;
    for (MetadataItemBase const* pItem : filter.metadata())
        values += std::to_string(pItem->as<int>().value());
    EXPECT_EQ(values, "12");
}

TEST(FilterTest, ClonesMetadataToAnotherFilterAndToItself) {
    auto const filter = makeFull();
    PlainFilter target;
    target.addMetadataItem(item<int>("First", 1));
    filter->cloneMetadata(&target);
    ASSERT_EQ(target.getNumberOfMetadataItems(), 3u);
    EXPECT_EQ(target.metadataItem("Name")->as<std::string>().value(), "Full");
    EXPECT_NE(target.metadataItem("Name"), filter->metadataItem("Name"));
    filter->cloneMetadata(filter.get());
    EXPECT_EQ(filter->getNumberOfMetadataItems(), 4u);
    ORVO_EXPECT_INTERNAL(filter->cloneMetadata(nullptr), "Enforce pTarget != NULL");
}

TEST(FilterTest, RefusesASecondParameterOfAName) {
    PlainFilter filter;
    filter.addParameter(owned<int>("gain", 1));
    ORVO_EXPECT_INTERNAL(filter.addParameter(owned<float>("gain", 2.0F)), "!iParameter");
    ORVO_EXPECT_INTERNAL(filter.addParameter(Filter::OwnedParameter()), "Enforce pParameter != NULL");
    ORVO_EXPECT_INTERNAL(filter.addParameter(static_cast<ParameterBase*>(nullptr)),
                         "Enforce pParameter != NULL");
    EXPECT_EQ(filter.getNumberOfParameters(), 1u);
    EXPECT_EQ(filter.parameter("gain")->as<int>().value(), 1);
}

TEST(FilterTest, LeavesForeignParametersToTheirOwner) {
    Parameter<int> parameter("gain", 4, false);
    {
        PlainFilter filter;
        filter.addParameter(&parameter);
        EXPECT_EQ(filter.parameter("gain"), &parameter);
        filter.clearParameterSet();
        ORVO_EXPECT_INTERNAL(filter.getNumberOfParameters(), "Enforce pParameterSet_ != NULL");
        filter.clearParameterSet();
    }
    EXPECT_EQ(parameter.value(), 4);
}

TEST(FilterTest, DeletesAllParametersOfBothKinds) {
    PlainFilter filter;
    filter.addParameter(ORVO_NEW Parameter<int>("handed over", 1, false));
    filter.addParameter(owned<int>("owned", 1));
    filter.deleteAllParameters();
    ORVO_EXPECT_INTERNAL(filter.parameter("owned"), "Enforce pParameterSet_ != NULL");
    filter.deleteAllParameters();
}

TEST(FilterTest, DiesInTheMiddleOfAGraph) {
    auto const source = makePlain("source");
    auto middle = makePlain("middle", {"a", "b"});
    auto const sink = makePlain("sink", {"src"});
    Connect(source, middle->input("a"));
    Connect(source, middle->input("b"));
    Connect(middle, sink);
    middle.reset();
    EXPECT_EQ(source->output()->numConsumerInputs(), 0u);
    EXPECT_EQ(source->getTimeStamp(), 4);
    EXPECT_EQ(sink->input("src")->producerFilter(), nullptr);
    EXPECT_EQ(sink->getTimeStamp(), 1);
}

TEST(FilterTest, DiesInALongChainWithoutRecursion) {
    std::vector<std::shared_ptr<PlainFilter>> chain;
    for (int i = 0; i < 1000; ++i) {
        chain.push_back(makePlain("link", {"src"}));
        if (i > 0)
            Connect(chain[static_cast<std::size_t>(i) - 1], chain.back());
    }
    // From the front, from the back, and the rest.
    chain.erase(chain.begin(), chain.begin() + 300);
    EXPECT_EQ(chain.front()->input("src")->producerFilter(), nullptr);
    chain.resize(chain.size() - 300);
    EXPECT_EQ(chain.back()->output()->numConsumerInputs(), 0u);
}

} // namespace
} // namespace ORVO::FilterGraph::Internal
