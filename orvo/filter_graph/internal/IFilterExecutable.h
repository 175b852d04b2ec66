#pragma once

#include <cstddef>
#include <string>

#include "orvo/core/Export.h"
#include "orvo/core/TargetPlatform.h"

namespace ORVO::DataFlow {
class InputConnector;
class OutputConnector;
} // namespace ORVO::DataFlow

namespace ORVO::FilterGraph::Internal {

/// What one filter of a compiled graph has become: the object that the graph compiler connects, and that
/// carries values between the filter and the image node behind it.
///
/// Threads: the thread that builds and launches the frames; `returnStuff` also on the thread that ends an
/// asynchronous frame, when no other operation runs.
class ORVO_API IFilterExecutable {
public:
    /// Carries values from the filter to the node. Called before each propagation.
    virtual void forwardStuff() = 0;

    /// Carries results from the node back to the filter. Called after each propagation and after each frame.
    virtual void returnStuff() = 0;

    /// The node's image input of this name; null if there is none, and always null at the end of the graph.
    virtual DataFlow::InputConnector* getImageFlowInputConnector(std::string const& name) = 0;

    /// The node's image output; null at the end of the graph.
    virtual DataFlow::OutputConnector* getImageFlowOutputConnector() = 0;

    /// Makes one more image output, which bears the same image; null at the end of the graph.
    virtual DataFlow::OutputConnector* cloneImageFlowOutputConnector() = 0;

    /// The image output that `cloneImageFlowOutputConnector` made as number `index`; null at the end of the
    /// graph.
    virtual DataFlow::OutputConnector* getClonedImageFlowOutputConnector(std::size_t index) = 0;

    /// Where the images of the inputs have to live.
    virtual TargetPlatform getInputTargetPlatform() = 0;

    /// Where the image of the output lives.
    virtual TargetPlatform getOutputTargetPlatform() = 0;

    /// Whether the inputs want the SIMD-optimised layout. False unless overridden.
    virtual bool hasSIMDInput();

    /// Whether the output is in the SIMD-optimised layout. False unless overridden.
    virtual bool hasSIMDOutput();

    virtual ~IFilterExecutable();

protected:
    IFilterExecutable() = default;
    IFilterExecutable(IFilterExecutable const&) = delete;
    IFilterExecutable& operator=(IFilterExecutable const&) = delete;
};

} // namespace ORVO::FilterGraph::Internal
