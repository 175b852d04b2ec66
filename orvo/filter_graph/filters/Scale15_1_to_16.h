#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/filters/PointFilter.h"

namespace ORVO::FilterGraph::Internal::Filters {

/// Takes texels from the scale of 16-bit integers whose white is 32768 to OpenGL's, whose white is 65535:
/// every channel of the input "src", alpha too, times 65535/32768.
///
/// Threads: as `PointFilter`.
class ORVO_API Scale15_1_to_16 : public PointFilter {
public:
    /// "scaleUp4channel".
    Scale15_1_to_16();
    /// The same under another name, for results with another number of channels.
    Scale15_1_to_16(char const* name, int numChannels);
    ~Scale15_1_to_16() override;
};

} // namespace ORVO::FilterGraph::Internal::Filters
