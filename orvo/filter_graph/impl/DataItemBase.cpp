#include "orvo/filter_graph/impl/DataItemBase.h"

namespace ORVO::FilterGraph {

DataItemBase::DataItemBase(std::string const& name, teType type) : eType_(type), sName_(name) {}

DataItemBase::~DataItemBase() = default;

} // namespace ORVO::FilterGraph
