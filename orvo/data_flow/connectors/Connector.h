#pragma once

#include "orvo/core/Export.h"

#include <string>
#include <typeinfo>

namespace ORVO::DataFlow {

class Node;

/// One named end of an edge of the graph: what inputs and outputs have in common.
///
/// A connector knows its node (not owned, may be null) and the address of the data object that it holds now.
/// The typed connectors (`InputTemplate`, `OutputTemplate`) own that object through a `ConstDataPointer` and
/// keep the address here in step with it; a class that writes one must write the other.
///
/// Threads: not locked. Inputs are touched by the thread that holds the lock of their node; an output is
/// touched by the thread of its consumer only after its producer finished.
class ORVO_API Connector {
public:
    /// A connector named `sName` of the node `pNode`, which is not owned and may be null. It holds no data
    /// and is not bound.
    Connector(std::string const& sName, Node* pNode);

    /// Copies name, node and whether the connector is bound; the copy holds no data.
    Connector(Connector const& oOther);
    Connector& operator=(Connector const&) = delete;

    /// Disconnects nothing and frees no data object: disconnect the node first.
    virtual ~Connector();

    /// The type of the data objects that pass through this connector. Two connectors fit when the names of
    /// their types are equal as strings.
    virtual std::type_info const& datatype() const = 0;

    /// Makes the connector refer to the client's object `pData`, whose type is exactly the connector's, and
    /// marks the connector as bound for the rest of its life. The object is not owned and must outlive the
    /// connector's use.
    virtual void setBoundData(void const* pData);

    /// The name, unique among the inputs or the outputs of a node only by convention.
    std::string const& name() const { return sName_; }

    /// The node that the connector belongs to, or null. Not owned.
    Node* node() const { return pNode_; }

    /// The data object held now, or null. Not owned by the caller.
    void const* data() const { return pData_; }

    /// Whether a data object is held.
    bool hasData() const { return pData_ != nullptr; }

    /// Whether `setBoundData` was ever called.
    bool bound() const { return bBound_; }

    /// Writes the address of the data object and nothing else: for classes that keep the object themselves.
    void setDataPtr(void const* pData) { pData_ = pData; }

private:
    std::string sName_;
    Node* pNode_;
    void const* pData_ = nullptr;
    bool bBound_ = false;
};

} // namespace ORVO::DataFlow
