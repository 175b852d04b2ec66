#include "orvo/filter_graph/filters/Scale16_to_15_1.h"

namespace ORVO::FilterGraph::Internal::Filters {

Scale16_to_15_1::Scale16_to_15_1() : Scale16_to_15_1("scaleDown4channel", 4) {}

Scale16_to_15_1::Scale16_to_15_1(char const* name, int numChannels)
    : PointFilter(name, "src*0.5000076", numChannels) {}

Scale16_to_15_1::~Scale16_to_15_1() = default;

} // namespace ORVO::FilterGraph::Internal::Filters
