#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/impl/IProcessorBase.h"

namespace ORVO::FilterGraph {

/// Computes frames of a graph that is embedded in a host with regions of its own. The host sets the domains
/// of definition of the sources and the region of interest of the sink, may learn from the two propagations
/// what a frame needs and gives before any pixels exist, and then runs the frame, which repeats the three
/// steps.
///
/// Threads: as `IProcessorBase`.
class ORVO_API IEmbeddedProcessor : public IProcessorBase {
public:
    ~IEmbeddedProcessor() override;

    /// Brings the compiled graph up to date with the client's graph and the options. The images that are
    /// bound need a descriptor and no pixels yet.
    /// @throws Exception for mistakes in the graph: an unconnected input, a cycle.
    /// @throws InternalException "Processing with FULL_OPTIMIZATION needs valid GL context." without a
    /// context.
    virtual void prepareForProcessing(OptimizationOptions const& options) = 0;

    /// Takes over the parameter values, and finds the domain of definition of the sink from those of the
    /// sources.
    virtual void propagateDomainsOfDefinition() = 0;

    /// Finds the regions of interest of the sources from that of the sink.
    virtual void propagateRegionOfInterest() = 0;

    /// Does the three steps above, computes one frame and returns when it stands in the output image.
    virtual void processFrameEmbedded(OptimizationOptions const& options) = 0;

    /// Does the three steps above, launches one frame and returns its handle at once.
    virtual void* asyncProcessFrameEmbedded(OptimizationOptions const& options) = 0;
};

} // namespace ORVO::FilterGraph
