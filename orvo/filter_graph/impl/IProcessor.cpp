#include "orvo/filter_graph/impl/IProcessor.h"

namespace ORVO::FilterGraph {

IProcessor::~IProcessor() = default;

} // namespace ORVO::FilterGraph
