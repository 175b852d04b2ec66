#include "orvo/data_flow/connectors/InputConnector.h"

#include "orvo/data_flow/connectors/Connect.h"
#include "orvo/data_flow/connectors/OutputConnector.h"

#include "orvo/core/Check.h"

namespace ORVO::DataFlow {

InputConnector::InputConnector(std::string const& sName, Node* pNode) : Connector(sName, pNode) {}

// The partner of the original knows only the original.
InputConnector::InputConnector(InputConnector const& oOther) : Connector(oOther) {}

InputConnector::~InputConnector() = default;

bool InputConnector::canConnect(OutputConnector* pOutput) {
    return pOutput != nullptr && ConnectorsAreCompatible(*pOutput, *this);
}

bool InputConnector::connect(OutputConnector* pOutput) {
    if (pOutput == nullptr) {
        connectWith(nullptr);
        return true;
    }
    try {
        Connect(*this, *pOutput);
    } catch (...) {
        return false;
    }
    return true;
}

void InputConnector::disconnect() {
    if (pConnectedOutput_ != nullptr) {
        pConnectedOutput_->connectWith(nullptr);
    }
    connectWith(nullptr);
}

bool InputConnector::dataAvailable() const {
    ORVO_ENFORCE(pConnectedOutput_);
    return pConnectedOutput_->hasData();
}

} // namespace ORVO::DataFlow
