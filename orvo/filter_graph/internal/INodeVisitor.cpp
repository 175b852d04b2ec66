#include "orvo/filter_graph/internal/INodeVisitor.h"

namespace ORVO::FilterGraph::Internal {

INodeVisitor::~INodeVisitor() = default;

void INodeVisitor::preVisit(Filter* /*pFilter*/) {}

void INodeVisitor::postVisit(Filter* /*pFilter*/) {}

} // namespace ORVO::FilterGraph::Internal
