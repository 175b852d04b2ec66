#include "orvo/filter_graph/internal/Processor.h"

#include "orvo/core/Check.h"
#include "orvo/filter_graph/impl/FilterFactory.h"
#include "orvo/filter_graph/impl/IFilter.h"
#include "orvo/filter_graph/impl/IOutputAdapter.h"
#include "orvo/filter_graph/impl/ImageDescriptor.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/Output.h"
#include "orvo/filter_graph/internal/CheckTimeStampVisitor.h"
#include "orvo/filter_graph/internal/CloneGraphVisitor.h"
#include "orvo/filter_graph/internal/Connect.h"
#include "orvo/filter_graph/internal/Filter.h"
#include "orvo/filter_graph/internal/GraphExecutable.h"
#include "orvo/filter_graph/internal/GraphTraverser.h"
#include "orvo/filter_graph/internal/ImageAccessor.h"
#include "orvo/filter_graph/internal/InputAdapter.h"
#include "orvo/filter_graph/internal/OutputAdapter.h"
#include "orvo/image_runtime/images/ImageBase.h"

namespace ORVO::FilterGraph::Internal {

namespace {

/// Walks the client graph. A graph that is not whole is reported, and left without marks: the host repairs it
/// and asks for the frame again.
void traverseClientGraph(OutputAdapter& graph, INodeVisitor& visitor) {
    GraphTraverser traverser(graph.getIFilter(), &visitor);
    try {
        traverser.depthFirstTraversal();
    } catch (...) {
        traverser.clearMarks();
        throw;
    }
}

} // namespace

Processor::Processor(OutputAdapter* pGraph, IAdapter::eRegionSyncMode regionSyncMode,
                     OGL::Context const* context)
    : pOriginalGraph_(pGraph), regionSyncMode_(regionSyncMode), frameStatus_(FRAME_NONE), context_(context) {
    ORVO_ENFORCE(pOriginalGraph_);
}

Processor::~Processor() = default;

IOutputAdapter* Processor::output() { return pOriginalGraph_; }

// ---- Status

IProcessorBase::eFrameStatus Processor::frameStatus() {
    eFrameStatus const eStatus = frameStatus_;
    if (eStatus == FRAME_RUNNING || eStatus == FRAME_CANCELLED) {
        ORVO_ENFORCE(spGraphExecutable_);
        if (spGraphExecutable_->isProcessingComplete()) {
            frameStatus_ = FRAME_COMPLETE;
            // Not before: other slices of a frame that has failed may still write the host's images, and fail
            // too. The host would be told twice, and the first time too early.
            spGraphExecutable_->checkException();
        }
    }
    return frameStatus_;
}

IProcessorBase::eFrameStatus Processor::waitForFrame(double timeout, double interval) {
    ORVO_ENFORCE(spGraphExecutable_);
    spGraphExecutable_->waitForFrame(timeout, interval);
    return frameStatus();
}

IProcessorBase::eFrameStatus Processor::cancelFrame() {
    ORVO_ENFORCE(spGraphExecutable_);
    frameStatus_ = FRAME_CANCELLED;
    spGraphExecutable_->cancelFrame();
    return frameStatus();
}

void Processor::sleep(double seconds) {
    ORVO_ENFORCE(spGraphExecutable_);
    spGraphExecutable_->sleep(seconds);
}

void Processor::setCompletionCallback(bool (*callback)(void*)) {
    ORVO_ENFORCE(spGraphExecutable_);
    spGraphExecutable_->setCompletionCallback(callback);
}

// ---- Preparation

void Processor::prepareForProcessing(OptimizationOptions const& options) {
    if (options.processingMode() == OptimizationOptions::FULL_OPTIMIZATION) {
        ORVO_CHECK(context_, "Processing with FULL_OPTIMIZATION needs valid GL context.");
    }
    waitForRunningFrame();
    validateGraphExecutableAndIR(options);
    createIR(options);
    forwardImagesFromInputGraphToIRGraph(false);
    selectGraphExecutable(options);
}

void Processor::waitForRunningFrame() {
    if (spGraphExecutable_) {
        spGraphExecutable_->waitForRunningFrame();
    }
}

void Processor::validateGraphExecutableAndIR(OptimizationOptions const& options) {
    if (clones_.empty() || isUpToDate(options)) {
        return;
    }
    dropGraphs();
}

// A failed build leaves an intermediate graph without an executable. That, too, is kept only as long as it
// still stands for the client graph: otherwise no repair of the client graph would ever reach it.
bool Processor::isUpToDate(OptimizationOptions const& options) {
    if (!options.equals(irOptions_)) {
        return false;
    }
    CheckTimeStampVisitor visitor(&clones_, &aTimeStamps_);
    try {
        traverseClientGraph(*pOriginalGraph_, visitor);
    } catch (...) {
        // Filters of the old graph may be gone: nothing that refers to them must be run any more.
        dropGraphs();
        throw;
    }
    return visitor.isUpToDate();
}

void Processor::dropGraphs() noexcept {
    spGraphExecutable_.reset();
    clearIR();
}

void Processor::clearIR() noexcept {
    aTimeStamps_.clear();
    aAdapters_.clear();
    aChildForwarders_.clear();
    parameterForwarder_.clear();
    clones_.clear();
}

void Processor::createIR(OptimizationOptions const& options) {
    if (!clones_.empty()) {
        return;
    }
    irOptions_ = options;
    try {
        CloneGraphVisitor visitor(&clones_, &parameterForwarder_);
        traverseClientGraph(*pOriginalGraph_, visitor);
        connectClones();
        if (options.processingMode() == OptimizationOptions::FULL_OPTIMIZATION) {
            insertGPU15_1ScalingNodes();
        }
        for (auto const& [pOriginal, spClone] : clones_) {
            if (std::shared_ptr<ParameterForwarder> const spForwarder = spClone->unFold(options)) {
                aChildForwarders_.push_back(spForwarder);
            }
        }
        collectAdapters();
    } catch (...) {
        clearIR();
        throw;
    }
}

Filter* Processor::cloneOfConsumer(IFilter* pParent) {
    auto* const pConsumer = dynamic_cast<Filter*>(pParent);
    ORVO_ENFORCE(pConsumer);
    // A consumer that the output does not reach has no clone.
    Filter* const pConsumerClone = clones_[pConsumer].get();
    ORVO_ENFORCE(pConsumerClone);
    return pConsumerClone;
}

void Processor::connectClones() {
    for (auto const& [pOriginal, spClone] : clones_) {
        for (InputIterator iInput = pOriginal->output()->consumerInputs(); iInput.isValid(); ++iInput) {
            Filter* const pConsumerClone = cloneOfConsumer((*iInput)->parentFilter());
            Connect(spClone.get(), pConsumerClone->input((*iInput)->name()));
        }
    }
}

void Processor::collectAdapters() {
    for (auto const& [pOriginal, spClone] : clones_) {
        auto* const pOriginalAdapter = dynamic_cast<IAdapter*>(pOriginal);
        if (!pOriginalAdapter) {
            continue;
        }
        AdapterPair pair{};
        pair.pOriginal = pOriginalAdapter;
        pair.pClone = dynamic_cast<IAdapter*>(spClone.get());
        pair.pOriginalInput = dynamic_cast<InputAdapter*>(pOriginal);
        pair.pCloneInput = dynamic_cast<InputAdapter*>(spClone.get());
        pair.pOriginalOutput = dynamic_cast<OutputAdapter*>(pOriginal);
        pair.pCloneOutput = dynamic_cast<OutputAdapter*>(spClone.get());
        aAdapters_.push_back(pair);
    }
}

void Processor::selectGraphExecutable(OptimizationOptions options) {
    if (spGraphExecutable_) {
        return;
    }
    auto const iClone = clones_.find(pOriginalGraph_);
    Filter* const pIROutput = iClone == clones_.end() ? nullptr : iClone->second.get();
    ORVO_ENFORCE(pIROutput);
    spGraphExecutable_ = std::make_shared<GraphExecutable>(pIROutput, options, context_);
}

// ---- Images and regions

void Processor::forwardImagesFromInputGraphToIRGraph(bool requireImage) {
    for (AdapterPair const& pair : aAdapters_) {
        IAdapter* const adapterOriginal = pair.pOriginal;
        IAdapter* const adapterClone = pair.pClone;
        ORVO_ENFORCE(adapterClone);
        if (requireImage) {
            ORVO_ENFORCE(ImageAccessor::getImpl<ORVO::ImageBase>(adapterOriginal->getImage()));
        }
        adapterClone->setImage(adapterOriginal->getImage());
    }
}

void Processor::forwardImagesFromIRGraphToImageFlowGraph() {
    spGraphExecutable_->forwardImagesToImageFlowGraph();
}

void Processor::forwardAdaptersToIRGraph() {
    for (AdapterPair const& pair : aAdapters_) {
        IAdapter* const adapterOriginal = pair.pOriginal;
        IAdapter* const adapterClone = pair.pClone;
        ORVO_ENFORCE(adapterClone);
        ORVO_CHECK(adapterOriginal->mode() == regionSyncMode_);
        adapterClone->setImage(adapterOriginal->getImage());
        if (pair.pOriginalInput) {
            ORVO_ENFORCE(pair.pCloneInput, "adapterClone");
            pair.pCloneInput->setDomainOfDefinition(pair.pOriginalInput->getDomainOfDefinition());
        }
        if (pair.pOriginalOutput) {
            ORVO_ENFORCE(pair.pCloneOutput, "adapterClone");
            pair.pCloneOutput->setRegionOfInterest(pair.pOriginalOutput->getRegionOfInterest());
        }
    }
}

void Processor::returnRegionsToInputGraph() {
    for (AdapterPair const& pair : aAdapters_) {
        if (pair.pOriginalInput) {
            ORVO_ENFORCE(pair.pCloneInput, "adapterClone");
            pair.pOriginalInput->updateROI(pair.pCloneInput->getRegionOfInterest());
        }
        if (pair.pOriginalOutput) {
            ORVO_ENFORCE(pair.pCloneOutput, "adapterClone");
            pair.pOriginalOutput->updateDOD(pair.pCloneOutput->getDomainOfDefinition());
        }
    }
}

void Processor::propagateDomainsOfDefinition() {
    ORVO_ENFORCE(spGraphExecutable_);
    waitForRunningFrame();
    parameterForwarder_.forwardStuff();
    for (std::shared_ptr<ParameterForwarder> const& spForwarder : aChildForwarders_) {
        ParameterForwarder::forwardByPtr(spForwarder);
    }
    forwardAdaptersToIRGraph();
    spGraphExecutable_->propagateDOD();
    returnRegionsToInputGraph();
}

void Processor::propagateRegionOfInterest() {
    ORVO_ENFORCE(spGraphExecutable_);
    waitForRunningFrame();
    forwardAdaptersToIRGraph();
    spGraphExecutable_->propagateROI();
    returnRegionsToInputGraph();
}

// ---- Frames

void Processor::prepareFrame(OptimizationOptions const& options) {
    prepareForProcessing(options);
    propagateDomainsOfDefinition();
    propagateRegionOfInterest();
    if (regionSyncMode_ == IAdapter::REGION_SYNC_EXPLICIT) {
        forwardImagesFromInputGraphToIRGraph(true);
        forwardImagesFromIRGraphToImageFlowGraph();
    }
    frameStatus_ = FRAME_RUNNING;
}

void Processor::processFrameEmbedded(OptimizationOptions const& options) {
    prepareFrame(options);
    spGraphExecutable_->processFrame();
    frameStatus_ = FRAME_COMPLETE;
}

void* Processor::asyncProcessFrameEmbedded(OptimizationOptions const& options) {
    ORVO_CHECK(pOriginalGraph_ && pOriginalGraph_->getImage());
    prepareFrame(options);
    return spGraphExecutable_->asyncProcessFrame();
}

} // namespace ORVO::FilterGraph::Internal
