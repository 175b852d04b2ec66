#pragma once

#include "orvo/filter_graph/internal/IFilterExecutable.h"
#include "orvo/filter_graph/internal/ParameterForwarder.h"

namespace ORVO {
class ImageFilter;
} // namespace ORVO

namespace ORVO::FilterGraph::Internal {

class Filter;
class GraphExecutable;

/// Takes an image node out of its graph and frees it: connectors do not disconnect themselves, and a partner
/// must not keep a pointer into a node that is gone.
struct ORVO_API ImageNodeDeleter {
    void operator()(ImageFilter* pNode) const noexcept;
};

/// The executable of a filter that is one image node. It owns the node.
///
/// Threads: as `IFilterExecutable`.
class ORVO_API ImageFlowFilterExecutable : public IFilterExecutable {
public:
    /// Adds `pImageFlowFilter` to the controller of `graphExecutable`, and pairs each parameter of the node
    /// with the parameter of the same name on `filter`, where there is one. Takes ownership of the node, but
    /// not if it throws. A null node is allowed: `setImageFlowFilter` then does the same later.
    /// `graphExecutable` and `filter` must outlive this object.
    ImageFlowFilterExecutable(GraphExecutable& graphExecutable, Filter& filter,
                              ImageFilter* pImageFlowFilter);

    /// Frees the node.
    ~ImageFlowFilterExecutable() override;

    /// Parameter values go to the node. A generator (a node without image inputs that is no source of client
    /// images) is also given the pixel extent of the graph's output.
    void forwardStuff() override;

    /// Nothing.
    void returnStuff() override;

    DataFlow::InputConnector* getImageFlowInputConnector(std::string const& name) override;
    DataFlow::OutputConnector* getImageFlowOutputConnector() override;
    DataFlow::OutputConnector* cloneImageFlowOutputConnector() override;
    DataFlow::OutputConnector* getClonedImageFlowOutputConnector(std::size_t index) override;
    TargetPlatform getInputTargetPlatform() override;
    TargetPlatform getOutputTargetPlatform() override;
    bool hasSIMDInput() override;
    bool hasSIMDOutput() override;

    /// The node; null until there is one. It stays owned here.
    ImageFilter* getImageFlowFilter() const { return pImageFlowFilter_; }

    /// The filter that this executable stands for; not owned.
    Filter* getFilterGraphFilter() const { return pFilterGraphFilter_; }

    /// Adds the node to the controller and pairs the parameters, as the constructor does. A node that was set
    /// before is freed. Takes ownership, but not if it throws; null throws InternalException "Enforce
    /// pImageFlowFilter != NULL".
    void setImageFlowFilter(ImageFilter* pImageFlowFilter);

private:
    void adopt(ImageFilter* pImageFlowFilter);

    ImageFilter* pImageFlowFilter_ = nullptr;
    Filter* pFilterGraphFilter_;
    GraphExecutable* pGraphExecutable_;
    ParameterForwarder forwarder_;
    bool bGenerator_ =
        false; // whether the node takes the pixel extent of the graph's output; settled with the node
};

} // namespace ORVO::FilterGraph::Internal
