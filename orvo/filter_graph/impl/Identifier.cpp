#include "orvo/filter_graph/impl/Identifier.h"

#include <ostream>

namespace ORVO::FilterGraph {

Identifier::Identifier(std::string const& name, std::string const& nameSpace, std::string const& vendor)
    : name_(name), nameSpace_(nameSpace), vendor_(vendor) {}

Identifier::Identifier(std::string const& name, std::string const& nameSpace, std::string const& vendor,
                       IODataDescriptors const& ioDataDescriptors)
    : name_(name), nameSpace_(nameSpace), vendor_(vendor), ioDataDescriptors_(ioDataDescriptors) {}

Identifier::Identifier(std::string const& name, std::string const& nameSpace, std::string const& vendor,
                       int version)
    : name_(name), nameSpace_(nameSpace), vendor_(vendor), version_(version), ignoresVersion_(false) {}

Identifier::Identifier(std::string const& name, std::string const& nameSpace, std::string const& vendor,
                       int version, IODataDescriptors const& ioDataDescriptors)
    : name_(name),
      nameSpace_(nameSpace),
      vendor_(vendor),
      version_(version),
      ignoresVersion_(false),
      ioDataDescriptors_(ioDataDescriptors) {}

bool operator==(Identifier const& left, Identifier const& right) {
    if (left.name() != right.name() || left.nameSpace() != right.nameSpace() ||
        left.vendor() != right.vendor())
        return false;
    bool const compareDescriptors =
        left.ioDataDescriptors().isInitialized() && right.ioDataDescriptors().isInitialized();
    if (compareDescriptors && left.ioDataDescriptors() != right.ioDataDescriptors())
        return false;
    return left.ignoresVersion() || right.ignoresVersion() || left.version() == right.version();
}

bool operator!=(Identifier const& left, Identifier const& right) { return !(left == right); }

std::ostream& operator<<(std::ostream& stream, Identifier const& identifier) {
    stream << "Filter name:" << identifier.name() << "\n"
           << "Filter namespace:" << identifier.nameSpace() << "\n"
           << "Filter vendor:" << identifier.vendor() << "\n"
           << "Filter version:" << identifier.version() << "\n";
    if (identifier.ioDataDescriptors().isInitialized())
        stream << "Filter Data descriptors:\n" << identifier.ioDataDescriptors() << "\n";
    return stream;
}

} // namespace ORVO::FilterGraph
