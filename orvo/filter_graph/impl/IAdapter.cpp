#include "orvo/filter_graph/impl/IAdapter.h"

namespace ORVO::FilterGraph {

IAdapter::~IAdapter() = default;

} // namespace ORVO::FilterGraph
