#include "orvo/filter_graph/internal/GraphExecutable.h"

#include <limits>

#include "orvo/core/Check.h"
#include "orvo/core/exceptions/CPURuntimeException.h"
#include "orvo/core/exceptions/ExceptionBase.h"
#include "orvo/core/exceptions/ResourceException.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/spaces/PixelExtentInWorldSpace.h"
#include "orvo/data_flow/connectors/Connect.h"
#include "orvo/data_flow/connectors/Outputs.h"
#include "orvo/filter_graph/impl/FilterGraphLibrary.h"
#include "orvo/filter_graph/impl/IAdapter.h"
#include "orvo/filter_graph/impl/ImageDescriptor.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/Output.h"
#include "orvo/filter_graph/internal/ExecutableBuilderVisitor.h"
#include "orvo/filter_graph/internal/Filter.h"
#include "orvo/filter_graph/internal/GraphTraverser.h"
#include "orvo/filter_graph/internal/IFilterExecutable.h"
#include "orvo/filter_graph/internal/ImageFlowFilterExecutable.h"
#include "orvo/filter_graph/internal/OutputAdapter.h"
#include "orvo/filter_graph/internal/OutputAdapterExecutable.h"
#include "orvo/image_flow/ImageFlowLibrary.h"
#include "orvo/image_flow/controllers/Bedding.h"
#include "orvo/image_flow/controllers/ImageFlowController.h"
#include "orvo/image_flow/filters/ConvertFromSIMDOptimized.h"
#include "orvo/image_flow/filters/ConvertToSIMDOptimized.h"
#include "orvo/image_flow/graph/DFSPostStackVisitor.h"
#include "orvo/image_flow/nodes/ImageFilter.h"

