#pragma once

#include "orvo/filter_graph/internal/IFilterExecutable.h"

namespace ORVO {
class ImageFilter;
} // namespace ORVO

namespace ORVO::FilterGraph::Internal {

class GraphExecutable;
class OutputAdapter;

/// The end of a compiled graph. It has no node of its own: the node that feeds the output adapter, the sink,
/// writes straight into the client's image.
///
/// Threads: as `IFilterExecutable`.
class ORVO_API OutputAdapterExecutable : public IFilterExecutable {
public:
    /// `graphExecutable` and `adapter` must outlive this object.
    OutputAdapterExecutable(GraphExecutable& graphExecutable, OutputAdapter& adapter);

    ~OutputAdapterExecutable() override;

    /// Binds the client's image to the sink, or unbinds what was bound if the image has no pixels, and sets
    /// the sink's pixel extent, its region of interest (world space) and its output precision, which follows
    /// the channel type of the client's image. Throws InternalException "Enforce pSink_ != NULL" before
    /// `bind`, and "Enforce image_ != NULL" without an image.
    void forwardStuff() override;

    /// The sink's domain of definition (world space) goes back to the adapter. Throws InternalException
    /// "Enforce pSink_ != NULL" before `bind`.
    void returnStuff() override;

    DataFlow::InputConnector* getImageFlowInputConnector(std::string const& name) override;
    DataFlow::OutputConnector* getImageFlowOutputConnector() override;
    DataFlow::OutputConnector* cloneImageFlowOutputConnector() override;
    DataFlow::OutputConnector* getClonedImageFlowOutputConnector(std::size_t index) override;

    /// Where the client's image lives. Throws InternalException "Enforce image_ != NULL" without an image.
    TargetPlatform getInputTargetPlatform() override;

    /// `ORVO_TARGET_UNSET`: there is no output.
    TargetPlatform getOutputTargetPlatform() override;

    /// Names the node that feeds the output; not owned.
    virtual void bind(ImageFilter* pSink);

private:
    OutputAdapter* pAdapter_;
    GraphExecutable* pGraphExecutable_;
    ImageFilter* pSink_ = nullptr;
};

} // namespace ORVO::FilterGraph::Internal
