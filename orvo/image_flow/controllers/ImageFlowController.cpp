#include "orvo/image_flow/controllers/ImageFlowController.h"

#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/SharedPtr.h"
#include "orvo/data_flow/connectors/InputConnector.h"
#include "orvo/data_flow/connectors/OutputConnector.h"
#include "orvo/image_flow/controllers/FrameState.h"
#include "orvo/image_flow/graph/DFSPostStackVisitor.h"
#include "orvo/image_flow/graph/PropagateDODVisitor.h"
#include "orvo/image_flow/graph/PropagatePixelExtentVisitor.h"
#include "orvo/image_flow/graph/SetDirtyStateVisitor.h"
#include "orvo/image_flow/nodes/ImageFilter.h"
#include "orvo/image_runtime/images/ImageGPU.h"
#include "orvo/ogl/Context.h"
#include "orvo/ogl/ExceptionOGL.h"
#include "orvo/ogl/Framebuffer.h"
#include "orvo/ogl/ScopedContextWrapper.h"
#include "orvo/ogl/TextureState.h"
#include "orvo/ogl/TextureUnit.h"
#include "orvo/ogl/internal/GL.h"

#include <cstddef>
#include <deque>
#include <memory>

namespace ORVO {

namespace {

using DataFlow::Node;
using Hint = ImageFilter::teOutputPrecisionHint;

/// The visitor of a walk, set for the length of the walk.
class VisitorScope {
public:
    VisitorScope(Visitor*& pVisitor, Visitor& visitor) : pVisitor_(pVisitor) { pVisitor_ = &visitor; }
    ~VisitorScope() { pVisitor_ = nullptr; }
    VisitorScope(VisitorScope const&) = delete;
    VisitorScope& operator=(VisitorScope const&) = delete;

private:
    Visitor*& pVisitor_;
};

Node* producerOf(ImageFilter& filter, std::size_t iInput) {
    DataFlow::OutputConnector* const pOutput = filter.imageInput(iInput)->connectedOutput();
    ORVO_ENFORCE(pOutput);
    Node* const pSource = pOutput->node();
    ORVO_ENFORCE(pSource);
    return pSource;
}

Hint hintOf(ImageCPU::tePixelFormat format) {
    switch (format) {
    case ImageCPU::PIXEL_FORMAT_RGB8:
    case ImageCPU::PIXEL_FORMAT_RGBA8:
    case ImageCPU::PIXEL_FORMAT_LUMINANCE8:
    case ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8:
        return ImageFilter::OUTPUT_PRECISION_8_BIT_INT;
    case ImageCPU::PIXEL_FORMAT_RGB16:
    case ImageCPU::PIXEL_FORMAT_RGBA16:
    case ImageCPU::PIXEL_FORMAT_LUMINANCE16:
    case ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA16:
        return ImageFilter::OUTPUT_PRECISION_16_BIT_INT;
    case ImageCPU::PIXEL_FORMAT_RGB32F:
    case ImageCPU::PIXEL_FORMAT_RGBA32F:
    case ImageCPU::PIXEL_FORMAT_LUMINANCE32F:
    case ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F:
        return ImageFilter::OUTPUT_PRECISION_32_BIT_FLOAT;
    case ImageCPU::PIXEL_FORMAT_BGR8:
    case ImageCPU::PIXEL_FORMAT_BGRA8:
    case ImageCPU::PIXEL_FORMAT_RGB16F:
    case ImageCPU::PIXEL_FORMAT_RGBA16F:
    case ImageCPU::PIXEL_FORMAT_LUMINANCE16F:
    case ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA16F:
    case ImageCPU::PIXEL_FORMAT_UNDEFINED:
        break;
    }
    ORVO_FAIL("Not implemented: ImageCPU Pixel format not supported");
}

Hint hintOf(ImageGPU::tePixelFormat format) {
    // The formats run through the four precisions, in the hints' order, once for each kind of channels.
    ORVO_CHECK(format >= ImageGPU::PIXEL_FORMAT_RGBA8 && format < ImageGPU::PIXEL_FORMAT_UNDEFINED,
               "Not implemented: ImageGPU Pixel format not supported");
    return static_cast<Hint>(format % 4);
}

/// The precision of the image on the sink's output.
Hint hintFrom(ImageFilter const& sink) {
    DataFlow::OutputConnector const* const pOutput = sink.imageOutput();
    ORVO_CHECK(pOutput != nullptr && pOutput->hasData(), "(pSink->imageOutput()->hasData()) == true");
    void const* const pData = pOutput->data();
    if (sink.getOutputTargetPlatform() == ORVO_TARGET_GL) {
        auto const* const imGPU = static_cast<ImageGPU const*>(pData);
        ORVO_CHECK(imGPU != nullptr, "imGPU != NULL");
        return hintOf(imGPU->pixelFormat());
    }
    return hintOf(static_cast<ImageCPU const*>(pData)->pixelFormat());
}

/// Reads the current context's errors until there are none; whether there was one.
bool drainErrors() {
    // A context that is lost answers with an error for ever.
    constexpr int nMaximumErrors = 64;
    bool const bError = glGetError() != GL_NO_ERROR;
    for (int i = 0; bError && i < nMaximumErrors && glGetError() != GL_NO_ERROR; ++i) {
    }
    return bError;
}

void sweepErrors() {
    if (drainErrors()) {
        throw OGL::ExceptionOGL(__FILE__, __LINE__, "Processing failure due to OpenGL error", GL_NO_ERROR);
    }
}

} // namespace

ImageFlowController::ImageFlowController()
    : pVisitor_(nullptr), pContextGPU_(nullptr), pFramebuffer_(nullptr) {}

ImageFlowController::~ImageFlowController() {
    cancelAndJoin();
    if (pContextGPU_ == nullptr || pFramebuffer_ == nullptr) {
        return;
    }
    OGL::ScopedContextWrapper const wrapper;
    try {
        pContextGPU_->makeCurrent();
    } catch (...) { // The framebuffer then leaves its name to the context's end.
    }
    ORVODeleter<OGL::Framebuffer>{}(pFramebuffer_);
}

void ImageFlowController::setContextGPU(OGL::Context const& context) {
    OGL::ScopedContextWrapper const wrapper;
    context.makeCurrent();
    auto* const pFramebuffer = ORVO_NEW OGL::Framebuffer();
    ORVODeleter<OGL::Framebuffer>{}(pFramebuffer_);
    pFramebuffer_ = pFramebuffer;
    pContextGPU_ = &context;
}

OGL::Context const* ImageFlowController::contextGPU() const { return pContextGPU_; }

OGL::Framebuffer* ImageFlowController::framebuffer() { return pFramebuffer_; }

OGL::Framebuffer const* ImageFlowController::framebuffer() const { return pFramebuffer_; }

void ImageFlowController::prepareOGLForProcess() {
    if (pContextGPU_ == nullptr) {
        return;
    }
    pContextGPU_->makeCurrent();
    OGL::TextureState::setActiveTextureUnit(0);
    OGL::TextureUnit::Unit(0).enable2D();
}

void ImageFlowController::process() {
    // The running frame reads what is set here, and may hold the context.
    joinFrame();
    OGL::ScopedContextWrapper const wrapper;
    if (pContextGPU_ == nullptr) {
        setNodeImageDescriptorInfo(false);
        Controller::process();
        return;
    }
    pContextGPU_->makeCurrent();
    FrameState const state(*pContextGPU_);
    prepareOGLForProcess();
    sweepErrors();
    try {
        setNodeImageDescriptorInfo(false);
        Controller::process();
    } catch (...) {
        // What it left pending would fail the next frame.
        drainErrors();
        throw;
    }
    sweepErrors();
}

void ImageFlowController::processAsync() {
    joinFrame();
    setNodeImageDescriptorInfo(false);
    Controller::processAsync();
}

void ImageFlowController::processFrameFunction() {
    {
        // Gone before the completion, whose callback may launch the next frame on another thread.
        OGL::ScopedContextWrapper const wrapper;
        if (pContextGPU_ == nullptr) {
            pullFrame();
        } else {
            pContextGPU_->makeCurrent();
            FrameState const state(*pContextGPU_);
            prepareOGLForProcess();
            if (!pullFrame()) {
                // The exception tells more than the error, which wait() would report in its place.
                drainErrors();
            }
        }
    }
    notifyOfCompletion();
}

bool ImageFlowController::wait(double timeout, double interval) {
    OGL::ScopedContextWrapper const wrapper;
    if (!Controller::wait(timeout, interval)) {
        // The frame still holds the context.
        return false;
    }
    if (pContextGPU_ != nullptr) {
        pContextGPU_->makeCurrent();
        sweepErrors();
    }
    return true;
}

void ImageFlowController::sleep(double seconds) {
    OGL::ScopedContextWrapper const wrapper;
    Controller::sleep(seconds);
}

void ImageFlowController::setImageSink(ImageFilter& sink) { setSinkNode(&sink); }

ImageFilter* ImageFlowController::imageSink() {
    return getSinkNode() == nullptr ? nullptr : getSinkNode()->asImageFilter();
}

ImageFilter const* ImageFlowController::imageSink() const {
    return getSinkNode() == nullptr ? nullptr : getSinkNode()->asImageFilter();
}

void ImageFlowController::propagatePixelExtents() {
    PropagatePixelExtentVisitor visitor;
    depthFirstSearch(visitor);
}

void ImageFlowController::propagateDODs() {
    PropagateDODVisitor visitor;
    depthFirstSearch(visitor);
}

void ImageFlowController::propagateROIs(PositionExtentInWorldSpace const& region) {
    ImageFilter* const pSink = imageSink();
    ORVO_ENFORCE(pSink, "imageSink()");
    pSink->setRegionOfInterest(region);
    DFSPostStackVisitor visitor;
    depthFirstSearch(visitor);
    for (ImageFilter* pImageFilter : visitor.stack()) {
        ORVO_ENFORCE(pImageFilter);
        // A pass that failed half way has left regions behind, with which this one would pass or fail
        // wrongly.
        pImageFilter->clearParentROIs();
    }
    for (auto iter = visitor.stack().rbegin(); iter != visitor.stack().rend(); ++iter) {
        (*iter)->computeUnionOfParentROIs();
        (*iter)->computeAndSetChildROIs();
    }
    determineComputeRegions();
}

void ImageFlowController::determineComputeRegions() {
    for (auto iter = nodesBegin(); iter != nodesEnd(); ++iter) {
        ImageFilter* const pImageFilter = (*iter)->asImageFilter();
        if (pImageFilter == nullptr) {
            continue;
        }
        PositionExtentInWorldSpace region = pImageFilter->domainOfDefinition();
        region.intersect(pImageFilter->regionOfInterest());
        pImageFilter->computeRegionParameter().setValue(region);
        ORVO_CHECK(!region.extent().isInfinite(), "Output region can't be infinite.");
    }
}

void ImageFlowController::computeRegions(PositionExtentInWorldSpace const& region) {
    propagatePixelExtents();
    propagateDODs();
    propagateROIs(region);
}

void ImageFlowController::setDirtyState() {
    SetDirtyStateVisitor visitor;
    depthFirstSearch(visitor);
}

void ImageFlowController::clearColors() {
    for (auto iter = nodesBegin(); iter != nodesEnd(); ++iter) {
        (*iter)->setColor(Node::COLOR_NOT_VISITED);
    }
}

void ImageFlowController::depthFirstSearch(Visitor& visitor) {
    VisitorScope const scope(pVisitor_, visitor);
    clearColors();
    ORVO_ENFORCE(pVisitor_);
    ORVO_ENFORCE(imageSink());
    depthFirstVisit(getSinkNode());
}

void ImageFlowController::depthFirstVisit(Node* node) {
    // The way from the first node to the current one, on the heap: a graph may be deeper than a thread's
    // stack.
    struct Step {
        ImageFilter* pImageFilter_;
        std::size_t iNextInput_;
    };
    std::vector<Step> aWay;
    auto const enter = [&](Node* pNode) {
        ImageFilter* const pImageFilter = pNode->asImageFilter();
        ORVO_ENFORCE(pVisitor_);
        pVisitor_->preVisitImageNode(pImageFilter);
        pNode->setColor(Node::COLOR_DISCOVERED);
        aWay.push_back({pImageFilter, 0});
    };
    enter(node);
    while (!aWay.empty()) {
        Step& step = aWay.back();
        ImageFilter* const pImageFilter = step.pImageFilter_;
        if (pImageFilter != nullptr && step.iNextInput_ < pImageFilter->numberOfImageInputs()) {
            Node* const pSource = producerOf(*pImageFilter, step.iNextInput_++);
            if (pSource->color() == Node::COLOR_NOT_VISITED) {
                enter(pSource);
            }
        } else {
            aWay.pop_back();
            // A visitor that began a walk of its own has ended this one.
            ORVO_ENFORCE(pVisitor_);
            pVisitor_->postVisitImageNode(pImageFilter);
        }
    }
}

void ImageFlowController::breadthFirstSearch(Visitor& visitor) {
    VisitorScope const scope(pVisitor_, visitor);
    ORVO_ENFORCE(pVisitor_);
    clearColors();
    ORVO_ENFORCE(imageSink());
    getSinkNode()->setColor(Node::COLOR_DISCOVERED);
    std::deque<Node*> aQueue{getSinkNode()};
    while (!aQueue.empty()) {
        Node* const pNode = aQueue.front();
        ImageFilter* const pImageFilter = pNode->asImageFilter();
        ORVO_ENFORCE(pVisitor_);
        pVisitor_->preVisitImageNode(pImageFilter);
        std::size_t const nInputs = pImageFilter == nullptr ? 0 : pImageFilter->numberOfImageInputs();
        for (std::size_t iInput = 0; iInput < nInputs; ++iInput) {
            Node* const pSource = producerOf(*pImageFilter, iInput);
            if (pSource->color() == Node::COLOR_NOT_VISITED) {
                pSource->setColor(Node::COLOR_DISCOVERED);
                aQueue.push_back(pSource);
            }
        }
        aQueue.pop_front();
        pNode->setColor(Node::COLOR_FINISHED);
        ORVO_ENFORCE(pVisitor_);
        pVisitor_->postVisitImageNode(pImageFilter);
    }
}

std::vector<ImageFilter*> ImageFlowController::filtersProducersFirst() {
    DFSPostStackVisitor visitor;
    depthFirstSearch(visitor);
    std::vector<ImageFilter*> aFilters = visitor.stack();
    for (auto iter = nodesBegin(); iter != nodesEnd(); ++iter) {
        if ((*iter)->color() == Node::COLOR_NOT_VISITED) {
            aFilters.push_back((*iter)->asImageFilter());
        }
    }
    return aFilters;
}

void ImageFlowController::setNodeImageDescriptorInfo(bool fromSink) {
    ImageFilter* const pSink = imageSink();
    ORVO_ENFORCE(pSink);
    if (fromSink) {
        setPrecisionFrom(*pSink);
        return;
    }
    DataFlow::OutputConnector const* const pOutput = pSink->imageOutput();
    bool const bSinkHasData = pOutput != nullptr && pOutput->hasData();
    for (auto iter = nodesBegin(); iter != nodesEnd(); ++iter) {
        ImageFilter* const iff = (*iter)->asImageFilter();
        ORVO_CHECK(iff != nullptr, "iff!=0");
        if (bSinkHasData) {
            return;
        }
        iff->setImageDescInfoFromSource(true);
    }
}

void ImageFlowController::setPrecisionFrom(ImageFilter const& sink) {
    Hint hint = ImageFilter::OUTPUT_PRECISION_DEFAULT;
    // All is checked before the first node changes.
    for (auto iter = nodesBegin(); iter != nodesEnd(); ++iter) {
        ImageFilter const* const iff = (*iter)->asImageFilter();
        ORVO_CHECK(iff != nullptr, "iff!=0");
        hint = hintFrom(sink);
    }
    for (ImageFilter* iff : filtersProducersFirst()) {
        ORVO_CHECK(iff != nullptr, "iff!=0");
        iff->computeImageDescriptorInfo(hint);
    }
}

} // namespace ORVO