namespace ORVO::FilterGraph::Internal {

namespace {

using DataFlow::InputConnector;
using DataFlow::OutputConnector;

// The forms of one producer's image, as indices of the converted outputs.
constexpr std::size_t kFormGL = 0;
constexpr std::size_t kFormSIMD = 1;
constexpr std::size_t kFormCPU = 2;
constexpr std::size_t kForms = 10;

constexpr double kNoTimeout = std::numeric_limits<double>::infinity();
constexpr double kTailInterval =
    1e-4; // seconds between two looks at a frame whose end is a few instructions away

template <typename Converter>
std::shared_ptr<ImageFilter> makeConverter() {
    return std::shared_ptr<ImageFilter>(ORVO_NEW Converter(), ImageNodeDeleter());
}

/// The converters between host memory and OpenGL memory come with the OpenGL nodes.
[[noreturn]] void refuseOpenGL() {
    throw ResourceException(__FILE__, __LINE__, "Images in OpenGL memory are not supported by this build");
}

} // namespace

GraphExecutable::GraphExecutable(IFilter* pGraph, OptimizationOptions const& options,
                                 OGL::Context const* context)
    : pOutput_(dynamic_cast<OutputAdapter*>(pGraph)), options_(options) {
    ORVO_ENFORCE(pOutput_);
    spController_ = std::make_shared<ImageFlowController>();
    if (options_.debuggingMode() == OptimizationOptions::DEBUGGING_SINGLE_THREAD) {
        spController_->setSingleThreadMode(true);
    }
    if (context) {
        ORVO_CHECK(!ORVO::ImageFlow::Library::cpuOnlyMode());
        refuseOpenGL();
    }
    spBedding_ = std::make_shared<Bedding>(*spController_);
    buildGraphExecutable();
}

GraphExecutable::~GraphExecutable() {
    try {
        if (bFrameOut_) {
            cancelFrame();
            waitForRunningFrame();
        }
    } catch (...) {
        // The controller joins its frame in any case when it dies.
    }
}

// ---- Building

void GraphExecutable::buildGraphExecutable() {
    TargetPlatform target = ORVO_TARGET_UNSET;
    switch (static_cast<int>(options_.processingMode())) {
    case OptimizationOptions::FULL_OPTIMIZATION:
        target = ORVO_TARGET_GL;
        break;
    case OptimizationOptions::CPU_PROCESSING:
        target = ORVO_TARGET_CPU;
        break;
    default:
        ORVO_FAIL("!\"unsupported processing mode!\"");
    }

    ExecutableBuilderVisitor builder(&aFilterExecutables_, this, target);
    GraphTraverser(pOutput_, &builder).depthFirstTraversal();

    ImageFilter* pSink = nullptr;
    ConvertedOutputs convertedOutputs;
    for (auto const& [pFilter, spExecutable] : aFilterExecutables_) {
        if (ImageFilter* const pFound = connectConsumers(pFilter, *spExecutable, convertedOutputs)) {
            pSink = pFound;
        }
    }

    auto* const oE = dynamic_cast<OutputAdapterExecutable*>(&executableOf(pOutput_));
    ORVO_ENFORCE(oE);
    ORVO_ENFORCE(pSink);
    oE->bind(pSink);
    spBedding_->plantMasterTree(*pSink);
    collectForFrames();
}

ImageFilter* GraphExecutable::connectConsumers(Filter* pFilter, IFilterExecutable& executable,
                                               ConvertedOutputs& convertedOutputs) {
    OutputConnector* out = executable.getImageFlowOutputConnector();
    if (!out) {
        ORVO_CHECK(pFilter == pOutput_, "out == pOutput_");
        return nullptr;
    }
    ImageFilter* pFoundSink = nullptr;
    convertedOutputs.assign(kForms, nullptr);
    for (InputIterator iInput = pFilter->output()->consumerInputs(); iInput.isValid(); ++iInput) {
        auto* const pParent = dynamic_cast<Filter*>((*iInput)->parentFilter());
        ORVO_ENFORCE(pParent);
        IFilterExecutable& parentExecutable = executableOf(pParent);
        if (InputConnector* const dst = parentExecutable.getImageFlowInputConnector((*iInput)->name())) {
            checkTargetsAndConnect(pFilter, out, pParent, dst, &convertedOutputs);
            continue;
        }
        ORVO_CHECK(pParent == pOutput_);
        out = bringToOutputAdapter(executable, parentExecutable, out);
        ImageFilter* const pSink = out->node() ? out->node()->asImageFilter() : nullptr;
        ORVO_ENFORCE(pSink);
        pFoundSink = pSink;
    }
    return pFoundSink;
}

OutputConnector* GraphExecutable::bringToOutputAdapter(IFilterExecutable& executable,
                                                       IFilterExecutable& outputExecutable,
                                                       OutputConnector* pOutput) {
    if (executable.hasSIMDOutput()) {
        return appendImageFlowConverter(makeConverter<ConvertFromSIMDOptimized>(), pOutput);
    }
    bool const bFromGL = executable.getOutputTargetPlatform() == ORVO_TARGET_GL;
    bool const bToGL = outputExecutable.getInputTargetPlatform() == ORVO_TARGET_GL;
    if (bFromGL != bToGL) {
        refuseOpenGL();
    }
    return pOutput;
}

IFilterExecutable& GraphExecutable::executableOf(Filter* pFilter) {
    auto const iExecutable = aFilterExecutables_.find(pFilter);
    IFilterExecutable* const pFilterExecutable =
        iExecutable == aFilterExecutables_.end() ? nullptr : iExecutable->second.get();
    ORVO_ENFORCE(pFilterExecutable);
    return *pFilterExecutable;
}

int GraphExecutable::convertedOutputIndex(TargetPlatform target, bool isSIMD) {
    switch (static_cast<int>(target)) {
    case ORVO_TARGET_GL:
        ORVO_CHECK(!isSIMD);
        return static_cast<int>(kFormGL);
    case ORVO_TARGET_CPU:
        return static_cast<int>(isSIMD ? kFormSIMD : kFormCPU);
    case ORVO_TARGET_RESERVED_2:
        ORVO_CHECK(!isSIMD);
        return 3;
    case ORVO_TARGET_RESERVED_3:
        ORVO_CHECK(!isSIMD);
        return 4;
    case ORVO_TARGET_UNSET:
        ORVO_FAIL("Uninitialized targetPlatform.");
    default:
        return -1;
    }
}

OutputConnector* GraphExecutable::checkTargetsAndConnect(Filter* pSrcFilter, OutputConnector* pSrcConnector,
                                                         Filter* pDstFilter, InputConnector* pDstConnector,
                                                         ConvertedOutputs* pConvertedOutputsVec) {
    ORVO_ENFORCE(pSrcFilter);
    ORVO_ENFORCE(pSrcConnector);
    ORVO_ENFORCE(pDstFilter);
    ORVO_ENFORCE(pDstConnector);
    ORVO_ENFORCE(pConvertedOutputsVec);

    IFilterExecutable& source = executableOf(pSrcFilter);
    IFilterExecutable& destination = executableOf(pDstFilter);
    TargetPlatform const srcTarget = source.getOutputTargetPlatform();
    bool const srcSIMD = source.hasSIMDOutput();
    TargetPlatform const dstTarget = destination.getInputTargetPlatform();
    bool const dstSIMD = destination.hasSIMDInput();

    // A target that no form stands for is -1, which is no index: at() refuses it like any other bad one.
    auto const nOriginalOutputIndex = static_cast<std::size_t>(convertedOutputIndex(srcTarget, srcSIMD));
    OutputConnector*& pOriginal = pConvertedOutputsVec->at(nOriginalOutputIndex);
    if (!pOriginal) {
        pOriginal = pSrcConnector;
    }
    ORVO_CHECK(pOriginal == pSrcConnector, "(*pConvertedOutputsVec)[nOriginalOutputIndex] == pSrcConnector");

    OutputConnector* pConnector = pSrcConnector;
    if (srcSIMD && !dstSIMD) {
        OutputConnector*& pPlain = (*pConvertedOutputsVec)[kFormCPU];
        if (!pPlain) {
            pPlain = appendImageFlowConverter(makeConverter<ConvertFromSIMDOptimized>(), pConnector);
        }
        pConnector = pPlain;
    } else if (!srcSIMD && dstSIMD) {
        OutputConnector*& pSIMD = (*pConvertedOutputsVec)[kFormSIMD];
        if (!pSIMD) {
            pSIMD = appendImageFlowConverter(makeConverter<ConvertToSIMDOptimized>(), pConnector);
        }
        pConnector = pSIMD;
    }
    if ((srcTarget == ORVO_TARGET_GL) != (dstTarget == ORVO_TARGET_GL)) {
        refuseOpenGL();
    }
    makeDataFlowConnection(pConnector, pDstConnector);
    return pConnector;
}

OutputConnector* GraphExecutable::unconnectedOutput(OutputConnector* pOutputConnector) {
    if (!pOutputConnector->connectedInput()) {
        return pOutputConnector;
    }
    ImageFilter* const pSrcNode =
        pOutputConnector->node() ? pOutputConnector->node()->asImageFilter() : nullptr;
    ORVO_ENFORCE(pSrcNode);
    OutputConnector* const pClonedSrcConnector = pSrcNode->cloneImageOutput();
    ORVO_ENFORCE(pClonedSrcConnector);
    return pClonedSrcConnector;
}

void GraphExecutable::makeDataFlowConnection(OutputConnector* pSrcConnector, InputConnector* pDstConnector) {
    ORVO_ENFORCE(pSrcConnector);
    ORVO_ENFORCE(pDstConnector);
    if (pSrcConnector->connectedInput()) {
        OutputConnector* const pClonedSrcConnector = unconnectedOutput(pSrcConnector);
        ORVO_CHECK(pDstConnector->canConnect(pClonedSrcConnector));
        DataFlow::Connect(*pClonedSrcConnector, *pDstConnector);
    } else {
        ORVO_CHECK(pDstConnector->canConnect(pSrcConnector));
        DataFlow::Connect(*pSrcConnector, *pDstConnector);
    }
}

OutputConnector* GraphExecutable::appendImageFlowConverter(std::shared_ptr<ImageFilter> const& spConverter,
                                                           OutputConnector* pOutputConnector) {
    aConverters_.push_back(spConverter);
    ImageFilter* const pConverter = spConverter.get();
    spController_->addNode(pConverter);
    OutputConnector* const pFree = unconnectedOutput(pOutputConnector);
    ORVO_CHECK(pConverter->imageInput(0)->canConnect(pFree),
               "pConverter->imageInput(0)->canConnect(pOutputConnector)");
    DataFlow::Connect(*pFree, *pConverter->imageInput(0));
    return pConverter->imageOutput();
}

InputConnector* GraphExecutable::prependImageFlowConverter(std::shared_ptr<ImageFilter> const& spConverter,
                                                           InputConnector* pInputConnector) {
    aConverters_.push_back(spConverter);
    ImageFilter* const pConverter = spConverter.get();
    spController_->addNode(pConverter);
    ORVO_CHECK(pInputConnector->canConnect(pConverter->imageOutput()));
    DataFlow::Connect(*pConverter->imageOutput(), *pInputConnector);
    return pConverter->imageInput(0);
}

void GraphExecutable::collectForFrames() {
    for (auto const& [pFilter, spExecutable] : aFilterExecutables_) {
        aExecutablesInOrder_.push_back(spExecutable.get());
        if (dynamic_cast<IAdapter*>(pFilter)) {
            aAdapterExecutables_.push_back(spExecutable.get());
        }
    }
    DFSPostStackVisitor visitor;
    spController_->depthFirstSearch(visitor);
    for (ImageFilter* const pNode : visitor.stack()) {
        aNodesProducersFirst_.push_back(pNode);
        if (pNode->numberOfOutputs() > 1) {
            aFanOutNodes_.push_back(pNode);
        }
    }
}

// ---- Regions

PixelExtentInWorldSpace GraphExecutable::outputPixelExtentInWorldSpace() {
    OutputAdapter const* const pOutputAdapter = pOutput_;
    ORVO_ENFORCE(pOutputAdapter);
    return pOutputAdapter->getImageDescriptor().pixelExtent();
}

void GraphExecutable::propagateDOD() {
    waitForRunningFrame();
    forwarder_.forwardStuff();
    for (IFilterExecutable* const pExecutable : aExecutablesInOrder_) {
        pExecutable->forwardStuff();
    }
    spBedding_->propagatePixelExtents();
    spBedding_->propagateDODs();
    returnStuff();
}

void GraphExecutable::propagateROI() {
    waitForRunningFrame();
    for (IFilterExecutable* const pExecutable : aExecutablesInOrder_) {
        pExecutable->forwardStuff();
    }
    spBedding_->propagateROIs(pOutput_->getRegionOfInterest());
    returnStuff();
}

void GraphExecutable::forwardImagesToImageFlowGraph() {
    waitForRunningFrame();
    for (IFilterExecutable* const pExecutable : aAdapterExecutables_) {
        pExecutable->forwardStuff();
    }
}

void GraphExecutable::returnStuff() {
    for (IFilterExecutable* const pExecutable : aExecutablesInOrder_) {
        pExecutable->returnStuff();
    }
}

// ---- Frames

void GraphExecutable::setIntermediateBufferPrecision() {
    if (options_.processingMode() != OptimizationOptions::FULL_OPTIMIZATION) {
        return;
    }
    for (auto iNode = spController_->nodesBegin(); iNode != spController_->nodesEnd(); ++iNode) {
        ImageFilter* const iff = (*iNode)->asImageFilter();
        ORVO_CHECK(iff, "iff!=0");
        ImageFilter::teOutputPrecisionHint hint = ImageFilter::OUTPUT_PRECISION_DEFAULT;
        switch (static_cast<int>(options_.intermediateBufferPrecision())) {
        case OptimizationOptions::INTERMEDIATE_PRECISION_DEFAULT:
            continue;
        case OptimizationOptions::INTERMEDIATE_PRECISION_16_BIT_FLOAT:
            hint = ImageFilter::OUTPUT_PRECISION_16_BIT_FLOAT;
            break;
        case OptimizationOptions::INTERMEDIATE_PRECISION_32_BIT_FLOAT:
            hint = ImageFilter::OUTPUT_PRECISION_32_BIT_FLOAT;
            break;
        default:
            ORVO_FAIL("Not implemented: This intermediate buffer precision is not supported\n");
        }
        auto& parameter = iff->outputPrecisionHintParameter();
        if (parameter.value() == ImageFilter::OUTPUT_PRECISION_DEFAULT) {
            parameter.setValue(hint);
        }
    }
}

void GraphExecutable::settleLastFrame() {
    waitForRunningFrame();
    try {
        spController_->checkException();
    } catch (...) {
        // Saved by a frame whose end nobody asked for. It must not come out of the next one.
        bLastFrameBroken_ = true;
    }
    if (bCancelled_.exchange(false)) {
        bLastFrameBroken_ = true;
    }
    if (bLastFrameBroken_) {
        // A node that threw counts as running until it is flushed, a cancelled task group runs no slices
        // until it is reset, and what some nodes hold belongs to a frame of which the others know nothing.
        spBedding_->wait(kNoTimeout, kTailInterval);
        spController_->flushGraph();
        bLastFrameBroken_ = false;
    }
}

void GraphExecutable::prepareNodes() {
    setIntermediateBufferPrecision();
    spController_->setNodeImageDescriptorInfo(true);
}

void GraphExecutable::prepareCaches() {
    bool const bKeepNothing = options_.cachingMode() == OptimizationOptions::CACHING_OFF;
    if (!bKeepNothing) {
        spBedding_->setDirtyState();
    }
    for (auto iNode = spController_->nodesBegin(); iNode != spController_->nodesEnd(); ++iNode) {
        if (bKeepNothing || (*iNode)->isDirty()) {
            (*iNode)->flushOutputs();
        }
    }
    if (bKeepNothing) {
        spBedding_->setDirtyState();
        return;
    }
    for (ImageFilter* const pNode : aFanOutNodes_) {
        shareAmongOutputs(*pNode);
    }
}

// One consumer of a clean node may have left its image where it was, another may have taken its share along.
// The node does not run as long as one output holds data, so the consumer whose output is empty would wait
// for it forever.
void GraphExecutable::shareAmongOutputs(ImageFilter& node) {
    using CPUOutput = DataFlow::ConstOutput<ORVO::ImageCPU>;
    CPUOutput* pFull = nullptr;
    bool bShareable = true;
    bool bAnyData = false;
    for (std::size_t iOutput = 0; iOutput < node.numberOfOutputs(); ++iOutput) {
        OutputConnector* const pOutput = node.output(iOutput);
        auto* const pTyped = dynamic_cast<CPUOutput*>(pOutput);
        bShareable = bShareable && pTyped;
        bAnyData = bAnyData || pOutput->hasData();
        if (pTyped && pTyped->hasData()) {
            pFull = pTyped;
        }
    }
    if (!bAnyData) {
        return;
    }
    if (!bShareable || !pFull) {
        node.flushOutputs();
        return;
    }
    for (std::size_t iOutput = 0; iOutput < node.numberOfOutputs(); ++iOutput) {
        OutputConnector* const pOutput = node.output(iOutput);
        if (!pOutput->hasData()) {
            static_cast<CPUOutput*>(pOutput)->cloneDataFrom(*pFull);
        }
    }
}

void GraphExecutable::allocateOutputImages() {
    // A node that does not run keeps what was allocated for it, and would write a later frame of another size
    // into it.
    for (ImageFilter* const pNode : aNodesProducersFirst_) {
        pNode->setColor(DataFlow::Node::COLOR_NOT_VISITED);
    }
    for (auto iNode = aNodesProducersFirst_.rbegin(); iNode != aNodesProducersFirst_.rend(); ++iNode) {
        ImageFilter* const iff = *iNode;
        bool const bRuns =
            iNode == aNodesProducersFirst_.rbegin() || iff->color() == DataFlow::Node::COLOR_DISCOVERED;
        if (!bRuns) {
            continue;
        }
        iff->allocateOutputImage();
        for (std::size_t iInput = 0; iInput < iff->numberOfImageInputs(); ++iInput) {
            OutputConnector const* const pProducerOutput = iff->imageInput(iInput)->connectedOutput();
            if (!pProducerOutput->hasData()) {
                pProducerOutput->node()->setColor(DataFlow::Node::COLOR_DISCOVERED);
            }
        }
    }
}

void GraphExecutable::processFrame() {
    settleLastFrame();
    ORVO_CHECK(pOutput_, "pOutputAdapter");
    bProcessingComplete_.store(false, std::memory_order_release);
    bLastFrameBroken_ = true;
    prepareNodes();
    prepareCaches();
    spBedding_->process();
    bLastFrameBroken_ = false;
    bProcessingComplete_.store(true, std::memory_order_release);
    returnStuff();
}

void* GraphExecutable::asyncProcessFrame() {
    settleLastFrame();
    ORVO_CHECK(pOutput_, "pOutputAdapter");
    bProcessingComplete_.store(false, std::memory_order_release);
    bLastFrameBroken_ = true;
    spController_->registerProcessingCompletedCallback(internalCompletionCallback, this);
    prepareNodes();
    prepareCaches();
    if (Library::getInitializationOptions().getAllocationMode() == 1) {
        allocateOutputImages();
    }
    bFrameOut_ = true;
    try {
        spBedding_->processAsync();
    } catch (...) {
        bFrameOut_ = false;
        throw;
    }
    bLastFrameBroken_ = false;
    return this;
}

void GraphExecutable::cancelFrame() {
    bCancelled_.store(true);
    spController_->cancelProcess();
}

bool GraphExecutable::waitForFrame(double timeout, double interval) {
    bool const bEnded = spController_->wait(timeout, interval);
    if (bEnded) {
        bFrameOut_ = false;
    }
    return bEnded;
}

void GraphExecutable::waitForRunningFrame() {
    if (!bFrameOut_) {
        return;
    }
    ORVO_CHECK(oCallbackThread_.load() != std::this_thread::get_id(),
               "The completion callback must not change the frame that it ends");
    bProcessingComplete_.wait(false, std::memory_order_acquire);
    // Completion is recorded a moment before the frame's last step.
    spController_->wait(kNoTimeout, kTailInterval);
    bFrameOut_ = false;
}

void GraphExecutable::sleep(double seconds) { spController_->sleep(seconds); }

void GraphExecutable::checkException() {
    try {
        spController_->checkException();
    } catch (...) {
        bLastFrameBroken_ = true;
        throw;
    }
}

void GraphExecutable::setCompletionCallback(bool (*callback)(void*)) { pCompletionCallback_.store(callback); }

bool GraphExecutable::internalCompletionCallback(void* self) {
    auto* const pExecutable = static_cast<GraphExecutable*>(self);
    try {
        pExecutable->returnStuff();
        pExecutable->callCompletionCallback();
    } catch (ExceptionBase const& exception) {
        pExecutable->spController_->saveException(exception.clone());
    } catch (...) {
        pExecutable->spController_->saveException(
            ORVO_NEW CPURuntimeException(CPURuntimeException::CONDITION_UNKNOWN));
    }
    // The host may destroy the frame's results, but not this object, as soon as it sees this.
    pExecutable->bProcessingComplete_.store(true, std::memory_order_release);
    pExecutable->bProcessingComplete_.notify_all();
    return true;
}

void GraphExecutable::callCompletionCallback() {
    auto* const pCallback = pCompletionCallback_.load();
    if (!pCallback) {
        return;
    }
    oCallbackThread_.store(std::this_thread::get_id());
    try {
        pCallback(this);
    } catch (...) {
        oCallbackThread_.store(std::thread::id());
        throw;
    }
    oCallbackThread_.store(std::thread::id());
}

} // namespace ORVO::FilterGraph::Internal
