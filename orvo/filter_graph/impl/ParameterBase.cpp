#include "orvo/filter_graph/impl/ParameterBase.h"

#include "orvo/core/Check.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/core/utility/SharedPtr.h"
#include "orvo/data_flow/parameters/ParameterBase.h"
#include "orvo/filter_graph/impl/MetadataItemBase.h"

#include <algorithm>

namespace ORVO::FilterGraph {

ParameterBase::ParameterBase(std::string const& name, teType type, bool autoPin)
    : DataItemBase(name, type), bAutoPin_(autoPin) {}

ParameterBase::~ParameterBase() {
    for (MetadataItemBase const* pItem : aMetadata_)
        trackedDelete(pItem);
}

bool ParameterBase::isAutoPin() const { return bAutoPin_; }

void ParameterBase::setValue(ParameterBase const& other) { spData_->setValueFromParameter(*other.spData_); }

void ParameterBase::addMetadataItem(MetadataItemBase const* pItem) {
    ORVO_ENFORCE(pItem);
    std::unique_ptr<MetadataItemBase const, ORVODeleter<MetadataItemBase const>> item(pItem);
    aMetadata_.push_back(item.get());
    item.release();
}

MetadataIterator ParameterBase::metadata() { return {aMetadata_.begin(), aMetadata_.end()}; }

MetadataConstIterator ParameterBase::metadata() const { return {aMetadata_.begin(), aMetadata_.end()}; }

MetadataItemBase const* ParameterBase::metadataItem(std::string const& name) const {
    auto const item = std::find_if(aMetadata_.begin(), aMetadata_.end(),
                                   [&name](MetadataItemBase const* pItem) { return pItem->name() == name; });
    return item != aMetadata_.end() ? *item : nullptr;
}

std::size_t ParameterBase::getNumberOfMetadataItems() const { return aMetadata_.size(); }

void ParameterBase::cloneMetadata(ParameterBase* pTarget) const {
    ORVO_ENFORCE(pTarget);
    for (MetadataItemBase const* pItem : aMetadata_) {
        ORVO_ENFORCE(pItem);
        pTarget->addMetadataItem(pItem->clone());
    }
}

void ParameterBase::checkType(teType type) const {
    ORVO_CHECK(type == this->type(), "Data type retrieved must match parameter exactly");
}

} // namespace ORVO::FilterGraph
