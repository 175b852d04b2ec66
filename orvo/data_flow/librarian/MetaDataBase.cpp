#include "orvo/data_flow/librarian/MetaDataBase.h"

namespace ORVO::DataFlow {

MetaDataBase::MetaDataBase(std::string const& name, std::string const& nameSpace, std::string const& vendor)
    : sName_(name), sNameSpace_(nameSpace), sVendor_(vendor) {}

MetaDataBase::MetaDataBase(std::string const& name, std::string const& nameSpace, std::string const& vendor,
                           std::uint32_t version)
    : sName_(name), sNameSpace_(nameSpace), sVendor_(vendor), iVersion_(version), bHasVersion_(true) {}

MetaDataBase::~MetaDataBase() = default;

} // namespace ORVO::DataFlow
