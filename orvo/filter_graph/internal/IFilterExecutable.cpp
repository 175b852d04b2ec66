#include "orvo/filter_graph/internal/IFilterExecutable.h"

namespace ORVO::FilterGraph::Internal {

IFilterExecutable::~IFilterExecutable() = default;

bool IFilterExecutable::hasSIMDInput() { return false; }

bool IFilterExecutable::hasSIMDOutput() { return false; }

} // namespace ORVO::FilterGraph::Internal
