#include "orvo/filter_graph/filters/Unpremultiply.h"

#include "orvo/filter_graph/filters/PointKernel.h"

namespace ORVO::FilterGraph::Internal::Filters {

Unpremultiply::Unpremultiply()
    : BasicGLShaderFilter("unpremultiply",
                          pointKernel("src.a > 0.0 ? vec4(src.rgb/src.a, src.a) : vec4(0.0)").c_str(), 4) {
    addInput("src");
}

Unpremultiply::~Unpremultiply() = default;

} // namespace ORVO::FilterGraph::Internal::Filters
