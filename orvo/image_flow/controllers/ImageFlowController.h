#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/spaces/PositionExtentInWorldSpace.h"
#include "orvo/data_flow/controllers/Controller.h"

#include <vector>

namespace ORVO {

namespace OGL {
class Context;
class Framebuffer;
} // namespace OGL

class ImageFilter;
class Visitor;

/// The controller of image graphs: to the pull of `DataFlow::Controller` it adds the walks over the image
/// nodes and the passes that fix the geometry, the dirty state and the formats of a frame. One frame takes
/// these steps: `propagatePixelExtents` and `propagateDODs` (sources to sink), `propagateROIs` (sink to
/// sources, then each node's compute region), `setNodeImageDescriptorInfo(true)` where the sink's output is
/// bound, `setDirtyState`, then `process` or `processAsync`.
///
/// Graphs with nodes of the GPU run in an OpenGL context, which `setContextGPU` names: it is current on the
/// thread of a frame for the length of the frame, with texture unit 0 active and its 2D texturing enabled.
/// Afterwards what was current before is current again, and in the frame's context texture units, matrices,
/// viewport, program and framebuffer bindings are as they were. Without a context a frame makes no OpenGL
/// call.
///
/// All walks keep their stack on the heap and are linear in nodes and connections, so graphs may be of any
/// depth. Failures are `InternalException`s with the stated texts.
///
/// Nodes and visitors stay their owners'; nodes must outlive the frames.
///
/// Threads: as `DataFlow::Controller`; walks, passes and `process` by the thread that owns the controller,
/// between frames, and one at a time. While an asynchronous frame runs, its context is current on the frame's
/// thread and must be on no other; it is released before the completion callback.
class ORVO_API ImageFlowController : public DataFlow::Controller {
public:
    /// A controller without nodes and without a sink.
    ImageFlowController();
    /// Cancels a frame that still runs and waits for its end.
    ~ImageFlowController() override;

    /// `setNodeImageDescriptorInfo(false)`, then a synchronous frame. Throws `OGL::ExceptionOGL` "Processing
    /// failure due to OpenGL error" (with the code 0) for an OpenGL error that is pending before the frame,
    /// which then is not run, or after it. Whatever is thrown, no error is pending afterwards.
    void process() override;
    /// `setNodeImageDescriptorInfo(false)`, then an asynchronous frame. Throws what these throw.
    void processAsync() override;
    /// As the base's. If that collected the frame, throws `OGL::ExceptionOGL` "Processing failure due to
    /// OpenGL error" (with the code 0) for an OpenGL error that the frame left behind, which is pending no
    /// longer then.
    bool wait(double timeout, double interval) override;
    /// As the base's; what is current on the thread stays so.
    void sleep(double seconds) override;
    /// The base's in the context. A context that cannot be made current is the frame's failure.
    void processFrameFunction() override;

    /// \name The OpenGL context
    /// @{

    /// Names the context that frames run in, which stays the caller's and must outlive the controller, and
    /// makes a framebuffer in it in place of the former one. What is current stays so. Between frames. Throws
    /// `OGL::ExceptionOGL` where the context cannot be made current or gives no framebuffer; the controller
    /// is as it was then.
    void setContextGPU(OGL::Context const& context);
    /// The context; null before `setContextGPU`.
    OGL::Context const* contextGPU() const;
    /// The framebuffer that the nodes of the GPU share, which stays the controller's; null before
    /// `setContextGPU`. A node binds it, attaches its image, and takes both back at its end.
    OGL::Framebuffer* framebuffer();
    OGL::Framebuffer const* framebuffer() const;
    /// @}

    /// Makes `sink` the node that walks and frames start from; it stays the caller's.
    void setImageSink(ImageFilter& sink);
    /// The sink; null if none is set or it is no image node.
    ImageFilter* imageSink();
    ImageFilter const* imageSink() const;

    /// \name Passes of a frame
    /// Each throws "Enforce imageSink() != NULL" without a sink, and "Enforce pOutput != NULL" or
    /// "Enforce pSource != NULL" where an image input of a reached node is unconnected.
    /// @{
    /// Computes the pixel extents (world units a pixel) of every node that the sink reaches.
    void propagatePixelExtents();
    /// Computes the DOD (world) of every node that the sink reaches.
    void propagateDODs();
    /// Asks the sink for `region` (world) and sets the ROI of every node that it reaches, then the compute
    /// region of every image node of the graph: DOD intersected with ROI. Regions left by a failed pass are
    /// forgotten first. Throws "Output region can't be infinite." at the first node whose compute region is
    /// infinite: that node has its new region by then, the nodes after it in the list keep their old one. An
    /// undefined or empty region is not refused. Throws "aParentROIs_.size() ==
    /// totalNumberOfAllImageOutputs()" where an output of a reached node has no consumer that is reached.
    /// After any failure ROIs are left as far as they came; the next pass sets them anew.
    void propagateROIs(PositionExtentInWorldSpace const& region);
    /// Pixel extents, DODs and ROIs, in this order.
    void computeRegions(PositionExtentInWorldSpace const& region);
    /// Updates the dirty state of every node that the sink reaches, producers first.
    void setDirtyState();
    /// @}

    /// \name Walks
    /// Nodes that the sink does not reach are not visited; a cycle ends at the first node met again. Each
    /// throws "Enforce imageSink() != NULL", "Enforce pOutput != NULL", "Enforce pSource != NULL" as the
    /// passes do, and what the visitor throws. The visitor is forgotten at the end of a walk, also of a
    /// failed one; a walk that a visitor begins on the same controller ends its own: "Enforce pVisitor_ !=
    /// NULL".
    /// @{

    /// Pre-visit on entering a node, then its producers in input order, then post-visit. Afterwards the
    /// colour of every reached node is 1.
    void depthFirstSearch(Visitor& visitor);
    /// Sink first, then level by level; each node gets its pre-visit, queues its producers and gets its
    /// post-visit. Afterwards the colour of every reached node is 2.
    void breadthFirstSearch(Visitor& visitor);
    /// @}

    /// True: every node, producers before consumers, takes its precision from the image on the sink's output.
    /// False: unless the sink's output holds an image (the formats were fixed from it), every node takes its
    /// format from its first input's image.
    ///
    /// Throws "Enforce pSink != NULL" without a sink and "iff!=0" where a node is no image node. With true
    /// also "(pSink->imageOutput()->hasData()) == true" where the sink's output holds no image, "Not
    /// implemented: ImageCPU Pixel format not supported" for BGR8, BGRA8, half and undefined formats of that
    /// image, "Not implemented: ImageGPU Pixel format not supported" for the undefined one, "Enforce pOutput
    /// != NULL" and "Enforce pSource != NULL" as the passes do, no node having changed by then, and what
    /// `ImageFilter::computeImageDescriptorInfo` throws.
    void setNodeImageDescriptorInfo(bool fromSink);

protected:
    /// If there is a context: makes it current, with texture unit 0 active and its 2D texturing enabled.
    /// Throws `OGL::ExceptionOGL`.
    void prepareOGLForProcess();
    /// The depth-first walk from one node, with the visitor and the colours as they stand, for visitors that
    /// walk on by themselves. Throws "Enforce pVisitor_ != NULL" outside a walk.
    void depthFirstVisit(DataFlow::Node* node);

private:
    void determineComputeRegions();
    void setPrecisionFrom(ImageFilter const& sink);
    void clearColors();
    std::vector<ImageFilter*> filtersProducersFirst();

    Visitor* pVisitor_;
    OGL::Context const* pContextGPU_;
    OGL::Framebuffer* pFramebuffer_;
};

} // namespace ORVO
