#include "orvo/filter_graph/filters/Unpremultiply.h"

namespace ORVO::FilterGraph::Internal::Filters {

Unpremultiply::Unpremultiply()
    : PointFilter("unpremultiply", "src.a > 0.0 ? vec4(src.rgb/src.a, src.a) : vec4(0.0)", 4) {}

Unpremultiply::~Unpremultiply() = default;

} // namespace ORVO::FilterGraph::Internal::Filters
