// How a compiled graph runs its frames; how it is built stands in GraphExecutable.cpp.
#include "orvo/filter_graph/internal/GraphExecutable.h"

#include <limits>
#include <optional>

#include "orvo/core/Check.h"
#include "orvo/core/exceptions/CPURuntimeException.h"
#include "orvo/core/exceptions/ExceptionBase.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/data_flow/connectors/Outputs.h"
#include "orvo/filter_graph/impl/FilterGraphLibrary.h"
#include "orvo/filter_graph/impl/ImageDescriptor.h"
#include "orvo/filter_graph/internal/IFilterExecutable.h"
#include "orvo/filter_graph/internal/ImageAccessor.h"
#include "orvo/filter_graph/internal/InputAdapter.h"
#include "orvo/filter_graph/internal/OutputAdapter.h"
#include "orvo/filter_graph/internal/ScopedGraphContext.h"
#include "orvo/image_flow/controllers/Bedding.h"
#include "orvo/image_flow/controllers/ImageFlowController.h"
#include "orvo/image_flow/nodes/ImageFilter.h"
#include "orvo/image_runtime/images/ImageCPU.h"
#include "orvo/image_runtime/images/ImageGPU.h"
#include "orvo/ogl/Fence.h"

namespace ORVO::FilterGraph::Internal {

namespace {

using DataFlow::OutputConnector;

constexpr double kNoTimeout = std::numeric_limits<double>::infinity();
constexpr double kTailInterval =
    1e-4; // seconds between two looks at a frame whose end is a few instructions away

/// Lets the current context, which shares with the one of the mark, run behind the mark; then frees it.
void waitFor(std::optional<OGL::Fence>& oMark) noexcept {
    if (oMark) {
        oMark->wait();
        oMark.reset();
    }
}

/// Takes the image that one output of the node holds to all those that hold none. False if an output is for
/// another kind of image.
template <typename Image>
bool shareImageAmongOutputs(ImageFilter& node) {
    using TypedOutput = DataFlow::ConstOutput<Image>;
    TypedOutput* pFull = nullptr;
    for (std::size_t iOutput = 0; iOutput < node.numberOfOutputs(); ++iOutput) {
        auto* const pTyped = dynamic_cast<TypedOutput*>(node.output(iOutput));
        if (!pTyped) {
            return false;
        }
        if (pTyped->hasData()) {
            pFull = pTyped;
        }
    }
    if (!pFull) {
        return true;
    }
    for (std::size_t iOutput = 0; iOutput < node.numberOfOutputs(); ++iOutput) {
        if (!node.output(iOutput)->hasData()) {
            static_cast<TypedOutput*>(node.output(iOutput))->cloneDataFrom(*pFull);
        }
    }
    return true;
}

} // namespace

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
    if (!shareImageAmongOutputs<ORVO::ImageCPU>(node) && !shareImageAmongOutputs<ORVO::ImageGPU>(node)) {
        node.flushOutputs();
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

bool GraphExecutable::drawsIntoTexture() const {
    return spContext_ && pOutput_->getImageDescriptor().type() == ORVO_TARGET_GL;
}

bool GraphExecutable::usesTextures() const { return !aTextureInputs_.empty() || drawsIntoTexture(); }

void GraphExecutable::keepTextureParameters(ClientTextureParameters& parameters) const {
    for (InputAdapter const* const pInput : aTextureInputs_) {
        auto const* const pImage = ImageAccessor::getImpl<ORVO::ImageGPU>(pInput->getImage());
        if (pImage && pImage->texture()) {
            parameters.keep(*pImage->texture());
        }
    }
}

void GraphExecutable::putBackTextureParameters() {
    if (!oTextureParameters_.empty()) {
        ScopedGraphContext const current(spContext_);
        oTextureParameters_.putBack();
    }
}

bool GraphExecutable::isHostSharing() const {
    return spContext_ && spContext_->isSharingWithCurrentContext();
}

void GraphExecutable::processFrame() {
    waitForRunningFrame(); // whose thread has the graph's context
    bool const bHostShares = isHostSharing();
    std::optional<OGL::Fence> oGiven;
    if (bHostShares && usesTextures()) {
        oGiven.emplace();
    }
    std::optional<OGL::Fence> oDrawn;
    {
        ScopedGraphContext current(spContext_);
        waitFor(oGiven);
        settleLastFrame();
        ORVO_CHECK(pOutput_, "pOutputAdapter");
        bProcessingComplete_.store(false, std::memory_order_release);
        bLastFrameBroken_ = true;
        prepareNodes();
        prepareCaches();
        {
            ClientTextureParameters parameters;
            keepTextureParameters(parameters);
            spBedding_->process();
        }
        if (drawsIntoTexture() && bHostShares) {
            oDrawn.emplace();
            current.restore();
        } else if (drawsIntoTexture()) {
            OGL::finishCurrentContext();
        }
    }
    if (oDrawn) {
        oDrawn->wait();
    }
    bLastFrameBroken_ = false;
    bProcessingComplete_.store(true, std::memory_order_release);
    returnStuff();
}

void* GraphExecutable::asyncProcessFrame() {
    waitForRunningFrame(); // whose thread has the graph's context
    std::optional<OGL::Fence> oGiven;
    if (usesTextures() && isHostSharing()) {
        oGiven.emplace();
    }
    {
        // Let go of before the launch: the frame's thread makes the same context current.
        ScopedGraphContext const current(spContext_);
        waitFor(oGiven);
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
        keepTextureParameters(oTextureParameters_);
    }
    bFrameOut_ = true;
    try {
        spBedding_->processAsync();
    } catch (...) {
        bFrameOut_ = false;
        putBackTextureParameters();
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
        putBackTextureParameters();
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
    try {
        // Completion is recorded a moment before the frame's last step.
        spController_->wait(kNoTimeout, kTailInterval);
        putBackTextureParameters();
    } catch (...) {
        // An error of OpenGL's in a frame that nobody waited for. It must not come out of the next one.
        bLastFrameBroken_ = true;
    }
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
    auto const attempt = [pExecutable](auto const& step) {
        try {
            step();
        } catch (ExceptionBase const& exception) {
            pExecutable->spController_->saveException(exception.clone());
        } catch (...) {
            pExecutable->spController_->saveException(
                ORVO_NEW CPURuntimeException(CPURuntimeException::CONDITION_UNKNOWN));
        }
    };
    // A frame whose thread is refused the context has ended all the same, and its host is told.
    attempt([pExecutable] { pExecutable->settleTextures(); });
    attempt([pExecutable] {
        pExecutable->returnStuff();
        pExecutable->callCompletionCallback();
    });
    // The host may destroy the frame's results, but not this object, as soon as it sees this.
    pExecutable->bProcessingComplete_.store(true, std::memory_order_release);
    pExecutable->bProcessingComplete_.notify_all();
    return true;
}

void GraphExecutable::settleTextures() {
    if (!usesTextures()) {
        return;
    }
    ScopedGraphContext const current(spContext_);
    oTextureParameters_.putBack();
    if (drawsIntoTexture()) {
        OGL::finishCurrentContext();
    }
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
