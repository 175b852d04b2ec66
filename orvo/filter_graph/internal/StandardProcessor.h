#pragma once

#include "orvo/filter_graph/impl/IProcessor.h"
#include "orvo/filter_graph/internal/Processor.h"

namespace ORVO::FilterGraph::Internal {

/// The processor of hosts that want frames and nothing else: each operation is that of a `Processor` whose
/// regions follow the bound images.
///
/// Threads: as `Processor`.
class ORVO_API StandardProcessor : public IProcessor {
public:
    /// As the constructor of `Processor`, with the regions taken from the images.
    StandardProcessor(OutputAdapter* pGraph, OGL::Context const* context);

    /// Cancels a running frame and waits for it.
    ~StandardProcessor() override;

    eFrameStatus frameStatus() override;
    eFrameStatus waitForFrame(double timeout, double interval) override;
    eFrameStatus cancelFrame() override;
    void sleep(double seconds) override;
    void setCompletionCallback(bool (*callback)(void*)) override;

    /// `Processor::processFrameEmbedded`.
    void processFrame(OptimizationOptions const& options) override;

    /// `Processor::asyncProcessFrameEmbedded`.
    void* asyncProcessFrame(OptimizationOptions const& options) override;

private:
    Processor oProcessor_;
};

} // namespace ORVO::FilterGraph::Internal
