#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/impl/OptimizationOptions.h"

#include <cstdint>

namespace ORVO::FilterGraph {

/// What all processors share: the state of the frame that was launched last. See `IProcessor` and
/// `IEmbeddedProcessor`.
///
/// A processor never runs anything on the client's filters: it works on a copy of the graph, which it brings
/// up to date at the start of each frame. So the host may edit the graph freely between frames; the images
/// that a running frame uses must be left alone.
///
/// All operations but `frameStatus` throw an `InternalException` "Enforce spGraphExecutable_ != NULL" before
/// the first frame was prepared. `frameStatus`, `waitForFrame` and `cancelFrame` rethrow, as a
/// `SharedException`, what a worker thread of an asynchronous frame threw: once, when the frame has ended.
///
/// Threads: one at a time for each processor, but `frameStatus` and `cancelFrame` may be called from other
/// threads while a frame runs or is waited for; completion callbacks come from the thread that ends the
/// frame.
class ORVO_API IProcessorBase {
public:
    using OptimizationOptions = FilterGraph::OptimizationOptions;

    enum eFrameStatus : std::int32_t {
        FRAME_RUNNING = 1,   ///< launched, and its end has not been seen
        FRAME_COMPLETE = 2,  ///< the end has been seen
        FRAME_CANCELLED = 3, ///< `cancelFrame` was called, and the end has not been seen
        FRAME_NONE = 4,      ///< nothing was launched yet
    };

    /// Cancels a frame that is running and waits for it.
    virtual ~IProcessorBase();

    /// The state of the frame. It moves only when asked.
    virtual eFrameStatus frameStatus() = 0;

    /// Waits for the frame, at most `timeout` seconds, asking every `interval` seconds; returns the state
    /// then. Calling it inside the completion callback is a deadlock.
    virtual eFrameStatus waitForFrame(double timeout, double interval) = 0;

    /// Asks the frame to stop; it does so at the next node or slice of rows. Returns the state.
    virtual eFrameStatus cancelFrame() = 0;

    /// Lets the calling thread sleep for that many seconds.
    virtual void sleep(double seconds) = 0;

    /// Sets the function that is called at the end of each asynchronous frame, with the frame's handle, on
    /// the thread that ends it; null for none. Its result is ignored. The function is lost when the graph is
    /// compiled anew.
    virtual void setCompletionCallback(bool (*callback)(void*)) = 0;

protected:
    IProcessorBase() = default;
    IProcessorBase(IProcessorBase const&) = delete;
    IProcessorBase& operator=(IProcessorBase const&) = delete;
};

} // namespace ORVO::FilterGraph
