#include "orvo/data_flow/librarian/CreateNodeFunctionNodeFactory.h"

#include "orvo/core/Check.h"

namespace ORVO::DataFlow {

CreateNodeFunctionNodeFactory::CreateNodeFunctionNodeFactory(CreateFunction pCreateFunction)
    : pCreateFunction_(pCreateFunction) {
    ORVO_ENFORCE(pCreateFunction);
}

CreateNodeFunctionNodeFactory::~CreateNodeFunctionNodeFactory() = default;

Node* CreateNodeFunctionNodeFactory::create(NodeTargetType eTarget) { return pCreateFunction_(eTarget); }

} // namespace ORVO::DataFlow
