#pragma once

#include <atomic>
#include <map>
#include <memory>
#include <thread>
#include <vector>

#include "orvo/core/Export.h"
#include "orvo/core/TargetPlatform.h"
#include "orvo/filter_graph/impl/IProcessorBase.h"
#include "orvo/filter_graph/internal/ClientTextureParameters.h"
#include "orvo/filter_graph/internal/ParameterForwarder.h"

namespace ORVO {
class Bedding;
class ImageFilter;
class ImageFlowController;
class PixelExtentInWorldSpace;
} // namespace ORVO

namespace ORVO::DataFlow {
class InputConnector;
class OutputConnector;
} // namespace ORVO::DataFlow

namespace ORVO::OGL {
class Context;
class ContextOffscreen;
} // namespace ORVO::OGL

namespace ORVO::FilterGraph {
class IFilter;
} // namespace ORVO::FilterGraph

namespace ORVO::FilterGraph::Internal {

class Filter;
class IFilterExecutable;
class InputAdapter;
class OutputAdapter;

/// The compiled form of one intermediate graph for one set of options: image nodes on a controller, wired
/// together, with the conversions that the graph needs. Built by its constructor; afterwards it only runs
/// frames and carries regions.
///
/// One target serves the whole graph and is taken from the processing mode. Converter nodes bridge what
/// differs: the layout that a node wants its pixels in, and the place where the client's images live.
///
/// With a context the graph has a hidden context of its own that shares with it. Nodes are built, run and
/// freed in that one, and whatever context the host has current is current again after each call. What the
/// host's context, current at a launch, was given before is done before the frame touches a client's texture.
/// What a frame draws into one is drawn before anything that the host's context, current at `processFrame`,
/// is given afterwards; at the end of an asynchronous frame, or where the host has none current, it is
/// complete. Filters, wrap modes and border colours of the textures that a frame reads are another's while it
/// runs and what they were at its end.
///
/// What a frame may keep of the one before: with `cachingMode` 0 nothing. With any other mode the results of
/// the nodes that are not dirty, where dirty is a node one of whose parameters changed, a source whose image
/// may have changed, and all that hangs behind these. A frame that failed or was cancelled leaves nothing
/// that a later one would take.
///
/// Threads: the host's thread; `returnStuff` and the completion callback of an asynchronous frame run on the
/// thread that ends it. `cancelFrame`, `checkException` and `isProcessingComplete` may be called from any
/// thread while a frame runs.
class ORVO_API GraphExecutable {
public:
    using OptimizationOptions = IProcessorBase::OptimizationOptions;

    /// Builds the graph that ends at `pGraph`, an output adapter with an image. `pGraph` and all filters
    /// above it must outlive this object. Throws InternalException "Enforce pOutput_ != NULL" if `pGraph` is
    /// no output adapter,
    /// "!ORVO::ImageFlow::Library::cpuOnlyMode()" if a context is given to a library that was started without
    /// one,
    /// "!\"unsupported processing mode!\"" for a processing mode other than 0 and 1, and what building the
    /// filters and connecting them throws.
    GraphExecutable(IFilter* pGraph, OptimizationOptions const& options, OGL::Context const* context);

    /// Cancels a running frame, waits for it, and frees the nodes.
    virtual ~GraphExecutable();

    GraphExecutable(GraphExecutable const&) = delete;
    GraphExecutable& operator=(GraphExecutable const&) = delete;

    /// Runs a frame to its end. No completion callback is called.
    void processFrame();

    /// Launches a frame and returns its handle, which is this object's address.
    void* asyncProcessFrame();

    /// Asks a running frame to stop.
    void cancelFrame();

    /// The controller's `wait`: false if the frame still ran after about `timeout` seconds.
    bool waitForFrame(double timeout, double interval);

    /// Lets the calling thread sleep for this number of seconds.
    virtual void sleep(double seconds);

    /// False from a launch to the end of the frame.
    bool isProcessingComplete() const { return bProcessingComplete_.load(std::memory_order_acquire); }

    /// Rethrows, once, what a worker thread saved (as SharedException).
    void checkException();

    /// Waits until no asynchronous frame runs. Throws InternalException "The completion callback must not
    /// change the frame that it ends" if called from within that callback.
    void waitForRunningFrame();

    /// Called at the end of each asynchronous frame with the frame's handle. Null is allowed.
    void setCompletionCallback(bool (*callback)(void*));

    /// Forwards values to the nodes, then carries pixel extents and domains of definition from the sources to
    /// the sink.
    void propagateDOD();

    /// Forwards values to the nodes, then carries the region of interest of the output adapter to the
    /// sources.
    void propagateROI();

    /// Forwards to the nodes of the adapters alone.
    void forwardImagesToImageFlowGraph();

    /// The pixel extent of the output adapter's image. Throws InternalException "Enforce pOutputAdapter !=
    /// NULL" without an adapter.
    PixelExtentInWorldSpace outputPixelExtentInWorldSpace();

