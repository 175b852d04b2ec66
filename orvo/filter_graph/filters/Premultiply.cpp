#include "orvo/filter_graph/filters/Premultiply.h"

#include "orvo/filter_graph/filters/PointKernel.h"

namespace ORVO::FilterGraph::Internal::Filters {

Premultiply::Premultiply()
    : BasicGLShaderFilter("premultiply", pointKernel("vec4(src.rgb*src.a, src.a)").c_str(), 4) {
    addInput("src");
}

Premultiply::~Premultiply() = default;

} // namespace ORVO::FilterGraph::Internal::Filters
