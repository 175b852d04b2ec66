#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/filters/PointFilter.h"

namespace ORVO::FilterGraph::Internal::Filters {

/// Takes texels from OpenGL's scale of 16-bit integers, whose white is 65535, to the one whose white is
/// 32768: every channel of the input "src", alpha too, times 32768/65535.
///
/// Threads: as `PointFilter`.
class ORVO_API Scale16_to_15_1 : public PointFilter {
public:
    /// "scaleDown4channel".
    Scale16_to_15_1();
    /// The same under another name, for results with another number of channels.
    Scale16_to_15_1(char const* name, int numChannels);
    ~Scale16_to_15_1() override;
};

} // namespace ORVO::FilterGraph::Internal::Filters