    /// The options that the graph was built for.
    OptimizationOptions const& options() const { return options_; }

    /// The controller that holds the nodes; owned here.
    std::shared_ptr<ImageFlowController> const& controller() const { return spController_; }

private:
    /// The connectors that bear one producer's image, by form (see `convertedOutputIndex`); null where a form
    /// does not exist.
    using ConvertedOutputs = std::vector<DataFlow::OutputConnector*>;

    void buildGraphExecutable();
    /// Frees filter executables and converters with the graph's context current.
    void freeNodes() noexcept;
    /// Connects the node of `pFilter` to those of its consumers; the sink, where it feeds the output adapter.
    ImageFilter* connectConsumers(Filter* pFilter, IFilterExecutable& executable,
                                  ConvertedOutputs& convertedOutputs);
    DataFlow::OutputConnector* bringToOutputAdapter(IFilterExecutable& executable,
                                                    IFilterExecutable& outputExecutable,
                                                    DataFlow::OutputConnector* pOutput);
    void collectForFrames();
    IFilterExecutable& executableOf(Filter* pFilter);
    DataFlow::OutputConnector*
    checkTargetsAndConnect(Filter* pSrcFilter, DataFlow::OutputConnector* pSrcConnector, Filter* pDstFilter,
                           DataFlow::InputConnector* pDstConnector, ConvertedOutputs* pConvertedOutputsVec);
    void makeDataFlowConnection(DataFlow::OutputConnector* pSrcConnector,
                                DataFlow::InputConnector* pDstConnector);
    DataFlow::OutputConnector* appendImageFlowConverter(std::shared_ptr<ImageFilter> const& spConverter,
                                                        DataFlow::OutputConnector* pOutputConnector);
    DataFlow::InputConnector* prependImageFlowConverter(std::shared_ptr<ImageFilter> const& spConverter,
                                                        DataFlow::InputConnector* pInputConnector);
    DataFlow::OutputConnector* unconnectedOutput(DataFlow::OutputConnector* pOutputConnector);
    static int convertedOutputIndex(TargetPlatform target, bool isSIMD);
    void setIntermediateBufferPrecision();

    /// Waits for the frame before, and clears what it left behind if it did not end normally.
    void settleLastFrame();
    /// Fixes the formats of the nodes from the output image.
    void prepareNodes();
    /// Drops every result that the frame must not take over, and sees to it that the outputs of one node hold
    /// its image either all or none.
    void prepareCaches();
    void shareAmongOutputs(ImageFilter& node);
    /// Allocates the output image of each node that the frame will run, on this thread.
    void allocateOutputImages();
    void returnStuff();
    /// Whether frames draw into a client's texture.
    bool drawsIntoTexture() const;
    /// Whether frames read or draw into a client's texture.
    bool usesTextures() const;
    /// Notes how the client has the textures sampled that a frame reads.
    void keepTextureParameters(ClientTextureParameters& parameters) const;
    /// At the end of an asynchronous frame: leaves the client's textures complete and sampled as before.
    void settleTextures();
    /// Puts back, after an asynchronous frame, what its thread could not, which was refused the context.
    void putBackTextureParameters();
    /// Whether the current context shares with the graph's.
    bool isHostSharing() const;
    static bool internalCompletionCallback(void* self);
    void callCompletionCallback();

    OutputAdapter* pOutput_;
    OptimizationOptions options_;
    std::shared_ptr<OGL::ContextOffscreen> spContext_; // null in CPU-only use; outlives the controller
    std::shared_ptr<ImageFlowController> spController_;
    std::shared_ptr<Bedding> spBedding_;
    std::map<Filter*, std::shared_ptr<IFilterExecutable>> aFilterExecutables_;
    std::vector<std::shared_ptr<ImageFilter>> aConverters_;
    std::atomic<bool> bProcessingComplete_{true};
    std::atomic<bool (*)(void*)> pCompletionCallback_{nullptr};
    ParameterForwarder forwarder_;

    std::vector<IFilterExecutable*> aExecutablesInOrder_; // the values of aFilterExecutables_ in map order
    std::vector<IFilterExecutable*> aAdapterExecutables_; // those among them whose key is an adapter
    std::vector<InputAdapter*> aTextureInputs_;           // those whose image is a client's texture
    std::vector<ImageFilter*> aNodesProducersFirst_;      // all that the sink reaches
    std::vector<ImageFilter*> aFanOutNodes_;              // those among them with more than one output

    bool bFrameOut_ = false;                         // an asynchronous frame was launched and not waited for
    std::atomic<bool> bLastFrameBroken_{false};      // the last frame threw, or failed on its thread
    std::atomic<bool> bCancelled_{false};            // a cancel was asked for since the last launch
    ClientTextureParameters oTextureParameters_;     // of the asynchronous frame that is out
    std::atomic<std::thread::id> oCallbackThread_{}; // the thread that is inside the completion callback
};

} // namespace ORVO::FilterGraph::Internal
