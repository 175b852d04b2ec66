// The geometry passes of ImageFilter: pixel extents, domains of definition, regions of interest.

#include "orvo/core/Check.h"
#include "orvo/image_flow/nodes/ImageFilter.h"

#include <string>

namespace ORVO {

namespace {

PixelExtentInWorldSpace extentOf(std::map<std::string, PixelExtentInWorldSpace> const& extents,
                                 std::string const& name) {
    auto const entry = extents.find(name);
    return entry == extents.end() ? PixelExtentInWorldSpace() : entry->second;
}

} // namespace

// Overrides may keep the name.
// NOLINTBEGIN(performance-unnecessary-value-param)
PositionExtentInWorldSpace ImageFilter::needed(PositionExtentInWorldSpace const& outputRegion,
                                               std::string /*inputName*/, RegionMap const& /*inputDODs*/) {
    return outputRegion;
}

PositionExtentInWorldSpace ImageFilter::changed(PositionExtentInWorldSpace const& inputRegion,
                                                std::string /*inputName*/, RegionMap const& /*inputDODs*/) {
    return inputRegion;
}
// NOLINTEND(performance-unnecessary-value-param)

PositionExtentInWorldSpace ImageFilter::computeDomainOfDefinition() {
    PositionExtentInWorldSpace result;
    RegionMap const inputDODs = inputDomainsOfDefinition();
    for (auto const& [name, dod] : inputDODs) {
        result.include(changed(dod, name, inputDODs));
    }
    if (pImageOutput_ != nullptr) {
        result.include(generated(inputDODs));
    }
    return result;
}

void ImageFilter::computeAndSetChildROIs() {
    if (aImageInputs_.empty()) {
        return;
    }
    RegionMap const inputDODs = inputDomainsOfDefinition();
    for (DataFlow::InputConnector const* pInput : aImageInputs_) {
        PositionExtentInWorldSpace const roi = needed(oRegionOfInterest_, pInput->name(), inputDODs);
        producerOf(*pInput)->setParentROI(roi);
    }
}

PositionExtentInWorldSpace ImageFilter::generated(RegionMap const& /*inputDODs*/) {
    return oGeneratedRegion_;
}

PositionExtentInWorldSpace const& ImageFilter::domainOfDefinition() const { return oDomainOfDefinition_; }

PositionExtentInWorldSpace const& ImageFilter::regionOfInterest() const { return oRegionOfInterest_; }

void ImageFilter::setGeneratedRegion(PositionExtentInWorldSpace const& region) { oGeneratedRegion_ = region; }

void ImageFilter::setDomainOfDefinition(PositionExtentInWorldSpace const& region) {
    oDomainOfDefinition_ = region;
}

void ImageFilter::setRegionOfInterest(PositionExtentInWorldSpace const& region) {
    oRegionOfInterest_ = region;
}

void ImageFilter::setParentROI(PositionExtentInWorldSpace const& region) {
    ORVO_CHECK(aParentROIs_.size() < totalNumberOfAllImageOutputs(),
               "aParentROIs_.size() < totalNumberOfAllImageOutputs()");
    aParentROIs_.push_back(region);
}

void ImageFilter::clearParentROIs() { aParentROIs_.clear(); }

void ImageFilter::computeUnionOfParentROIs() {
    if (aParentROIs_.empty()) {
        return;
    }
    ORVO_CHECK(aParentROIs_.size() == totalNumberOfAllImageOutputs(),
               "aParentROIs_.size() == totalNumberOfAllImageOutputs()");
    oRegionOfInterest_ = PositionExtentInWorldSpace();
    for (PositionExtentInWorldSpace const& region : aParentROIs_) {
        oRegionOfInterest_.include(region);
    }
    aParentROIs_.clear();
}

void ImageFilter::setOutputPixelExtent(PixelExtentInWorldSpace const& pixelExtent) {
    oOutputPixelExtent_ = pixelExtent;
    bUseDefaultPixelExtent_ = false;
}

void ImageFilter::computePixelExtents() {
    for (DataFlow::InputConnector const* pInput : aImageInputs_) {
        ImageFilter const* const pSource = producerOf(*pInput);
        spPixelExtentSet_->aInputPixelExtents_[pInput->name()] =
            extentOf(pSource->spPixelExtentSet_->aOutputPixelExtents_, pInput->connectedOutput()->name());
    }
    if (pImageOutput_ == nullptr) {
        return;
    }
    bool const bInherited = bUseDefaultPixelExtent_ && !aImageInputs_.empty();
    spPixelExtentSet_->aOutputPixelExtents_[pImageOutput_->name()] =
        bInherited ? extentOf(spPixelExtentSet_->aInputPixelExtents_, aImageInputs_.front()->name())
                   : oOutputPixelExtent_;
}

PixelExtentInWorldSpace ImageFilter::outputPixelExtent() const {
    return pImageOutput_ == nullptr
               ? PixelExtentInWorldSpace()
               : extentOf(spPixelExtentSet_->aOutputPixelExtents_, pImageOutput_->name());
}

ImageFilter* ImageFilter::producerOf(DataFlow::InputConnector const& input) const {
    DataFlow::OutputConnector const* const pOutput = input.connectedOutput();
    ORVO_ENFORCE(pOutput);
    ImageFilter* const pSource = pOutput->node() == nullptr ? nullptr : pOutput->node()->asImageFilter();
    ORVO_ENFORCE(pSource);
    return pSource;
}

ImageFilter::RegionMap ImageFilter::inputDomainsOfDefinition() const {
    RegionMap inputDODs;
    for (DataFlow::InputConnector const* pInput : aImageInputs_) {
        inputDODs[pInput->name()] = producerOf(*pInput)->domainOfDefinition();
    }
    return inputDODs;
}

} // namespace ORVO
