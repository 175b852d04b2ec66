#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/internal/Filter.h"

#include <memory>

namespace ORVO::FilterGraph::Internal {

/// The bilateral blur as a host sees it: one filter with the input "src" and the parameters "spatialSigma"
/// (float2, in pixels, default 10), "rangeSigma" (float, default 0.15) and "colorize" (bool, default false:
/// grey result). It has no node of its own: in the processor's copy of the graph it is replaced by the node
/// that suits the options.
///
/// On OpenGL that node stands between a filter that premultiplies and one that unpremultiplies, as the node
/// of the CPU does by itself; the factory must have "premultiply" and "unpremultiply" of name space "ORVO"
/// and vendor "Norvane" (insertStandardFilters() registers them).
///
/// Threads: as Filter.
class ORVO_API Bilateral : public Filter {
public:
    /// Identifier: name "FastBilateralBlur", nameSpace "Motion Loft", vendor "Norvane Works", version 1.
    Bilateral();
    /// Copies the filter's interface and values. Nothing of an unfolded state is carried over.
    Bilateral(Bilateral const& other);
    ~Bilateral() override;

    std::shared_ptr<Filter> clone() override;

    /// Puts the node filter "Bilateral Node", on OpenGL with its two companions around it, between this
    /// filter's producer and its consumers, and leaves this filter without connections; it keeps the new
    /// filters alive.
    /// @return the forwarder that carries the parameters of this filter to the node filter on each frame.
    /// @throws InternalException "myProducer" if the input has no producer, "Enforce pPrototype != NULL" if
    ///         the factory lacks a companion, "bilateralNode", "bilateralNode->isInitialized()", "premul",
    ///         "unpremul", "Enforce output != NULL". The connections are as they were then.
    std::shared_ptr<ParameterForwarder> unFold(OptimizationOptions const& options) override;

    /// False for every target: the filter is always unfolded first.
    bool canBuildFilterExecutable(TargetPlatform target) const override;
    /// An empty pointer.
    std::shared_ptr<IFilterExecutable> buildFilterExecutable(TargetPlatform target,
                                                             GraphExecutable& graphExecutable) override;

private:
    std::shared_ptr<Filter> makeBilateralNode(OptimizationOptions const& options) const;

    bool bPremultiply_;
    bool bUseSimpleCPU_;
    std::shared_ptr<IFilter> spPremultiply_;
    std::shared_ptr<IFilter> spUnpremultiply_;
    std::shared_ptr<Filter> spBilateralNode_;
};

} // namespace ORVO::FilterGraph::Internal
