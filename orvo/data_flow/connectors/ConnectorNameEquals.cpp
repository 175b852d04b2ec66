#include "orvo/data_flow/connectors/ConnectorNameEquals.h"

#include "orvo/data_flow/connectors/Connector.h"

namespace ORVO::DataFlow {

ConnectorNameEquals::ConnectorNameEquals(std::string const& sName) : sName_(sName) {}

bool ConnectorNameEquals::operator()(Connector const* pConnector) const {
    return pConnector != nullptr && pConnector->name() == sName_;
}

} // namespace ORVO::DataFlow
