#include "orvo/filter_graph/impl/IEmbeddedProcessor.h"

namespace ORVO::FilterGraph {

IEmbeddedProcessor::~IEmbeddedProcessor() = default;

} // namespace ORVO::FilterGraph
