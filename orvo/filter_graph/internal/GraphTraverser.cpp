#include "orvo/filter_graph/internal/GraphTraverser.h"

#include <cstdint>

#include "orvo/core/Check.h"
#include "orvo/filter_graph/impl/Exception.h"
#include "orvo/filter_graph/impl/IFilter.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/internal/Filter.h"
#include "orvo/filter_graph/internal/INodeVisitor.h"

namespace ORVO::FilterGraph::Internal {

namespace {

// The marks that a walk leaves in `Filter::color`.
constexpr std::uint32_t kUnvisited = 0;
constexpr std::uint32_t kOnPath = 1;
constexpr std::uint32_t kDone = 2;

/// A filter on the current path, with the inputs that are still to be followed.
struct Step {
    Filter* pFilter;
    InputIterator oInputs;
};

/// Producers are set by `Connect`, which takes a `Filter`: there are no others.
Filter* producerOf(Input const& input) { return static_cast<Filter*>(input.producerFilter()); }

[[noreturn]] void failOnCycle(Filter const& filter) {
    throw Exception(filter.identifier().name() + ": circular reference detected in filter");
}

[[noreturn]] void failOnUnconnectedInput(Filter const& filter, Input const& input) {
    throw Exception(filter.identifier().name() + "::" + input.name() + " is not connected");
}

} // namespace

GraphTraverser::GraphTraverser(IFilter* graph, INodeVisitor* visitor) : pGraph_(graph), pVisitor_(visitor) {
    ORVO_ENFORCE(pGraph_);
}

void GraphTraverser::depthFirstTraversal() {
    traverseDepthFirst(dynamic_cast<Filter*>(pGraph_));
    // Every filter that the walk marked is one that a walk to reset the marks would reach.
    clearMarks();
}

void GraphTraverser::breadthFirstTraversal() { ORVO_FAIL("Not implemented."); }

void GraphTraverser::resetGraph() { traverseAndResetGraph(dynamic_cast<Filter*>(pGraph_)); }

void GraphTraverser::clearMarks() noexcept {
    for (Filter* pFilter : aMarked_) {
        pFilter->resetColor();
    }
    aMarked_.clear();
}

void GraphTraverser::traverseDepthFirst(Filter* pFilter) {
    aMarked_.clear();
    if (!pFilter) {
        return;
    }

    bool bGraphIsBroken = false;
    std::vector<Step> aPath;
    auto const enter = [&](Filter* pEntered) {
        if (pEntered->getColor() == kOnPath) {
            bGraphIsBroken = true;
            failOnCycle(*pEntered);
        }
        if (pEntered->getColor() == kDone) {
            return;
        }
        aMarked_.push_back(pEntered);
        pEntered->setColor(kOnPath);
        pVisitor_->preVisit(pEntered);
        aPath.push_back({pEntered, pEntered->inputs()});
    };

    try {
        enter(pFilter);
        while (!aPath.empty()) {
            Step& step = aPath.back();
            if (step.oInputs.isValid()) {
                Input const& input = **step.oInputs;
                ++step.oInputs;
                Filter* const pProducer = producerOf(input);
                if (!pProducer) {
                    bGraphIsBroken = true;
                    failOnUnconnectedInput(*step.pFilter, input);
                }
                enter(pProducer);
            } else {
                Filter* const pLeft = step.pFilter;
                aPath.pop_back();
                pVisitor_->postVisit(pLeft);
                pLeft->setColor(kDone);
            }
        }
    } catch (...) {
        // The marks of a broken graph stay. What a visitor throws says nothing about the graph, which must
        // remain walkable.
        if (!bGraphIsBroken) {
            clearMarks();
        }
        throw;
    }
}

void GraphTraverser::traverseAndResetGraph(Filter* pFilter) {
    if (!pFilter) {
        return;
    }
    std::vector<Filter*> aPending{pFilter};
    while (!aPending.empty()) {
        Filter* const pNext = aPending.back();
        aPending.pop_back();
        pNext->resetColor();
        for (InputIterator iInput = pNext->inputs(); iInput.isValid(); ++iInput) {
            Filter* const pSource = producerOf(**iInput);
            ORVO_ENFORCE(pSource);
            if (pSource->getColor() != kUnvisited) {
                // Taken back at once, so that a shared producer is not queued twice.
                pSource->resetColor();
                aPending.push_back(pSource);
            }
        }
    }
}

} // namespace ORVO::FilterGraph::Internal
