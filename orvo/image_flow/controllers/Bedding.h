#pragma once

#include "orvo/core/Export.h"

namespace ORVO {

namespace OGL {
class Context;
}

class ImageFilter;
class ImageFlowController;
class PositionExtentInWorldSpace;

/// The facade of an image graph that a compiled graph holds: it forwards each operation of a frame to the
/// controller and calls the sink the master tree. Every forwarder throws `InternalException` "Enforce
/// pController_ != NULL" where there is no controller, and otherwise what the controller throws. The
/// controller stays the caller's and must outlive the bedding.
///
/// Threads: as the controller's operations.
class ORVO_API Bedding {
public:
    /// A facade of `controller`.
    explicit Bedding(ImageFlowController& controller);
    /// The same, and gives the controller its OpenGL context; see `ImageFlowController::setContextGPU`.
    Bedding(OGL::Context const& context, ImageFlowController& controller);
    virtual ~Bedding();

    Bedding(Bedding const&) = delete;
    Bedding& operator=(Bedding const&) = delete;

    /// A synchronous frame.
    virtual void process();
    /// Launches an asynchronous frame.
    virtual void processAsync();
    /// Waits for the frame. Times in seconds; the result and the rest are those of
    /// `DataFlow::Controller::wait`.
    virtual bool wait(double timeout, double interval);

    /// Sleeps the calling thread. Seconds.
    void sleep(double seconds);
    /// Pixel extents, DODs and ROIs; the sink is asked for `region` (world).
    void computeRegions(PositionExtentInWorldSpace const& region);
    /// The domains of definition (world) of all nodes that the sink reaches.
    void propagateDODs();
    /// The pixel extents (world units a pixel) of all nodes that the sink reaches.
    void propagatePixelExtents();
    /// The regions of interest and compute regions; the sink is asked for `region` (world).
    void propagateROIs(PositionExtentInWorldSpace const& region);
    /// The dirty states of all nodes that the sink reaches.
    void setDirtyState();

    /// The context that frames run in; null if there is none.
    OGL::Context const* contextGPU() const;
    void setContextGPU_DEPRECATED_1_0(OGL::Context const& context);

    /// Makes `sink` the node that frames are pulled from; it stays the caller's.
    void plantMasterTree(ImageFilter& sink);
    /// The sink; null if none is set or it is no image node.
    ImageFilter* masterTree();
    ImageFilter const* masterTree() const;

private:
    ImageFlowController* pController_;
};

} // namespace ORVO
