#include "orvo/filter_graph/filters/Scale16_to_15_1.h"

#include "orvo/filter_graph/filters/PointKernel.h"

namespace ORVO::FilterGraph::Internal::Filters {

Scale16_to_15_1::Scale16_to_15_1() : Scale16_to_15_1("scaleDown4channel", 4) {}

Scale16_to_15_1::Scale16_to_15_1(char const* name, int numChannels)
    : BasicGLShaderFilter(name, pointKernel("src*0.5000076").c_str(), numChannels) {
    addInput("src");
}

Scale16_to_15_1::~Scale16_to_15_1() = default;

} // namespace ORVO::FilterGraph::Internal::Filters
