#include "orvo/filter_graph/filters/Scale15_1_to_16.h"

namespace ORVO::FilterGraph::Internal::Filters {

Scale15_1_to_16::Scale15_1_to_16() : Scale15_1_to_16("scaleUp4channel", 4) {}

Scale15_1_to_16::Scale15_1_to_16(char const* name, int numChannels)
    : PointFilter(name, "src*1.999969", numChannels) {}

Scale15_1_to_16::~Scale15_1_to_16() = default;

} // namespace ORVO::FilterGraph::Internal::Filters
