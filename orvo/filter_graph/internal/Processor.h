#pragma once

#include <atomic>
#include <map>
#include <memory>
#include <vector>

#include "orvo/filter_graph/impl/IAdapter.h"
#include "orvo/filter_graph/impl/IEmbeddedProcessor.h"
#include "orvo/filter_graph/internal/CheckTimeStampVisitor.h"
#include "orvo/filter_graph/internal/ParameterForwarder.h"

namespace ORVO::OGL {
class Context;
} // namespace ORVO::OGL

namespace ORVO::FilterGraph {
class IOutputAdapter;
} // namespace ORVO::FilterGraph

namespace ORVO::FilterGraph::Internal {

class Filter;
class GraphExecutable;
class InputAdapter;
class OutputAdapter;

/// Computes frames of a client graph. It owns a private copy of the graph, the intermediate graph, and the
/// executable that was built from it. Before each frame it compares time stamps and options, and builds both
/// anew if a filter was connected, disconnected or added, if an adapter holds an image of another form, or if
/// an option changed. Values of parameters, and images of the same form, are carried over on each frame and
/// rebuild nothing.
///
/// A frame that still runs is waited for before anything that it uses is changed: by the next launch, by a
/// propagation and by the destructor, which cancels it first. None of these, nor `waitForFrame`, may be
/// called from within the completion callback: a launch or a propagation is refused there (InternalException
/// "The completion callback must not change the frame that it ends"), a wait would never end.
///
/// If the client graph has a cycle or an unconnected input, the frame fails and the graph can be repaired and
/// run again: the marks of the failed walk are taken back.
///
/// Threads: the host's thread. While a frame runs, or is waited for, `frameStatus` and `cancelFrame` may be
/// called from other threads too.
class ORVO_API Processor : public IEmbeddedProcessor {
public:
    /// `pGraph` is the end of the client graph, `context` may be null. Neither is owned, and both must
    /// outlive the processor. Throws InternalException "Enforce pOriginalGraph_ != NULL" on a null graph.
    Processor(OutputAdapter* pGraph, IAdapter::eRegionSyncMode regionSyncMode, OGL::Context const* context);

    /// Cancels a running frame and waits for it.
    ~Processor() override;

    Processor(Processor const&) = delete;
    Processor& operator=(Processor const&) = delete;

    /// Moves the status on if the end of the frame can be seen, and rethrows, then and once, what a worker
    /// thread saved (as SharedException).
    eFrameStatus frameStatus() override;

    /// Waits for the frame, at most about `timeout` seconds, looking at it every `interval` seconds; then
    /// `frameStatus`. Throws InternalException "Enforce spGraphExecutable_ != NULL" if nothing was built yet.
    eFrameStatus waitForFrame(double timeout, double interval) override;

    /// Asks the frame to stop, then `frameStatus`. Throws as `waitForFrame`.
    eFrameStatus cancelFrame() override;

    /// Lets the calling thread sleep for this number of seconds. Throws as `waitForFrame`.
    void sleep(double seconds) override;

    /// The callback of asynchronous frames. It is called on the thread that ends the frame, with the handle
    /// that `asyncProcessFrameEmbedded` returned; its result is ignored. It is lost with a rebuild. Throws as
    /// `waitForFrame`.
    void setCompletionCallback(bool (*callback)(void*)) override;

    /// Brings the intermediate graph and the executable up to date. Throws InternalException "Processing with
    /// FULL_OPTIMIZATION needs valid GL context." if the options ask for OpenGL and there is no context,
    /// FilterGraph::Exception if the client graph is not whole, and what the filters throw when they are
    /// built.
    void prepareForProcessing(OptimizationOptions const& options) override;

    /// Carries parameter values and images down, and pixel extents and domains of definition from the sources
    /// to the sink; the regions then stand in the client's adapters.
    void propagateDomainsOfDefinition() override;

    /// Carries the region of interest from the sink to the sources; the regions then stand in the client's
    /// adapters.
    void propagateRegionOfInterest() override;

    /// Computes a frame on this call.
    void processFrameEmbedded(OptimizationOptions const& options) override;

    /// Launches a frame and returns its handle. Throws InternalException "pOriginalGraph_ &&
    /// pOriginalGraph_->getImage()" without an output image.
    void* asyncProcessFrameEmbedded(OptimizationOptions const& options) override;

    /// The end of the client graph.
    IOutputAdapter* output();

private:
    using CloneMap = std::map<Filter*, std::shared_ptr<Filter>>;

    /// An adapter of the client graph, its clone, and both in the forms that are needed on each frame.
    /// Exactly one of the two pairs of pointers is set.
    struct AdapterPair {
        IAdapter* pOriginal;
        IAdapter* pClone; // null if the clone is no adapter
        InputAdapter* pOriginalInput;
        InputAdapter* pCloneInput;
        OutputAdapter* pOriginalOutput;
        OutputAdapter* pCloneOutput;
    };

    void validateGraphExecutableAndIR(OptimizationOptions const& options);
    bool isUpToDate(OptimizationOptions const& options);
    void dropGraphs() noexcept;
    void createIR(OptimizationOptions const& options);
    void connectClones();
    Filter* cloneOfConsumer(IFilter* pConsumer);
    void collectAdapters();
    void clearIR() noexcept;
    void insertGPU15_1ScalingNodes();
    void insertInputScaling(Filter* pOriginal, Filter* pClone);
    void insertOutputScaling();
    void selectGraphExecutable(OptimizationOptions options);
    void forwardImagesFromInputGraphToIRGraph(bool requireImage);
    void forwardImagesFromIRGraphToImageFlowGraph();
    void prepareFrame(OptimizationOptions const& options);
    void forwardAdaptersToIRGraph();
    void returnRegionsToInputGraph();
    void waitForRunningFrame();

    OutputAdapter* pOriginalGraph_;
    CloneMap clones_;
    ParameterForwarder parameterForwarder_;
    std::vector<std::shared_ptr<ParameterForwarder>> aChildForwarders_;
    std::shared_ptr<GraphExecutable> spGraphExecutable_;
    IAdapter::eRegionSyncMode regionSyncMode_;
    std::atomic<eFrameStatus> frameStatus_;
    OGL::Context const* context_;
    CheckTimeStampVisitor::Memory
        aTimeStamps_;               // of the last walk that compared clones_ with the client graph
    OptimizationOptions irOptions_; // those that clones_ were made for
    std::vector<AdapterPair>
        aAdapters_; // those of clones_ in map order: a frame need not ask each filter for its kind
};

} // namespace ORVO::FilterGraph::Internal
