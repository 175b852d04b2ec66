#include "orvo/filter_graph/internal/GraphTraverser.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <stdexcept>
#include <string>
#include <vector>

#include "orvo/filter_graph/internal/Connect.h"
#include "orvo/filter_graph/internal/Filter.h"
#include "orvo/filter_graph/internal/IFilterExecutable.h"
#include "orvo/filter_graph/internal/INodeVisitor.h"
#include "tests/support/Expect.h"
#include "tests/support/ExpectFilterGraph.h"

namespace ORVO::FilterGraph::Internal {
namespace {

/// A filter with a name and any number of inputs, "in0", "in1" and so on.
class NamedFilter : public Filter {
public:
    explicit NamedFilter(std::string const& name, int nInputs = 1) {
        setIdentifier(Identifier(name, "test", "ORVO", 1));
        for (int iInput = 0; iInput < nInputs; ++iInput) {
            addInput("in" + std::to_string(iInput), 0);
        }
    }

    std::shared_ptr<Filter> clone() override { return std::shared_ptr<Filter>(new NamedFilter(*this)); }

    std::shared_ptr<IFilterExecutable> buildFilterExecutable(TargetPlatform, GraphExecutable&) override {
        return nullptr;
    }

protected:
    NamedFilter(NamedFilter const&) = default;
};

/// Writes down what the walk does: "+a" on entering a, "-a" on leaving it.
class Recorder : public INodeVisitor {
public:
    void preVisit(Filter* pFilter) override {
        aSteps.push_back("+" + pFilter->identifier().name());
        if (pFilter->identifier().name() == throwAt) {
            throw std::runtime_error("from the visitor");
        }
    }

    void postVisit(Filter* pFilter) override { aSteps.push_back("-" + pFilter->identifier().name()); }

