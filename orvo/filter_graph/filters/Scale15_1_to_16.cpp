#include "orvo/filter_graph/filters/Scale15_1_to_16.h"

#include "orvo/filter_graph/filters/PointKernel.h"

namespace ORVO::FilterGraph::Internal::Filters {

Scale15_1_to_16::Scale15_1_to_16() : Scale15_1_to_16("scaleUp4channel", 4) {}

Scale15_1_to_16::Scale15_1_to_16(char const* name, int numChannels)
    : BasicGLShaderFilter(name, pointKernel("src*1.999969").c_str(), numChannels) {
    addInput("src");
}

Scale15_1_to_16::~Scale15_1_to_16() = default;

} // namespace ORVO::FilterGraph::Internal::Filters
