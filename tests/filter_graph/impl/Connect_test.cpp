// Connections between filters: channels, time stamps, both directions of every link, and what is refused.
#include "orvo/filter_graph/impl/Connect.h"

#include <gtest/gtest.h>

#include "orvo/filter_graph/impl/IInputAdapter.h"
#include "orvo/filter_graph/impl/IOutputAdapter.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/Output.h"
#include "orvo/filter_graph/internal/Connect.h"
#include "tests/filter_graph/support/ForeignFilter.h"
#include "tests/filter_graph/support/PlainFilter.h"
#include "tests/support/Expect.h"
#include "tests/support/ExpectFilterGraph.h"

namespace ORVO::FilterGraph {
namespace {

using ORVO::Test::makePlain;
using ORVO::Test::PlainFilter;
using PlainPtr = std::shared_ptr<PlainFilter>;

constexpr char const* oneInputText =
    "Filter has to have exactly one input to be used in Connect(Filter *, Filter *) API: ";

/// "a b": the names of the parents of the inputs that the filter feeds, in order.
std::string consumersOf(PlainFilter const& filter) {
    std::string names;
    for (Input const* pInput : filter.output()->consumerInputs())
        names += pInput->parentFilter()->identifier().name() + " ";
    return names;
}

TEST(ConnectTest, LinksBothSidesAndMovesBothTimeStamps) {
    PlainPtr const source = makePlain("source");
    PlainPtr const target = makePlain("target", {"src"});
    Connect(source, target);
    Input* const pInput = target->input("src");
    EXPECT_EQ(pInput->producerFilter(), source.get());
    ASSERT_EQ(source->output()->numConsumerInputs(), 1u);
    EXPECT_EQ(*source->output()->consumerInputs(), pInput);
    EXPECT_EQ(source->getTimeStamp(), 1);
    EXPECT_EQ(target->getTimeStamp(), 1);
}

TEST(ConnectTest, FeedsManyInputsFromOneOutputInOrder) {
    PlainPtr const source = makePlain("source");
    PlainPtr const one = makePlain("one", {"src"});
    PlainPtr const two = makePlain("two", {"a", "b"});
    Connect(source, two->input("b"));
    Connect(source, one);
    Connect(source, two->input("a"));
    EXPECT_EQ(consumersOf(*source), "two one two ");
    EXPECT_EQ(source->getTimeStamp(), 3);
    EXPECT_EQ(two->getTimeStamp(), 2);

    Disconnect(one->input("src"));
    EXPECT_EQ(consumersOf(*source), "two two ");
    EXPECT_EQ(one->input("src")->producerFilter(), nullptr);
}

TEST(ConnectTest, TakesAnInputFromItsOldProducer) {
    PlainPtr const first = makePlain("first");
    PlainPtr const second = makePlain("second");
    PlainPtr const target = makePlain("target", {"src"});
    Connect(first, target);
    Connect(second, target);
    EXPECT_EQ(target->input("src")->producerFilter(), second.get());
    EXPECT_EQ(first->output()->numConsumerInputs(), 0u);
    EXPECT_EQ(second->output()->numConsumerInputs(), 1u);
    // Connected, disconnected, connected: two moves for the old producer, one for the new one, three for the
    // target.
    EXPECT_EQ(first->getTimeStamp(), 2);
    EXPECT_EQ(second->getTimeStamp(), 1);
    EXPECT_EQ(target->getTimeStamp(), 3);
}

TEST(ConnectTest, MayBeRepeated) {
    PlainPtr const source = makePlain("source");
    PlainPtr const target = makePlain("target", {"src"});
    Connect(source, target);
    Connect(source, target);
    EXPECT_EQ(source->output()->numConsumerInputs(), 1u);
    EXPECT_EQ(source->getTimeStamp(), 3);
    EXPECT_EQ(target->getTimeStamp(), 3);
}

TEST(ConnectTest, AcceptsEqualAndUnfixedChannels) {
    struct Row {
        std::size_t source;
        std::size_t input;
    };
    for (Row const& row : {Row{0, 0}, Row{0, 4}, Row{3, 0}, Row{1, 1}, Row{4, 4}, Row{17, 17}}) {
        PlainPtr const source = makePlain("source", {}, row.source);
        PlainPtr const target = makePlain("target");
        target->addInput("src", row.input);
        Connect(source, target);
        EXPECT_EQ(target->input("src")->producerFilter(), source.get()) << row.source << " to " << row.input;
    }
}

TEST(ConnectTest, RefusesChannelsThatDiffer) {
    PlainPtr const source = makePlain("grey", {}, 1);
    PlainPtr const target = makePlain("colour");
    target->addInput("src", 3);
    constexpr char const* text =
        "Channel mismatch between the output image and input image of the filters being connected: grey node "
        "having1 channels is connected to colour node having 3 channels\n";
    ORVO_EXPECT_FILTERGRAPH(Connect(source, target), text);
    ORVO_EXPECT_FILTERGRAPH(Connect(source, target->input("src")), text);
    EXPECT_EQ(target->input("src")->producerFilter(), nullptr);
    EXPECT_EQ(source->output()->numConsumerInputs(), 0u);
    EXPECT_EQ(source->getTimeStamp(), 0);
    EXPECT_EQ(target->getTimeStamp(), 0);
}

TEST(ConnectTest, LeavesAnInputUnconnectedAfterAMismatch) {
    PlainPtr const before = makePlain("before", {}, 3);
    PlainPtr const source = makePlain("grey", {}, 1);
    PlainPtr const target = makePlain("colour");
    target->addInput("src", 3);
    Connect(before, target);
    EXPECT_THROW(Connect(source, target), Exception);
    EXPECT_EQ(target->input("src")->producerFilter(), nullptr);
    EXPECT_EQ(before->output()->numConsumerInputs(), 0u);
    EXPECT_EQ(before->getTimeStamp(), 2);
    EXPECT_EQ(target->getTimeStamp(), 2);
    EXPECT_EQ(source->getTimeStamp(), 0);
}

TEST(ConnectTest, NeedsOneInputInTheTwoFilterForm) {
    PlainPtr const source = makePlain("source");
    std::string const identifierOfNone =
        "Filter name:none\nFilter namespace:test\nFilter vendor:ORVO\nFilter version:1\n";
    std::string const identifierOfTwo =
        "Filter name:two\nFilter namespace:test\nFilter vendor:ORVO\nFilter version:1\n";
    ORVO_EXPECT_FILTERGRAPH(Connect(source, makePlain("none")), oneInputText + identifierOfNone);
    PlainPtr const two = makePlain("two", {"a", "b"});
    ORVO_EXPECT_FILTERGRAPH(Connect(source, two), oneInputText + identifierOfTwo);
    EXPECT_EQ(two->input("a")->producerFilter(), nullptr);
    EXPECT_EQ(source->getTimeStamp(), 0);
}

TEST(ConnectTest, RefusesNull) {
    PlainPtr const filter = makePlain("filter", {"src"});
    std::shared_ptr<IFilter> const noFilter;
    std::shared_ptr<IInputAdapter> const noSource;
    std::shared_ptr<IOutputAdapter> const noSink;
    constexpr char const* noSourceText = "Enforce pSourceFilter != NULL";
    constexpr char const* noDestinationText = "Enforce pDestinationFilter != NULL";
    ORVO_EXPECT_INTERNAL(Connect(noFilter, filter), noSourceText);
    ORVO_EXPECT_INTERNAL(Connect(noFilter, noFilter), noSourceText);
    ORVO_EXPECT_INTERNAL(Connect(noFilter, filter->input("src")), noSourceText);
    ORVO_EXPECT_INTERNAL(Connect(noFilter, noSink), noSourceText);
    ORVO_EXPECT_INTERNAL(Connect(noSource, filter->input("src")), noSourceText);
    ORVO_EXPECT_INTERNAL(Connect(noSource, std::shared_ptr<IFilter>(filter)), noSourceText);
    ORVO_EXPECT_INTERNAL(Connect(noSource, noSink), noSourceText);
    ORVO_EXPECT_INTERNAL(Connect(filter, noFilter), noDestinationText);
    ORVO_EXPECT_INTERNAL(Connect(filter, noSink), noDestinationText);
    ORVO_EXPECT_INTERNAL(Connect(filter, static_cast<Input*>(nullptr)), "Enforce pInput != NULL");
    ORVO_EXPECT_INTERNAL(Connect(filter, filter->input("unknown")), "Enforce pInput != NULL");
    ORVO_EXPECT_INTERNAL(Internal::Connect(nullptr, filter.get()), noSourceText);
    ORVO_EXPECT_INTERNAL(Internal::Connect(nullptr, filter->input("src")), noSourceText);
    ORVO_EXPECT_INTERNAL(Internal::Connect(filter.get(), static_cast<Internal::Filter*>(nullptr)),
                         noDestinationText);
    EXPECT_EQ(filter->getTimeStamp(), 0);
}

TEST(ConnectTest, RefusesFiltersThatAreNoneOfTheLibrarys) {
    std::shared_ptr<IFilter> const foreign = std::make_shared<ORVO::Test::ForeignFilter>();
    PlainPtr const filter = makePlain("filter", {"src"});
    ORVO_EXPECT_INTERNAL(Connect(foreign, filter), "Enforce pSourceFilter != NULL");
    ORVO_EXPECT_INTERNAL(Connect(foreign, filter->input("src")), "Enforce pSourceFilter != NULL");
    ORVO_EXPECT_INTERNAL(Connect(filter, foreign), "Enforce pDestinationFilter != NULL");
    EXPECT_EQ(filter->getTimeStamp(), 0);
    DisconnectAll(foreign.get());
}

TEST(ConnectTest, TakesAdaptersOnBothEnds) {
    std::shared_ptr<IInputAdapter> const source = createInputAdapter(IAdapter::REGION_SYNC_FROM_IMAGE);
    std::shared_ptr<IOutputAdapter> const sink = createOutputAdapter(IAdapter::REGION_SYNC_FROM_IMAGE);
    PlainPtr const filter = makePlain("filter", {"src"});
    Connect(source, std::shared_ptr<IFilter>(filter));
    EXPECT_EQ(filter->input("src")->producerFilter(), source->getIFilter());
    Connect(filter, sink);
    EXPECT_EQ(sink->getIFilter()->input("InputImage")->producerFilter(), filter.get());
    Connect(source, filter->input("src"));
    EXPECT_EQ(filter->input("src")->producerFilter(), source->getIFilter());
    Connect(source, sink);
    EXPECT_EQ(sink->getIFilter()->input("InputImage")->producerFilter(), source->getIFilter());
    EXPECT_EQ(filter->output()->numConsumerInputs(), 0u);
}

TEST(DisconnectTest, UnlinksBothSidesAndMovesBothTimeStamps) {
    PlainPtr const source = makePlain("source");
    PlainPtr const target = makePlain("target", {"src"});
    Connect(source, target);
    Disconnect(target->input("src"));
    EXPECT_EQ(target->input("src")->producerFilter(), nullptr);
    EXPECT_EQ(source->output()->numConsumerInputs(), 0u);
    EXPECT_EQ(source->getTimeStamp(), 2);
    EXPECT_EQ(target->getTimeStamp(), 2);
}

TEST(DisconnectTest, RefusesNullAndUnconnectedInputs) {
    PlainPtr const filter = makePlain("filter", {"src"});
    ORVO_EXPECT_INTERNAL(Disconnect(nullptr), "Enforce pInput != NULL");
    ORVO_EXPECT_INTERNAL(Disconnect(filter->input("src")), "Enforce pProducer != NULL");
    EXPECT_EQ(filter->getTimeStamp(), 0);
}

TEST(DisconnectAllTest, DisconnectsEveryConnectedInput) {
    PlainPtr const one = makePlain("one");
    PlainPtr const two = makePlain("two");
    PlainPtr const target = makePlain("target", {"a", "b", "c"});
    PlainPtr const consumer = makePlain("consumer", {"src"});
    Connect(one, target->input("a"));
    Connect(two, target->input("c"));
    Connect(target, consumer);
    DisconnectAll(target.get());
    for (Input const* pInput : target->inputs())
        EXPECT_EQ(pInput->producerFilter(), nullptr) << pInput->name();
    EXPECT_EQ(one->getTimeStamp(), 2);
    EXPECT_EQ(two->getTimeStamp(), 2);
    EXPECT_EQ(target->getTimeStamp(), 5);
    EXPECT_EQ(consumer->input("src")->producerFilter(), target.get());

    DisconnectAll(target.get());
    EXPECT_EQ(target->getTimeStamp(), 5);
    ORVO_EXPECT_INTERNAL(DisconnectAll(nullptr), "Enforce pFilter != NULL");
}

TEST(ConnectTest, SurvivesTheDeathOfTheProducer) {
    PlainPtr const target = makePlain("target", {"a", "b"});
    {
        PlainPtr const source = makePlain("source");
        Connect(source, target->input("a"));
        Connect(source, target->input("b"));
    }
    EXPECT_EQ(target->input("a")->producerFilter(), nullptr);
    EXPECT_EQ(target->input("b")->producerFilter(), nullptr);
    EXPECT_EQ(target->getTimeStamp(), 2);
    PlainPtr const next = makePlain("next");
    Connect(next, target->input("a"));
    EXPECT_EQ(target->input("a")->producerFilter(), next.get());
}

TEST(ConnectTest, SurvivesTheDeathOfTheConsumer) {
    PlainPtr const source = makePlain("source");
    {
        PlainPtr const target = makePlain("target", {"a", "b"});
        Connect(source, target->input("a"));
        Connect(source, target->input("b"));
    }
    EXPECT_EQ(source->output()->numConsumerInputs(), 0u);
    EXPECT_EQ(source->getTimeStamp(), 4);
}

TEST(ConnectTest, LetsAFilterThatFeedsItselfDie) {
    PlainPtr const loop = makePlain("loop", {"src"});
    Connect(loop, loop);
    EXPECT_EQ(loop->input("src")->producerFilter(), loop.get());
    EXPECT_EQ(loop->getTimeStamp(), 2);
}

} // namespace
} // namespace ORVO::FilterGraph
