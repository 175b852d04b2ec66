#include "orvo/data_flow/librarian/NodeMetaDataSorter.h"

#include "orvo/data_flow/librarian/NodeMetaData.h"

namespace ORVO::DataFlow {

bool NodeMetaDataSorter::operator()(NodeMetaData const* pLeft, NodeMetaData const* pRight) const {
    if (int const iOrder = pLeft->vendor().compare(pRight->vendor())) {
        return iOrder < 0;
    }
    if (int const iOrder = pLeft->nameSpace().compare(pRight->nameSpace())) {
        return iOrder < 0;
    }
    if (int const iOrder = pLeft->name().compare(pRight->name())) {
        return iOrder < 0;
    }
    return pLeft->version() < pRight->version();
}

bool NodeMetaDataSorter::operator()(NodeMetaData const& left, NodeMetaData const& right) const {
    return (*this)(&left, &right);
}

} // namespace ORVO::DataFlow
