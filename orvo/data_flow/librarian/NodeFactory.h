#pragma once

#include "orvo/core/Export.h"
#include "orvo/data_flow/librarian/NodeTargetType.h"

namespace ORVO::DataFlow {

class Node;

/// Makes instances of one node type.
///
/// Threads: as the deriving class says.
class ORVO_API NodeFactory {
public:
    NodeFactory() = default;
    NodeFactory(NodeFactory const&) = delete;
    NodeFactory& operator=(NodeFactory const&) = delete;
    virtual ~NodeFactory();

    /// A new node, owned by the caller, or null if the type has no form for the target.
    virtual Node* create(NodeTargetType eTarget) = 0;
};

} // namespace ORVO::DataFlow
