#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/filters/PointFilter.h"

namespace ORVO::FilterGraph::Internal::Filters {

/// Multiplies the colour of the input "src" by its alpha.
///
/// Threads: as `PointFilter`.
class ORVO_API Premultiply : public PointFilter {
public:
    Premultiply();
    ~Premultiply() override;
};

} // namespace ORVO::FilterGraph::Internal::Filters
