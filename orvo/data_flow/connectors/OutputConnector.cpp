#include "orvo/data_flow/connectors/OutputConnector.h"

#include "orvo/data_flow/connectors/InputConnector.h"
#include "orvo/data_flow/nodes/Node.h"

namespace ORVO::DataFlow {

namespace {

bool isDirty(Node const* pNode) { return pNode != nullptr && pNode->isDirty(); }

} // namespace

OutputConnector::OutputConnector(std::string const& sName, Node* pNode) : Connector(sName, pNode) {}

// The partner of the original knows only the original.
OutputConnector::OutputConnector(OutputConnector const& oOther) : Connector(oOther) {}

OutputConnector::~OutputConnector() = default;

void OutputConnector::disconnect() {
    if (pConnectedInput_ != nullptr) {
        pConnectedInput_->connectWith(nullptr);
    }
    connectWith(nullptr);
}

bool OutputConnector::keepsCache() const {
    if (bKeepCache_) {
        return true;
    }
    // The result of a dirty node is stale next time anyway.
    if (isDirty(node()) || pConnectedInput_ == nullptr) {
        return false;
    }
    return isDirty(pConnectedInput_->node());
}

} // namespace ORVO::DataFlow
