#include "orvo/filter_graph/internal/OutputAdapter.h"

#include "orvo/core/Check.h"
#include "orvo/core/spaces/Conversions.h"
#include "orvo/core/spaces/PositionExtentInPixelSpace.h"
#include "orvo/filter_graph/impl/ImageBase.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/internal/OutputAdapterExecutable.h"

namespace ORVO::FilterGraph::Internal {

namespace {

constexpr char const* inputName = "InputImage";

} // namespace

OutputAdapter::OutputAdapter(eRegionSyncMode mode) : mode_(mode) { addInput(inputName, 0); }

OutputAdapter::OutputAdapter(OutputAdapter const& other)
    : IOutputAdapter(other), Filter(other), mode_(other.mode_) {}

OutputAdapter::~OutputAdapter() = default;

std::shared_ptr<OutputAdapter> OutputAdapter::create(eRegionSyncMode mode) {
    return std::make_shared<OutputAdapter>(mode);
}

void OutputAdapter::setImage(ImageBase* image) {
    bool const isLike = image_ && image && image_->imageDescriptor().equals(image->imageDescriptor());
    if (!isLike)
        updateTimeStamp();

    image_ = image;
    Input* pInput = input(inputName);
    updateNumChannelsOnInput(pInput, 0);
    if (!image_)
        return;
    updateNumChannelsOnInput(pInput, getImageDescriptor().format().nChannel);
    std::size_t const producerChannels = pInput->producerFilter() ? pInput->producerFilter()->nChannel() : 0;
    ORVO_CHECK(producerChannels == 0 || getImageDescriptor().format().nChannel == producerChannels,
               "this->getImageDescriptor().format().nChannel == producerChannels");
}

ImageBase* OutputAdapter::getImage() const { return image_; }

IFilter* OutputAdapter::getIFilter() { return this; }

IFilter const* OutputAdapter::getIFilter() const { return this; }

IAdapter::eRegionSyncMode OutputAdapter::mode() { return mode_; }

void OutputAdapter::setRegionOfInterest(PositionExtentInWorldSpace const& region) {
    regionOfInterest_ = region;
}

PositionExtentInWorldSpace const& OutputAdapter::getRegionOfInterest() const {
    switch (mode_) {
    case REGION_SYNC_FROM_IMAGE:
        ORVO_ENFORCE(image_);
        return image_->region();
    case REGION_SYNC_EXPLICIT:
        return regionOfInterest_;
    }
    ORVO_FAIL("Error in ORVO::FilterGraph::Internal::InputAdapter::getDOD");
}

PositionExtentInWorldSpace const& OutputAdapter::getDomainOfDefinition() const { return domainOfDefinition_; }

PositionExtentInPixelSpace OutputAdapter::getImageRect() {
    PositionExtentInWorldSpace region = getRegionOfInterest();
    region.intersect(domainOfDefinition_);
    return worldToPixelSpace(region, getImageDescriptor().pixelExtent());
}

void OutputAdapter::updateDOD(PositionExtentInWorldSpace const& region) { domainOfDefinition_ = region; }

ImageDescriptor const& OutputAdapter::getImageDescriptor() const {
    ORVO_ENFORCE(image_);
    return image_->imageDescriptor();
}

bool OutputAdapter::isSIMD() const { return false; }

std::shared_ptr<Filter> OutputAdapter::clone() {
    return std::shared_ptr<OutputAdapter>(new OutputAdapter(*this));
}

std::shared_ptr<IFilterExecutable> OutputAdapter::buildFilterExecutable(TargetPlatform,
                                                                        GraphExecutable& graphExecutable) {
    return std::make_shared<OutputAdapterExecutable>(graphExecutable, *this);
}

} // namespace ORVO::FilterGraph::Internal
