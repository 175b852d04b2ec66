#include "orvo/filter_graph/internal/GraphExecutable.h"

#include <optional>

#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/spaces/PixelExtentInWorldSpace.h"
#include "orvo/data_flow/connectors/Connect.h"
#include "orvo/filter_graph/impl/IAdapter.h"
#include "orvo/filter_graph/impl/ImageDescriptor.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/Output.h"
#include "orvo/filter_graph/internal/ExecutableBuilderVisitor.h"
#include "orvo/filter_graph/internal/Filter.h"
#include "orvo/filter_graph/internal/GraphTraverser.h"
#include "orvo/filter_graph/internal/IFilterExecutable.h"
#include "orvo/filter_graph/internal/ImageFlowFilterExecutable.h"
#include "orvo/filter_graph/internal/InputAdapter.h"
#include "orvo/filter_graph/internal/OutputAdapter.h"
#include "orvo/filter_graph/internal/OutputAdapterExecutable.h"
#include "orvo/filter_graph/internal/ScopedGraphContext.h"
#include "orvo/image_flow/ImageFlowLibrary.h"
#include "orvo/image_flow/controllers/Bedding.h"
#include "orvo/image_flow/controllers/ImageFlowController.h"
#include "orvo/image_flow/filters/CPU2GPU.h"
#include "orvo/image_flow/filters/ConvertFromSIMDOptimized.h"
#include "orvo/image_flow/filters/ConvertToSIMDOptimized.h"
#include "orvo/image_flow/filters/GPU2CPU.h"
#include "orvo/image_flow/graph/DFSPostStackVisitor.h"
#include "orvo/image_flow/nodes/ImageFilter.h"
#include "orvo/ogl/ContextOffscreen.h"

namespace ORVO::FilterGraph::Internal {

namespace {

using DataFlow::InputConnector;
using DataFlow::OutputConnector;

// The forms of one producer's image, as indices of the converted outputs.
constexpr std::size_t kFormGL = 0;
constexpr std::size_t kFormSIMD = 1;
constexpr std::size_t kFormCPU = 2;
constexpr std::size_t kForms = 10;

template <typename Converter>
std::shared_ptr<ImageFilter> makeConverter() {
    return std::shared_ptr<ImageFilter>(ORVO_NEW Converter(), ImageNodeDeleter());
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
        spContext_ = std::make_shared<OGL::ContextOffscreen>(context);
        spBedding_ = std::make_shared<Bedding>(*spContext_, *spController_);
    } else {
        spBedding_ = std::make_shared<Bedding>(*spController_);
    }
    try {
        ScopedGraphContext const current(spContext_);
        buildGraphExecutable();
    } catch (...) {
        freeNodes();
        throw;
    }
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
    freeNodes();
}

void GraphExecutable::freeNodes() noexcept {
    std::optional<ScopedGraphContext> oCurrent;
    try {
        oCurrent.emplace(spContext_);
    } catch (...) {
        // The host has destroyed the context that ours shares with. What lived in it is gone.
    }
    aFilterExecutables_.clear();
    aConverters_.clear();
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
    if (!bFromGL && bToGL) {
        return appendImageFlowConverter(makeConverter<CPU2GPU>(), pOutput);
    }
    if (bFromGL && !bToGL) {
        return appendImageFlowConverter(makeConverter<GPU2CPU>(), pOutput);
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
    // One converter serves all consumers that want a form.
    auto const convertTo = [&](std::size_t form, auto makeNode) {
        OutputConnector*& pForm = (*pConvertedOutputsVec)[form];
        if (!pForm) {
            pForm = appendImageFlowConverter(makeNode(), pConnector);
        }
        pConnector = pForm;
    };
    if (srcSIMD && !dstSIMD) {
        convertTo(kFormCPU, makeConverter<ConvertFromSIMDOptimized>);
    } else if (!srcSIMD && dstSIMD) {
        convertTo(kFormSIMD, makeConverter<ConvertToSIMDOptimized>);
    }
    bool const bFromGL = srcTarget == ORVO_TARGET_GL;
    bool const bToGL = dstTarget == ORVO_TARGET_GL;
    if (!bFromGL && bToGL) {
        convertTo(kFormGL, makeConverter<CPU2GPU>);
    } else if (bFromGL && !bToGL) {
        convertTo(kFormCPU, makeConverter<GPU2CPU>);
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
        auto* const pInput = dynamic_cast<InputAdapter*>(pFilter);
        if (pInput && pInput->getImageDescriptor().type() == ORVO_TARGET_GL) {
            aTextureInputs_.push_back(pInput);
        }
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

} // namespace ORVO::FilterGraph::Internal
