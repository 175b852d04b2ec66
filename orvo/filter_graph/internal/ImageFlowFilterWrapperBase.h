#pragma once

#include <array>
#include <memory>

#include "orvo/core/TargetPlatform.h"
#include "orvo/filter_graph/impl/IFilter.h"
#include "orvo/filter_graph/internal/Filter.h"

namespace ORVO {
class ImageFilter;
} // namespace ORVO

namespace ORVO::FilterGraph::Internal {

/// A public filter made of an image node: it takes its inputs and parameters from a specimen of the node, and
/// makes a node of its own each time it is built into a graph.
///
/// Threads: the thread that owns the graph.
class ORVO_API ImageFlowFilterWrapperBase : public Filter {
public:
    /// Frees the specimens that were not built in, and the parameters.
    ~ImageFlowFilterWrapperBase() override;

    /// Makes the node for `target` and hands it to a new `ImageFlowFilterExecutable`. Throws
    /// InternalException "filter" if there is no node for this target.
    std::shared_ptr<IFilterExecutable> buildFilterExecutable(TargetPlatform target,
                                                             GraphExecutable& graphExecutable) override;

protected:
    explicit ImageFlowFilterWrapperBase(IFilter::Identifier const& identifier);

    /// A copy shares no node with its source.
    ImageFlowFilterWrapperBase(ImageFlowFilterWrapperBase const& other);

    ImageFlowFilterWrapperBase& operator=(ImageFlowFilterWrapperBase const&) = delete;

    /// Looks for the first target, from 0 upward, for which there is a node, and takes an input for each of
    /// its image inputs and a parameter for each of its parameters that has a public form. With no node at
    /// all: nothing in CPU-only mode, else InternalException "There must be at least one buildable target for
    /// the filter".
    void finishLazyInitialization() override;

    /// One specimen for each target, null where there is none; owned until it is built into a graph.
    std::array<ImageFilter*, 4> pFilters_{};

private:
    /// The node for `target`, from `pFilters_` or newly made and stored there; null if there is none for this
    /// target.
    virtual ImageFilter* createFilter(TargetPlatform target) = 0;

    void adoptInterface(ImageFilter& node);
};

} // namespace ORVO::FilterGraph::Internal