    std::vector<std::string> aSteps;
    std::string throwAt;
};

void connect(Filter& source, Filter& destination, std::string const& input = "in0") {
    Connect(&source, destination.input(input));
}

TEST(GraphTraverser, RefusesANullGraph) {
    Recorder recorder;
    ORVO_EXPECT_INTERNAL(GraphTraverser(nullptr, &recorder), "Enforce pGraph_ != NULL");
}

TEST(GraphTraverser, HasNoBreadthFirstWalk) {
    Recorder recorder;
    NamedFilter filter("a", 0);
    ORVO_EXPECT_INTERNAL(GraphTraverser(&filter, &recorder).breadthFirstTraversal(), "Not implemented.");
    EXPECT_TRUE(recorder.aSteps.empty());
}

//        a
//       / \      the walk starts at d and follows in0 (to b) before in1 (to c)
//      b   c
//       \ /
//        d
TEST(GraphTraverser, VisitsACommonProducerOnceAndBeforeBothConsumersAreLeft) {
    NamedFilter a("a", 0), b("b"), c("c"), d("d", 2);
    connect(a, b);
    connect(a, c);
    connect(b, d, "in0");
    connect(c, d, "in1");
    Recorder recorder;
    GraphTraverser(&d, &recorder).depthFirstTraversal();
    EXPECT_EQ(recorder.aSteps, (std::vector<std::string>{"+d", "+b", "+a", "-a", "-b", "+c", "-c", "-d"}));
    for (Filter const* const pFilter : {static_cast<Filter*>(&a), static_cast<Filter*>(&b),
                                        static_cast<Filter*>(&c), static_cast<Filter*>(&d)}) {
        EXPECT_EQ(pFilter->getColor(), 0u);
    }
}

TEST(GraphTraverser, NamesTheFirstOfTwoUnconnectedInputs) {
    NamedFilter a("two", 2);
    Recorder recorder;
    ORVO_EXPECT_FILTERGRAPH(GraphTraverser(&a, &recorder).depthFirstTraversal(), "two::in0 is not connected");
}

TEST(GraphTraverser, VisitsNothingAboveOrAfterAnUnconnectedInput) {
    NamedFilter a("a", 0), b("b", 3);
    connect(a, b, "in2");
    Recorder recorder;
    ORVO_EXPECT_FILTERGRAPH(GraphTraverser(&b, &recorder).depthFirstTraversal(), "b::in0 is not connected");
    EXPECT_EQ(recorder.aSteps, (std::vector<std::string>{"+b"}));
}

TEST(GraphTraverser, ReportsACycleAtTheFilterWhereThePathCloses) {
    NamedFilter a("a"), b("b"), c("c"), sink("sink");
    connect(c, a);
    connect(a, b);
    connect(b, c);
    connect(b, sink);
    Recorder recorder;
    // sink, b, a, c, and back to b.
    ORVO_EXPECT_FILTERGRAPH(GraphTraverser(&sink, &recorder).depthFirstTraversal(),
                            "b: circular reference detected in filter");
    EXPECT_EQ(recorder.aSteps, (std::vector<std::string>{"+sink", "+b", "+a", "+c"}));
}

TEST(GraphTraverser, ReportsAFilterThatFeedsItself) {
    NamedFilter a("self");
    connect(a, a);
    Recorder recorder;
    ORVO_EXPECT_FILTERGRAPH(GraphTraverser(&a, &recorder).depthFirstTraversal(),
                            "self: circular reference detected in filter");
}

TEST(GraphTraverser, DoesNotSeeACycleThatTheOutputDoesNotReach) {
    NamedFilter source("source", 0), sink("sink"), x("x"), y("y", 2);
    connect(source, sink);
    connect(x, y, "in0");
    connect(source, y, "in1");
    connect(y, x);
    Recorder recorder;
    GraphTraverser(&sink, &recorder).depthFirstTraversal();
    EXPECT_EQ(recorder.aSteps, (std::vector<std::string>{"+sink", "+source", "-source", "-sink"}));
}

TEST(GraphTraverser, LeavesItsMarksAfterACycleUntilTheGraphIsReset) {
    NamedFilter source("source", 0), a("a"), b("b");
    connect(a, b);
    connect(b, a);
    Recorder recorder;
    ORVO_EXPECT_FILTERGRAPH(GraphTraverser(&b, &recorder).depthFirstTraversal(),
                            "b: circular reference detected in filter");
    EXPECT_EQ(a.getColor(), 1u);
    EXPECT_EQ(b.getColor(), 1u);

    // The cycle is gone, and the marks still say that it is there.
    connect(source, a);
    ORVO_EXPECT_FILTERGRAPH(GraphTraverser(&b, &recorder).depthFirstTraversal(),
                            "b: circular reference detected in filter");

    GraphTraverser traverser(&b, &recorder);
    traverser.resetGraph();
    EXPECT_EQ(a.getColor(), 0u);
    EXPECT_EQ(b.getColor(), 0u);
    recorder.aSteps.clear();
    traverser.depthFirstTraversal();
    EXPECT_EQ(recorder.aSteps, (std::vector<std::string>{"+b", "+a", "+source", "-source", "-a", "-b"}));
}

TEST(GraphTraverser, ClearsTheMarksOfItsOwnFailedWalkInABrokenGraph) {
    NamedFilter a("a"), b("b");
    connect(a, b);
    Recorder recorder;
    GraphTraverser traverser(&b, &recorder);
    ORVO_EXPECT_FILTERGRAPH(traverser.depthFirstTraversal(), "a::in0 is not connected");
    EXPECT_EQ(b.getColor(), 1u);
    traverser.clearMarks();
    EXPECT_EQ(a.getColor(), 0u);
    EXPECT_EQ(b.getColor(), 0u);
}

TEST(GraphTraverser, ResetNeedsConnectedInputs) {
    NamedFilter a("a");
    Recorder recorder;
    ORVO_EXPECT_INTERNAL(GraphTraverser(&a, &recorder).resetGraph(), "Enforce pSource != NULL");
}

TEST(GraphTraverser, ResetGoesOnlyIntoProducersThatAreMarked) {
    NamedFilter a("a", 0), b("b"), c("c");
    connect(a, b);
    connect(b, c);
    a.setColor(2);
    c.setColor(2);
    Recorder recorder;
    GraphTraverser(&c, &recorder).resetGraph();
    EXPECT_EQ(c.getColor(), 0u);
    EXPECT_EQ(a.getColor(), 2u) << "b is not marked, so nothing above it is reset";
}

TEST(GraphTraverser, LeavesNoMarksWhenTheVisitorThrows) {
    NamedFilter a("a", 0), b("b"), c("c");
    connect(a, b);
    connect(b, c);
    Recorder recorder;
    recorder.throwAt = "a";
    EXPECT_THROW(GraphTraverser(&c, &recorder).depthFirstTraversal(), std::runtime_error);
    EXPECT_EQ(a.getColor(), 0u);
    EXPECT_EQ(b.getColor(), 0u);
    EXPECT_EQ(c.getColor(), 0u);
}

TEST(GraphTraverser, WalksADeepChain) {
    constexpr std::size_t kDepth = 20000;
    std::vector<std::unique_ptr<NamedFilter>> aChain;
    aChain.push_back(std::make_unique<NamedFilter>("source", 0));
    for (std::size_t i = 1; i < kDepth; ++i) {
        aChain.push_back(std::make_unique<NamedFilter>("link"));
        connect(*aChain[i - 1], *aChain[i]);
    }
    Recorder recorder;
    GraphTraverser traverser(aChain.back().get(), &recorder);
    traverser.depthFirstTraversal();
    EXPECT_EQ(recorder.aSteps.size(), 2 * kDepth);
    for (auto const& pFilter : aChain) {
        pFilter->setColor(2);
    }
    traverser.resetGraph();
    EXPECT_EQ(aChain.front()->getColor(), 0u);
}

TEST(INodeVisitor, DoesNothingUnlessOverridden) {
    class Empty : public INodeVisitor {
    } visitor;
    NamedFilter a("a", 0);
    GraphTraverser(&a, &visitor).depthFirstTraversal();
    EXPECT_EQ(a.getColor(), 0u);
}

} // namespace
} // namespace ORVO::FilterGraph::Internal
