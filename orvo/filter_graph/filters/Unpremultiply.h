#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/filters/PointFilter.h"

namespace ORVO::FilterGraph::Internal::Filters {

/// Divides the colour of the input "src" by its alpha; where alpha is 0 the result is transparent black.
///
/// Threads: as `PointFilter`.
class ORVO_API Unpremultiply : public PointFilter {
public:
    Unpremultiply();
    ~Unpremultiply() override;
};

} // namespace ORVO::FilterGraph::Internal::Filters
