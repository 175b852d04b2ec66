#include "orvo/image_flow/nodes/CompoundFilterBase.h"

#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/ScopedPtr.h"
#include "orvo/image_flow/controllers/Bedding.h"
#include "orvo/image_flow/controllers/ImageFlowController.h"

#include <algorithm>

namespace ORVO {

namespace {

/// Erases the first entry that is the node, at which nobody looks: it may be on its way out.
template <typename NodeType>
void eraseFirst(std::vector<NodeType*>& aNodes, DataFlow::Node const* pNode) {
    auto const iter = std::find_if(aNodes.begin(), aNodes.end(), [pNode](NodeType* pEntry) {
        return static_cast<DataFlow::Node const*>(pEntry) == pNode;
    });
    if (iter != aNodes.end()) {
        aNodes.erase(iter);
    }
}

} // namespace

CompoundFilterBase::CompoundFilterBase()
    : pController_(nullptr), pBedding_(nullptr), eHint_(ImageFilter::OUTPUT_PRECISION_DEFAULT) {
    ScopedPtr<ImageFlowController> pController(ORVO_NEW ImageFlowController());
    pBedding_ = ORVO_NEW Bedding(*pController);
    pController_ = pController.release();
}

CompoundFilterBase::~CompoundFilterBase() {
    trackedDelete(pBedding_);
    trackedDelete(pController_);
}

void CompoundFilterBase::addNode(DataFlow::Node* node) {
    ORVO_CHECK(pController_ != nullptr, "pController_");
    aEmitters_.reserve(aEmitters_.size() + 1);
    aImageFilters_.reserve(aImageFilters_.size() + 1);
    if (!pController_->addNode(node)) {
        return;
    }
    if (node->canEmit()) {
        aEmitters_.push_back(node);
    }
    if (ImageFilter* const pImageFilter = node->asImageFilter()) {
        aImageFilters_.push_back(pImageFilter);
    }
}

void CompoundFilterBase::removeNode(DataFlow::Node* node) {
    ORVO_CHECK(pController_ != nullptr, "pController_");
    if (!pController_->removeNode(node)) {
        return;
    }
    eraseFirst(aImageFilters_, node);
    eraseFirst(aEmitters_, node);
}

void CompoundFilterBase::internalProcess(PositionExtentInWorldSpace const& region) {
    ORVO_CHECK(pController_ != nullptr, "pController_");
    ORVO_CHECK(pController_->getSinkNode() != nullptr, "pController_->getSinkNode()");
    pBedding_->computeRegions(region);
    emitAndProcess();
}

void CompoundFilterBase::propagatePrecisionHint(ImageFilter::teOutputPrecisionHint hint) {
    if (hint == eHint_) {
        return;
    }
    for (ImageFilter* const pImageFilter : aImageFilters_) {
        pImageFilter->outputPrecisionHintParameter().setValue(hint);
    }
    eHint_ = hint;
}

void CompoundFilterBase::plantMasterTree(ImageFilter& filter) { pBedding_->plantMasterTree(filter); }

void CompoundFilterBase::computeRegionsAndProcess() {
    for (ImageFilter* const pImageFilter : aImageFilters_) {
        computeNodeRegions(pImageFilter);
    }
    emitAndProcess();
}

void CompoundFilterBase::computeNodeRegions(ImageFilter* filter) {
    if (filter->numberOfOutputs() == 0) {
        return;
    }
    PositionExtentInWorldSpace region = filter->domainOfDefinition();
    region.intersect(filter->regionOfInterest());
    filter->computeRegionParameter().setValue(region);
}

void CompoundFilterBase::emitAndProcess() {
    for (DataFlow::Node* const pEmitter : aEmitters_) {
        pEmitter->emit();
    }
    ORVO_CHECK(pController_ != nullptr, "pController_");
    try {
        pController_->process();
    } catch (...) {
        // A node that threw counts as running until it is flushed, and the next frame would pass it by.
        try {
            pController_->flushGraph();
        } catch (...) { // The failure that is reported is the frame's.
        }
        throw;
    }
}

} // namespace ORVO
