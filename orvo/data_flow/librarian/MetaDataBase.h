#pragma once

#include "orvo/core/Export.h"

#include <cstdint>
#include <string>

namespace ORVO::DataFlow {

/// The public identity of a node type: vendor, namespace, name, and optionally a version.
///
/// Threads: immutable after construction; may be read from any thread.
class ORVO_API MetaDataBase {
public:
    /// Without a version: as a search key it stands for the latest one.
    MetaDataBase(std::string const& name, std::string const& nameSpace, std::string const& vendor);
    /// With a version: as a search key it stands for that one.
    MetaDataBase(std::string const& name, std::string const& nameSpace, std::string const& vendor,
                 std::uint32_t version);
    virtual ~MetaDataBase();

    /// The name of the node type.
    std::string const& name() const { return sName_; }
    /// Reverse-domain style grouping.
    std::string const& nameSpace() const { return sNameSpace_; }
    /// The maker's name.
    std::string const& vendor() const { return sVendor_; }
    /// Whether the record was built with a version, be it 0.
    bool hasVersion() const { return bHasVersion_; }
    /// 0 if there is no version.
    std::uint32_t version() const { return bHasVersion_ ? iVersion_ : 0; }

protected:
    MetaDataBase(MetaDataBase const&) = default;
    MetaDataBase& operator=(MetaDataBase const&) = default;

private:
    std::string sName_;
    std::string sNameSpace_;
    std::string sVendor_;
    std::uint32_t iVersion_ = 0;
    bool bHasVersion_ = false;
};

} // namespace ORVO::DataFlow
