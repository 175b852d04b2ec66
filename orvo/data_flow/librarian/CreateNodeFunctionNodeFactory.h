#pragma once

#include "orvo/data_flow/librarian/NodeFactory.h"

namespace ORVO::DataFlow {

/// A factory that calls a function.
///
/// Threads: as the function.
class ORVO_API CreateNodeFunctionNodeFactory : public NodeFactory {
public:
    using CreateFunction = Node* (*)(NodeTargetType);

    /// Throws InternalException "Enforce pCreateFunction != NULL".
    explicit CreateNodeFunctionNodeFactory(CreateFunction pCreateFunction);
    ~CreateNodeFunctionNodeFactory() override;

    /// What the function makes, owned by the caller; null if it answers null.
    Node* create(NodeTargetType eTarget) override;

private:
    CreateFunction pCreateFunction_;
};

} // namespace ORVO::DataFlow
