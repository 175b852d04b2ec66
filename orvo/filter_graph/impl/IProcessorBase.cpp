#include "orvo/filter_graph/impl/IProcessorBase.h"

namespace ORVO::FilterGraph {

IProcessorBase::~IProcessorBase() = default;

} // namespace ORVO::FilterGraph
