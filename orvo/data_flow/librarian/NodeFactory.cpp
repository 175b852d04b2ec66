#include "orvo/data_flow/librarian/NodeFactory.h"

namespace ORVO::DataFlow {

NodeFactory::~NodeFactory() = default;

} // namespace ORVO::DataFlow
