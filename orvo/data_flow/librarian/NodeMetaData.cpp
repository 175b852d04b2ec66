#include "orvo/data_flow/librarian/NodeMetaData.h"

#include <ostream>

namespace ORVO::DataFlow {

NodeMetaData::NodeMetaData(std::string const& name, std::string const& nameSpace, std::string const& vendor,
                           std::string const& description, std::string const& clientID)
    : MetaDataBase(name, nameSpace, vendor), sDescription_(description), sClientID_(clientID) {}

NodeMetaData::NodeMetaData(std::string const& name, std::string const& nameSpace, std::string const& vendor,
                           std::uint32_t version, std::string const& description, std::string const& clientID)
    : MetaDataBase(name, nameSpace, vendor, version), sDescription_(description), sClientID_(clientID) {}

NodeMetaData::~NodeMetaData() = default;

std::ostream& operator<<(std::ostream& stream, NodeMetaData const& metaData) {
    stream << "name(" << metaData.name() << ") ";
    stream << "namespace(" << metaData.nameSpace() << ") ";
    stream << "vendor(" << metaData.vendor() << ") ";
    if (metaData.hasVersion()) {
        stream << "version(" << metaData.version() << ") ";
    }
    stream << "description(" << metaData.description() << ") ";
    return stream << "clientID(" << metaData.clientID() << ")";
}

} // namespace ORVO::DataFlow
