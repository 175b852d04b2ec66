#pragma once

#include "orvo/core/Export.h"

namespace ORVO::FilterGraph {
class Input;
}

namespace ORVO::FilterGraph::Internal {

class Filter;

/// Feeds the output of a filter into an input, which is taken from its old producer first, and moves the time
/// stamps of both filters.
/// @throws InternalException "Enforce pSourceFilter != NULL" or "Enforce pInput != NULL" for null.
/// @throws Exception if the channel counts of both sides are fixed and differ; the input is then unconnected.
ORVO_API void Connect(Filter* pSourceFilter, Input* pInput);

/// Feeds the output of a filter into the one input of another.
/// @throws InternalException "Enforce pSourceFilter != NULL" or "Enforce pDestinationFilter != NULL" for
/// null.
/// @throws Exception if the destination has no or several inputs; else as the other form.
ORVO_API void Connect(Filter* pSourceFilter, Filter* pDestinationFilter);

} // namespace ORVO::FilterGraph::Internal
