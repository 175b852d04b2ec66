#include <gtest/gtest.h>

#include "orvo/filter_graph/impl/Connect.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/Output.h"
#include "tests/filter_graph/support/PlainFilter.h"
#include "tests/support/Expect.h"

namespace ORVO::FilterGraph {
namespace {

using ORVO::Test::makePlain;
using ORVO::Test::PlainFilter;

// What only filters may call. An explicit instantiation may name private members.
template <class Tag, typename Tag::type Member>
struct Access {
    friend typename Tag::type access(Tag) { return Member; }
};

struct CloneInput {
    using type = Input* (Input::*)(IFilter*) const;
    friend type access(CloneInput);
};

struct CloneOutput {
    using type = Output* (Output::*)(IFilter*) const;
    friend type access(CloneOutput);
};

template struct Access<CloneInput, &Input::clone>;
template struct Access<CloneOutput, &Output::clone>;

TEST(InputTest, NeedsAParent) {
    PlainFilter filter("filter", {"src"});
    Input const& input = *filter.input("src");
    ORVO_EXPECT_INTERNAL((input.*access(CloneInput()))(nullptr), "Need valid pParentFilter.");
}

TEST(OutputTest, NeedsAParentUnlessItIsMadeByDefault) {
    Output const output;
    ORVO_EXPECT_INTERNAL((output.*access(CloneOutput()))(nullptr), "Need valid parent filter.");
}

TEST(InputTest, KnowsItsNameItsChannelsAndItsFilter) {
    PlainFilter filter;
    filter.addInput("src", 3);
    filter.addInput("", 0);
    Input const* pInput = filter.input("src");
    ASSERT_TRUE(pInput);
    EXPECT_EQ(pInput->name(), "src");
    EXPECT_EQ(pInput->nChannel(), 3u);
    EXPECT_EQ(pInput->parentFilter(), &filter);
    EXPECT_EQ(pInput->producerFilter(), nullptr);
    ASSERT_TRUE(filter.input(""));
    EXPECT_EQ(filter.input("")->nChannel(), 0u);
}

TEST(OutputTest, IsCalledDstAndBelongsToNobodyByDefault) {
    Output const output;
    EXPECT_EQ(output.name(), "dst");
    EXPECT_EQ(output.nChannel(), 0u);
    EXPECT_EQ(output.parentFilter(), nullptr);
    EXPECT_EQ(output.numConsumerInputs(), 0u);
    EXPECT_FALSE(output.consumerInputs().isValid());
}

TEST(OutputTest, CanBeRenamedAndGivenChannels) {
    PlainFilter filter;
    EXPECT_EQ(filter.nChannel(), 0u);
    filter.output()->setName("result");
    filter.output()->setNumChannels(4);
    EXPECT_EQ(filter.output()->name(), "result");
    EXPECT_EQ(filter.nChannel(), 4u);
    // The output of a copy has the copy as its parent.
    PlainFilter const copy(filter);
    EXPECT_EQ(copy.output()->name(), "result");
    EXPECT_EQ(copy.nChannel(), 4u);
    EXPECT_EQ(copy.output()->parentFilter(), &copy);
    EXPECT_EQ(filter.output()->parentFilter(), nullptr);
}

TEST(OutputTest, ListsItsConsumersInBothForms) {
    auto const source = makePlain("source");
    auto const target = makePlain("target", {"a", "b"});
    Connect(source, target->input("b"));
    Connect(source, target->input("a"));
    Output* const pOutput = source->output();
    std::string names;
    for (Input* pInput : pOutput->consumerInputs())
        names += pInput->name();
    for (Input const* pInput : static_cast<Output const*>(pOutput)->consumerInputs())
        names += pInput->name();
    EXPECT_EQ(names, "baba");
    EXPECT_EQ(pOutput->numConsumerInputs(), 2u);
}

} // namespace
} // namespace ORVO::FilterGraph
