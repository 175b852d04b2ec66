#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/impl/IODataDescriptors.h"

#include <iosfwd>
#include <string>

namespace ORVO::FilterGraph {

/// The identity of a filter type, known to hosts as `IFilter::Identifier`.
///
/// An identifier without a version is a query for any version of a filter; only one with a version may stand
/// on a prototype in the `FilterFactory`.
///
///     Identifier const anyVersion("FastBilateralBlur", "Motion Loft", "Norvane Works");
///     Identifier const exactlyOne("FastBilateralBlur", "Motion Loft", "Norvane Works", 1);
///     anyVersion == exactlyOne;   // true: they match
///
/// Threads: a plain value; any thread, one at a time for each object.
class ORVO_API Identifier {
public:
    /// Empty strings, version 0, any version matches, descriptors not initialised.
    Identifier() = default;

    /// A query for any version.
    Identifier(std::string const& name, std::string const& nameSpace, std::string const& vendor);

    /// A query for any version with the given descriptors.
    Identifier(std::string const& name, std::string const& nameSpace, std::string const& vendor,
               IODataDescriptors const& ioDataDescriptors);

    /// One version, with descriptors that are not initialised.
    Identifier(std::string const& name, std::string const& nameSpace, std::string const& vendor, int version);

    /// One version with the given descriptors.
    Identifier(std::string const& name, std::string const& nameSpace, std::string const& vendor, int version,
               IODataDescriptors const& ioDataDescriptors);

    std::string const& name() const { return name_; }

    std::string const& nameSpace() const { return nameSpace_; }

    std::string const& vendor() const { return vendor_; }

    /// 0 if no version was given; see `ignoresVersion`.
    int version() const { return version_; }

    /// True if no version was given.
    bool ignoresVersion() const { return ignoresVersion_; }

    IODataDescriptors const& ioDataDescriptors() const { return ioDataDescriptors_; }

private:
    std::string name_;
    std::string nameSpace_;
    std::string vendor_;
    int version_ = 0;
    bool ignoresVersion_ = true;
    IODataDescriptors ioDataDescriptors_;
};

/// The matching rule of the factory, which is not an equivalence: name, name space and vendor must be equal;
/// the descriptors only where both sides have initialised ones; the versions unless either side ignores its
/// own.
ORVO_API bool operator==(Identifier const& left, Identifier const& right);
ORVO_API bool operator!=(Identifier const& left, Identifier const& right);

/// Writes name, name space, vendor and version, a line each, and the descriptors if they are initialised.
/// Messages that name a filter type contain this text.
ORVO_API std::ostream& operator<<(std::ostream& stream, Identifier const& identifier);

} // namespace ORVO::FilterGraph
