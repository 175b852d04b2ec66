#include "orvo/filter_graph/internal/InputAdapter.h"

#include "orvo/core/Check.h"
#include "orvo/filter_graph/impl/ImageBase.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/Output.h"
#include "orvo/filter_graph/internal/InputAdapterExecutableCPU.h"
#include "orvo/filter_graph/internal/InputAdapterExecutableGL.h"

namespace ORVO::FilterGraph::Internal {

InputAdapter::InputAdapter(eRegionSyncMode mode) : mode_(mode) {}

InputAdapter::InputAdapter(InputAdapter const& other)
    : IInputAdapter(other), Filter(other), mode_(other.mode_) {}

InputAdapter::~InputAdapter() = default;

void InputAdapter::setImage(ImageBase* image) {
    bool const isLike = image_ && image && image_->imageDescriptor().equals(image->imageDescriptor());
    if (!isLike)
        updateTimeStamp();

    Output* output = this->output();
    output->setNumChannels(0);
    image_ = image;
    if (!image_)
        return;
    output->setNumChannels(getImageDescriptor().format().nChannel);
    for (Input* pInput : output->consumerInputs()) {
        auto const* pConsumer = dynamic_cast<Filter const*>(pInput->parentFilter());
        ORVO_ENFORCE(pConsumer);
        Input const* pConsumerInput = pConsumer->input(pInput->name());
        ORVO_ENFORCE(pConsumerInput);
        std::size_t const consumerNumChannels = pConsumerInput->nChannel();
        ORVO_CHECK(consumerNumChannels == 0 || consumerNumChannels == output->nChannel(),
                   "consumerNumChannels == output->nChannel()");
    }
}

ImageBase* InputAdapter::getImage() const { return image_; }

IFilter* InputAdapter::getIFilter() { return this; }

IFilter const* InputAdapter::getIFilter() const { return this; }

IAdapter::eRegionSyncMode InputAdapter::mode() { return mode_; }

void InputAdapter::setDomainOfDefinition(PositionExtentInWorldSpace const& region) {
    domainOfDefinition_ = region;
}

PositionExtentInWorldSpace const& InputAdapter::getDomainOfDefinition() const {
    switch (mode_) {
    case REGION_SYNC_FROM_IMAGE:
        ORVO_ENFORCE(image_);
        return image_->region();
    case REGION_SYNC_EXPLICIT:
        return domainOfDefinition_;
    }
    ORVO_FAIL("Error in ORVO::FilterGraph::Internal::InputAdapter::getDOD");
}

PositionExtentInWorldSpace const& InputAdapter::getRegionOfInterest() const { return regionOfInterest_; }

void InputAdapter::updateROI(PositionExtentInWorldSpace const& region) { regionOfInterest_ = region; }

ImageDescriptor const& InputAdapter::getImageDescriptor() const {
    ORVO_ENFORCE(image_);
    return image_->imageDescriptor();
}

std::shared_ptr<Filter> InputAdapter::clone() {
    return std::shared_ptr<InputAdapter>(new InputAdapter(*this));
}

std::shared_ptr<IFilterExecutable> InputAdapter::buildFilterExecutable(TargetPlatform,
                                                                       GraphExecutable& graphExecutable) {
    // What the source is made for follows from where the image lives, not from the target of the graph.
    TargetPlatform const type = getImageDescriptor().type();
    if (type == ORVO_TARGET_GL)
        return std::make_shared<InputAdapterExecutableGL>(graphExecutable, *this);
    if (type == ORVO_TARGET_CPU)
        return std::make_shared<InputAdapterExecutableCPU>(graphExecutable, *this);
    ORVO_FAIL_PARAMETER("false");
}

} // namespace ORVO::FilterGraph::Internal
