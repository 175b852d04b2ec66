#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/impl/IProcessorBase.h"

namespace ORVO::FilterGraph {

/// Computes frames of a graph whose regions are those of the bound images: what most hosts need.
///
///     std::shared_ptr<IProcessor> processor = createProcessor(output, nullptr);
///     IProcessor::OptimizationOptions options;
///     options.setProcessingMode(OptimizationOptions::CPU_PROCESSING);
///     processor->processFrame(options);    // the pixels now stand in the image bound to `output`
///
/// Threads: as `IProcessorBase`.
class ORVO_API IProcessor : public IProcessorBase {
public:
    ~IProcessor() override;

    /// Computes one frame and returns when it stands in the output image.
    /// @throws Exception for mistakes in the graph: an unconnected input, a cycle.
    /// @throws InternalException "Processing with FULL_OPTIMIZATION needs valid GL context." without a
    /// context.
    virtual void processFrame(OptimizationOptions const& options) = 0;

    /// Prepares one frame as `processFrame` does, launches it and returns the frame's handle at once. What
    /// goes wrong before the launch is thrown here, all else by `frameStatus` and `waitForFrame`.
    virtual void* asyncProcessFrame(OptimizationOptions const& options) = 0;
};

} // namespace ORVO::FilterGraph
