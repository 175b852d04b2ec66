#include "orvo/filter_graph/impl/IFilter.h"

namespace ORVO::FilterGraph {

IFilter::~IFilter() = default;

} // namespace ORVO::FilterGraph
