#include "orvo/filter_graph/impl/MetadataItemBase.h"

#include "orvo/core/Check.h"

namespace ORVO::FilterGraph {

MetadataItemBase::MetadataItemBase(std::string const& name, teType type) : DataItemBase(name, type) {}

MetadataItemBase::~MetadataItemBase() = default;

void MetadataItemBase::checkType(teType type) const {
    ORVO_CHECK(type == this->type(), "Data type retrieved must match metadata item exactly");
}

} // namespace ORVO::FilterGraph
