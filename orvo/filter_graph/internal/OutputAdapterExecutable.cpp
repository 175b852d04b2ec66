#include "orvo/filter_graph/internal/OutputAdapterExecutable.h"

#include "orvo/core/Check.h"
#include "orvo/filter_graph/impl/ImageDescriptor.h"
#include "orvo/filter_graph/internal/GraphExecutable.h"
#include "orvo/filter_graph/internal/ImageAccessor.h"
#include "orvo/filter_graph/internal/OutputAdapter.h"
#include "orvo/image_flow/nodes/ImageFilter.h"
#include "orvo/image_runtime/images/ImageBase.h"

namespace ORVO::FilterGraph::Internal {

namespace {

ImageFilter::teOutputPrecisionHint precisionHint(ImageDescriptor const& descriptor) {
    switch (static_cast<int>(descriptor.format().channelType)) {
    case 0:
        return ImageFilter::OUTPUT_PRECISION_8_BIT_INT;
    case 2:
    case 3:
        return ImageFilter::OUTPUT_PRECISION_16_BIT_INT;
    case 4:
        return ImageFilter::OUTPUT_PRECISION_16_BIT_FLOAT;
    case 6:
        return ImageFilter::OUTPUT_PRECISION_32_BIT_FLOAT;
    default:
        return ImageFilter::OUTPUT_PRECISION_DEFAULT;
    }
}

} // namespace

OutputAdapterExecutable::OutputAdapterExecutable(GraphExecutable& graphExecutable, OutputAdapter& adapter)
    : pAdapter_(&adapter), pGraphExecutable_(&graphExecutable) {}

OutputAdapterExecutable::~OutputAdapterExecutable() = default;

void OutputAdapterExecutable::forwardStuff() {
    ORVO_ENFORCE(pSink_);
    FilterGraph::ImageBase* const pImage = pAdapter_->getImage();
    // An image without pixels unbinds what an earlier one bound: nothing may be written through a stale
    // pointer.
    pSink_->setBoundOutputImage(pImage ? ImageAccessor::getImpl<ORVO::ImageBase>(pImage) : nullptr);

    ImageDescriptor const& descriptor = pAdapter_->getImageDescriptor();
    pSink_->setOutputPixelExtent(pGraphExecutable_->outputPixelExtentInWorldSpace());
    pSink_->setRegionOfInterest(pAdapter_->getRegionOfInterest());
    pSink_->outputPrecisionHintParameter().setValue(precisionHint(descriptor));
}

void OutputAdapterExecutable::returnStuff() {
    ORVO_ENFORCE(pSink_);
    pAdapter_->updateDOD(pSink_->domainOfDefinition());
}

DataFlow::InputConnector* OutputAdapterExecutable::getImageFlowInputConnector(std::string const& /*name*/) {
    return nullptr;
}

DataFlow::OutputConnector* OutputAdapterExecutable::getImageFlowOutputConnector() { return nullptr; }

DataFlow::OutputConnector* OutputAdapterExecutable::cloneImageFlowOutputConnector() { return nullptr; }

DataFlow::OutputConnector* OutputAdapterExecutable::getClonedImageFlowOutputConnector(std::size_t /*index*/) {
    return nullptr;
}

TargetPlatform OutputAdapterExecutable::getInputTargetPlatform() {
    return pAdapter_->getImageDescriptor().type();
}

TargetPlatform OutputAdapterExecutable::getOutputTargetPlatform() { return ORVO_TARGET_UNSET; }

void OutputAdapterExecutable::bind(ImageFilter* pSink) { pSink_ = pSink; }

} // namespace ORVO::FilterGraph::Internal
