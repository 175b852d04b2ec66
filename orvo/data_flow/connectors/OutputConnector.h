#pragma once

#include "orvo/core/Export.h"
#include "orvo/data_flow/connectors/Connector.h"

namespace ORVO::DataFlow {

class InputConnector;

/// The end of an edge at the producer: holds at most one data object and feeds at most one input. Several
/// consumers are served by several outputs that share an object.
///
/// Threads: connecting and disconnecting by the thread that owns the graph, between frames; the rest by the
/// thread that runs the producer, and then by the one that runs the consumer.
class ORVO_API OutputConnector : public Connector {
public:
    /// An unconnected output named `sName` of `pNode` (not owned, may be null).
    OutputConnector(std::string const& sName, Node* pNode);

    /// A copy has the name, the node and the bound mark of `oOther`; it is not connected and not asked to
    /// keep its data.
    OutputConnector(OutputConnector const& oOther);

    /// Does not disconnect: the partner must have been disconnected before.
    ~OutputConnector() override;

    /// Drops the data object when the graph is flushed; a bound output keeps it.
    virtual void flushOutput() = 0;

    /// The connected input, or null. Not owned.
    InputConnector* connectedInput() const { return pConnectedInput_; }

    /// Clears both ends of the connection; does nothing when unconnected.
    void disconnect();

    /// Asks the output to keep its data object whenever a consumer fetches it (true), or only where
    /// `keepsCache` finds a reason (false, the state at the start).
    void keepCache(bool bKeepCache) { bKeepCache_ = bKeepCache; }

    /// Whether the data object stays here when the consumer fetches it. True if `keepCache(true)` was asked;
    /// otherwise true exactly when this node is clean and the consuming node is dirty: only the consumer must
    /// run again next time. A connector without a node counts as one of a clean node.
    bool keepsCache() const;

protected:
    /// Stores the partner at this end only.
    void connectWith(InputConnector* pInput) { pConnectedInput_ = pInput; }

private:
    friend class InputConnector;
    friend ORVO_API void Connect(InputConnector& in, OutputConnector& out);

    InputConnector* pConnectedInput_ = nullptr;
    bool bKeepCache_ = false;
};

} // namespace ORVO::DataFlow
