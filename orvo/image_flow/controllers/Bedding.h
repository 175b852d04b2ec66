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
    explicit Bedding(ImageFlowController& controller);
    /// The same, and gives the controller its OpenGL context; see `ImageFlowController::setContextGPU`.
    Bedding(OGL::Context const& context, ImageFlowController& controller);
    virtual ~Bedding();

    Bedding(Bedding const&) = delete;
    Bedding& operator=(Bedding const&) = delete;

    virtual void process();
    virtual void processAsync();
    /// Times in seconds; see `DataFlow::Controller::wait`.
    virtual bool wait(double timeout, double interval);

    void sleep(double seconds);
    /// `region` in world space, as for the two ROI operations.
    void computeRegions(PositionExtentInWorldSpace const& region);
    void propagateDODs();
    void propagatePixelExtents();
    void propagateROIs(PositionExtentInWorldSpace const& region);
    void setDirtyState();

    /// The context that frames run in; null if there is none.
    OGL::Context const* contextGPU() const;
    void setContextGPU_DEPRECATED_1_0(OGL::Context const& context);

    /// Makes `sink` the node that frames are pulled from.
    void plantMasterTree(ImageFilter& sink);
    ImageFilter* masterTree();
    ImageFilter const* masterTree() const;

private:
    ImageFlowController* pController_;
};

} // namespace ORVO
