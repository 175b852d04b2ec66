#pragma once

#include "orvo/core/Export.h"

#include <string>

namespace ORVO::DataFlow {

class Connector;

/// Predicate for searches: is this the connector of that name?
///
/// Threads: any; the object never changes.
class ORVO_API ConnectorNameEquals {
public:
    /// A predicate for `sName`, which is copied.
    explicit ConnectorNameEquals(std::string const& sName);

    /// Whether the connector bears exactly the name, byte for byte; false for null.
    bool operator()(Connector const* pConnector) const;

private:
    std::string sName_;
};

} // namespace ORVO::DataFlow
