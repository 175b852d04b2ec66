#pragma once

#include "orvo/core/Export.h"
#include "orvo/data_flow/connectors/Connector.h"

namespace ORVO::DataFlow {

class OutputConnector;

/// The end of an edge at the consumer: takes a data object from its output when its node runs and drops it
/// when the node is done.
///
/// Threads: connecting and disconnecting by the thread that owns the graph, between frames; the rest by the
/// thread that runs the node.
class ORVO_API InputConnector : public Connector {
public:
    /// An unconnected input named `sName` of `pNode` (not owned, may be null).
    InputConnector(std::string const& sName, Node* pNode);

    /// A copy has the name, the node and the bound mark of `oOther`, and is not connected.
    InputConnector(InputConnector const& oOther);

    /// Does not disconnect: the partner must have been disconnected before.
    ~InputConnector() override;

    /// Takes the data object over from the connected output, in the way that both connectors' types say.
    /// Throws `InternalException` "Enforce pConnectedOutput_ != NULL" when unconnected.
    virtual void fetchInput() = 0;

    /// Drops the data object. Throws `InternalException` "!this->bound()" for a bound input that owns an
    /// object.
    virtual void removeData() = 0;

    /// Whether `connect` with this output would succeed: false for null and for an output of another data
    /// type.
    virtual bool canConnect(OutputConnector* pOutput);

    /// Drops the data object when the graph is flushed.
    virtual void flushInput() = 0;

    /// Connects the input to `pOutput`, as the function `Connect` does; false, with nothing changed, if the
    /// data types differ. With null it only forgets its own partner, whose pointer back to this input stays,
    /// and returns true: use `disconnect` to clear both ends.
    bool connect(OutputConnector* pOutput);

    /// Clears both ends of the connection; does nothing when unconnected.
    void disconnect();

    /// The connected output, or null. Not owned.
    OutputConnector* connectedOutput() const { return pConnectedOutput_; }

    /// Whether the connected output holds data. Throws `InternalException` "Enforce pConnectedOutput_ !=
    /// NULL" when unconnected.
    bool dataAvailable() const;

protected:
    /// Stores the partner at this end only.
    void connectWith(OutputConnector* pOutput) { pConnectedOutput_ = pOutput; }

private:
    friend class OutputConnector;
    friend ORVO_API void Connect(InputConnector& in, OutputConnector& out);

    OutputConnector* pConnectedOutput_ = nullptr;
};

} // namespace ORVO::DataFlow
