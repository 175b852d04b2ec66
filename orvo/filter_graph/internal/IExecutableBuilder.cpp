#include "orvo/filter_graph/internal/IExecutableBuilder.h"

namespace ORVO::FilterGraph::Internal {

IExecutableBuilder::~IExecutableBuilder() = default;

} // namespace ORVO::FilterGraph::Internal
