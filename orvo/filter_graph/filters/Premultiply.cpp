#include "orvo/filter_graph/filters/Premultiply.h"

namespace ORVO::FilterGraph::Internal::Filters {

Premultiply::Premultiply() : PointFilter("premultiply", "vec4(src.rgb*src.a, src.a)", 4) {}

Premultiply::~Premultiply() = default;

} // namespace ORVO::FilterGraph::Internal::Filters
