#pragma once

#include <string>

#include "orvo/filter_graph/internal/ImageFlowFilterWrapperBase.h"

namespace ORVO::FilterGraph::Internal {

/// A filter backed by a node type that the node librarian knows.
///
/// Threads: the thread that owns the graph.
class ORVO_API ImageFlowFilterWrapper : public ImageFlowFilterWrapperBase {
public:
    /// Looks for the first node type whose name, nameSpace, vendor and version are those of `identifier`, and
    /// adds its client ID as the metadata items "mlMatchname" and "clientID". With no such node type the
    /// wrapper stands without metadata, and fails only when a node is asked for. Throws InternalException
    /// "Enforce librarian != NULL" or "Enforce node != NULL" if there is no librarian or an empty entry in
    /// it.
    explicit ImageFlowFilterWrapper(IFilter::Identifier const& identifier);

    ~ImageFlowFilterWrapper() override;

    /// An unconnected copy without nodes.
    std::shared_ptr<Filter> clone() override;

    /// True for the last target that a node was asked for: after initialisation the first target that has
    /// one.
    bool canBuildFilterExecutable(TargetPlatform target) const override;

protected:
    ImageFlowFilterWrapper(ImageFlowFilterWrapper const& other);

private:
    /// Throws InternalException "Target must be CPU or GPU" for a target other than the two.
    ImageFilter* createFilter(TargetPlatform target) override;

    std::string clientID_;
    TargetPlatform lastTarget_ = ORVO_TARGET_UNSET;
};

} // namespace ORVO::FilterGraph::Internal
