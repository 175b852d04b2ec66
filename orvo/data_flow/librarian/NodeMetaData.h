#pragma once

#include "orvo/data_flow/librarian/MetaDataBase.h"

#include <iosfwd>

namespace ORVO::DataFlow {

/// What the librarian knows of a node type: its identity, a description, and the short ID by which graph
/// builders ask for it.
///
/// Threads: immutable after construction; may be read from any thread.
class ORVO_API NodeMetaData : public MetaDataBase {
public:
    /// Without a version: as a search key it stands for the latest one.
    NodeMetaData(std::string const& name, std::string const& nameSpace, std::string const& vendor,
                 std::string const& description, std::string const& clientID);
    /// With a version: as a search key it stands for that one.
    NodeMetaData(std::string const& name, std::string const& nameSpace, std::string const& vendor,
                 std::uint32_t version, std::string const& description, std::string const& clientID);
    NodeMetaData(NodeMetaData const&) = default;
    NodeMetaData& operator=(NodeMetaData const&) = default;
    ~NodeMetaData() override;

    /// The short ID by which graph builders ask for the type; the first registered of an ID is found.
    std::string const& clientID() const { return sClientID_; }
    /// Free text for people.
    std::string const& description() const { return sDescription_; }

private:
    std::string sDescription_;
    std::string sClientID_;
};

/// Writes "name(...) namespace(...) vendor(...) version(...) description(...) clientID(...)" on one line,
/// without a line end; the version only if there is one.
ORVO_API std::ostream& operator<<(std::ostream& stream, NodeMetaData const& metaData);

} // namespace ORVO::DataFlow
