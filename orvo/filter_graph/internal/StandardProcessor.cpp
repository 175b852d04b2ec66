#include "orvo/filter_graph/internal/StandardProcessor.h"

namespace ORVO::FilterGraph::Internal {

StandardProcessor::StandardProcessor(OutputAdapter* pGraph, OGL::Context const* context)
    : oProcessor_(pGraph, IAdapter::REGION_SYNC_FROM_IMAGE, context) {}

StandardProcessor::~StandardProcessor() = default;

IProcessorBase::eFrameStatus StandardProcessor::frameStatus() { return oProcessor_.frameStatus(); }

IProcessorBase::eFrameStatus StandardProcessor::waitForFrame(double timeout, double interval) {
    return oProcessor_.waitForFrame(timeout, interval);
}

IProcessorBase::eFrameStatus StandardProcessor::cancelFrame() { return oProcessor_.cancelFrame(); }

void StandardProcessor::sleep(double seconds) { oProcessor_.sleep(seconds); }

void StandardProcessor::setCompletionCallback(bool (*callback)(void*)) {
    oProcessor_.setCompletionCallback(callback);
}

void StandardProcessor::processFrame(OptimizationOptions const& options) {
    oProcessor_.processFrameEmbedded(options);
}

void* StandardProcessor::asyncProcessFrame(OptimizationOptions const& options) {
    return oProcessor_.asyncProcessFrameEmbedded(options);
}

} // namespace ORVO::FilterGraph::Internal
