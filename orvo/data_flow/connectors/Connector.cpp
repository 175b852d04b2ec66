#include "orvo/data_flow/connectors/Connector.h"

namespace ORVO::DataFlow {

Connector::Connector(std::string const& sName, Node* pNode) : sName_(sName), pNode_(pNode) {}

Connector::Connector(Connector const& oOther)
    : sName_(oOther.sName_), pNode_(oOther.pNode_), bBound_(oOther.bBound_) {}

Connector::~Connector() = default;

void Connector::setBoundData(void const* pData) {
    pData_ = pData;
    bBound_ = true;
}

} // namespace ORVO::DataFlow
