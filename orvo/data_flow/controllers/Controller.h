#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/ThreadID.h"

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <mutex>
#include <vector>

namespace ORVO {
class ExceptionBase;
}

namespace ORVO::DataFlow {

class Node;

namespace internal {
class ControllerImpl;
class ProcessFrameTask;
class processSliceHelper;
struct TestAccess;
} // namespace internal

/// Owns the list of nodes of one graph, knows its sink, and runs frames: at once on the caller's thread, or
/// asynchronously on a frame thread of the library while the caller polls.
///
/// A frame pulls: it starts at the sink and goes towards the sources only where an input has no data. One
/// thread walks the graph; the rows of a node are spread over worker threads when the node calls
/// processSlices().
///
///     Controller controller;
///     controller.addNode(&source);
///     controller.addNode(&sink);
///     controller.setSinkNode(&sink);
///     controller.processAsync();
///     while (!controller.wait(0.1, 0.001)) { showProgress(); }
///     controller.checkException();
///
/// Nodes are not owned: whoever built the graph keeps them alive for as long as the controller may run a
/// frame.
///
/// A class derived from Controller whose overrides may still be running on a frame thread calls
/// cancelAndJoin() first in its own destructor.
///
/// Threads: one thread owns the controller and edits, launches and waits. cancelProcess(), stop(),
/// controllerStatus(), wait(), saveException() and checkException() may be called from any thread at any
/// time. The static settings may be called from any thread.
class ORVO_API Controller {
public:
    /// State of a controller. The values are fixed.
    enum teControllerStatus : std::int32_t {
        CONTROLLER_STOPPED = 0, ///< No frame runs; the graph may be edited.
        CONTROLLER_RUNNING = 1, ///< A frame is running.
        /// The frame was cancelled and has not ended, or wait() has not collected it.
        CONTROLLER_CANCELLED = 2
    };

    using NodeIterator = std::vector<Node*>::const_iterator;

    /// A controller without nodes and without a sink, stopped.
    Controller();
    Controller(Controller const&) = delete;
    Controller& operator=(Controller const&) = delete;

    /// Cancels a frame that still runs, waits for its end, and drops a saved exception. The completion
    /// callback of that frame is still called. Must not run on the frame's own thread (in its completion
    /// callback).
    virtual ~Controller();

    /// Appends a node and tells it its controller. Not owned. False, and nothing changes, unless the status
    /// is 0. Throws InternalException "Enforce pNode != NULL".
    virtual bool addNode(Node* pNode);

    /// Removes the first occurrence of a node, keeping the order of the others; the node keeps its controller
    /// pointer. False unless the status is 0, or if the node is not in the list.
    virtual bool removeNode(Node* pNode);

    /// Clears the list. False unless the status is 0.
    virtual bool removeAllNodes();

    /// The nodes with an output without consumer or an input without producer, each once, in list order.
    virtual std::vector<Node*> findUnconnectedNodes();

    /// Runs one frame on the calling thread and returns at its end. First joins a frame that is still on its
    /// way, unless called on that frame's own thread (from its completion callback), and clears what a
    /// cancelled frame left behind (flushes the graph). An exception that an earlier frame saved, and nobody
    /// asked for, stays saved. Throws InternalException "pSink" without a sink, "producerOutput" and
    /// "producer" for gaps in the graph, and whatever a node throws: SharedException for a failure in a
    /// slice. The status is 0 afterwards in every case.
    virtual void process();

    /// Launches one frame on a frame thread and returns at once; joins an older frame first, as process()
    /// does. An exception that was saved before is dropped. A failure of the frame is saved: see
    /// checkException(). Throws InternalException "Enforce root != NULL" or "Enforce new_task != NULL", and
    /// ResourceException if the system gives no thread; the status is then 0 and no frame is out.
    virtual void processAsync();

    /// Sets the status to 2 and cancels the slices: running slices finish, the others are skipped, and no
    /// further node is run. A frame that has not started goes straight to its completion. Returns at once;
    /// any thread. What stands in the outputs afterwards is partial: wait(), or the next launch, flushes the
    /// graph.
    virtual void cancelProcess();

    /// Calls the completion callback if there is one, then stop(). An exception of the callback is saved and
    /// goes no further. The stop is left out if the callback launched the next asynchronous frame, which it
    /// would end.
    virtual void notifyOfCompletion();

    /// The number of threads that frames may use, as set by setNumberOfThreads().
    virtual std::size_t threadsAvailable();

    /// Sets the status to 0. A running frame then pulls no further node.
    virtual void stop();

    /// Sets the function to be called at the end of each asynchronous frame, also of a failed or cancelled
    /// one, with `pData` as its argument; null for none. It runs on the frame's thread; its result is
    /// ignored. It may launch the next frame, but must not destroy the controller, nor wait for another
    /// thread that waits for the frame. False, and nothing changes, unless the status is 0.
    virtual bool registerProcessingCompletedCallback(bool (*pfnCompleted)(void*), void* pData);

    /// stop(), then, if the status is 0, waits until no thread runs a node any more and flushes every node in
    /// list order: every output that is not bound is emptied. False if the status is not 0.
    virtual bool flushGraph();

    /// Waits for the frame. Times in seconds; `timeout` is compared with the sum of the intervals slept,
    /// not with a clock. With `interval` 0 it spins until the frame ends.
    /// Returns false if the sum exceeded `timeout` while the frame runs on; true once the frame has ended and
    /// been collected. If it was cancelled, the graph has then been flushed and the next frame can run.
    /// Throws InternalException "bGraphFlushed" if an override refuses the flush. Does not report the frame's
    /// failure: see checkException(). In the completion callback the frame counts as ended.
    virtual bool wait(double timeout, double interval);

    /// Sleeps the calling thread. Seconds; zero, negative and NaN only give way to other threads.
    virtual void sleep(double seconds);

    /// Body of the asynchronous frame, run on a frame thread: pulls the sink, saves every exception instead
    /// of throwing it, and calls notifyOfCompletion() in every case.
    virtual void processFrameFunction();

    /// Sets the node to pull from. Not owned; null for none.
    void setSinkNode(Node* pSink) { pSink_ = pSink; }
    /// The same.
    void setSinkNode(Node& sink) { pSink_ = &sink; }
    /// The node to pull from, or null. Not owned.
    Node* getSinkNode() const { return pSink_; }

    /// The nodes in the order of addNode(). Invalidated by addNode(), removeNode() and removeAllNodes().
    NodeIterator nodesBegin() const { return aNodes_.begin(); }
    /// Behind the last node.
    NodeIterator nodesEnd() const { return aNodes_.end(); }

    /// The status; a host that reads 0 also sees everything that the frame wrote. Any thread.
    teControllerStatus controllerStatus() const { return eStatus_.load(std::memory_order_acquire); }

    /// In single thread mode slices run on the frame's thread, all rows in one call, and their exceptions
    /// reach the frame as they are. Off at construction; takes effect for the next processSlices().
    void setSingleThreadMode(bool bSingleThreadMode) { bSingleThreadMode_ = bSingleThreadMode; }

    /// Runs the slices of a node: called by a node from its internalProcess(), on the frame's thread. Returns
    /// when all slices have run, or have been skipped because the frame was cancelled. No slice is run for a
    /// range without items or units. Otherwise an item count of `max(1, minimumGrainSize / unitsPerItem)` is
    /// the grain; a slice may hold as little as half a grain. Throws SharedException for a failure in a slice
    /// (the later one if there were several), and InternalException "Enforce pNode != NULL".
    void processSlices(Node* pNode);

    /// Saves an exception for checkException(), in place of an earlier one, and sets the status to 0 if it is
    /// not null. Takes ownership, also when it throws. Any thread.
    void saveException(ExceptionBase* pException);

    /// Throws the saved exception, wrapped in a SharedException, and forgets it. One that is a
    /// SharedException already is thrown as it is. Does nothing if there is none. Any thread.
    void checkException();

    /// The number of threads that may work on one frame at a time, the frame's own included, from the next
    /// processSlices() of any controller on. A number above what the scheduler offers (by default the
    /// processors of the machine) gives all that it offers; 0 is stored and counts as 1. Until it is called
    /// there is no bound, and the number is one more than the processors of the machine. Always true.
    static bool setNumberOfThreads(std::size_t nThreads);
    /// The number that was set, also where the scheduler offers less.
    static std::size_t getNumberOfThreads();

    /// The least number of work units (pixels) in a slice. Initially 1. Takes effect for the next
    /// processSlices(). Always true.
    static bool setMinimumGrainSize(std::size_t nUnits);
    /// The number that was set.
    static std::size_t getMinimumGrainSize();

protected:
    /// Pulls one node: first the producers of its empty inputs, depth first in input order, then the node
    /// itself. Works on a stack of its own, so the length of a chain is not limited by the thread's stack.
    /// Throws InternalException "producerOutput", "producer", or "Graph contains a cycle".
    void processRecursive(Node* pNode);

    /// Body of the asynchronous frame without its completion: pulls the sink and saves every exception
    /// instead of throwing it. True if there was none. For overrides of processFrameFunction() that undo
    /// something before they call notifyOfCompletion().
    bool pullFrame();

    /// If the frame was cancelled: flushGraph(), then makes the controller ready for the next frame.
    /// Throws InternalException "bGraphFlushed".
    void resetIfCancelled();

    /// Serialises the set-up of threads across controllers; there is nothing to set up. Always true.
    bool initializeScheduler(std::size_t nThreads);
    /// Does nothing: nothing was set up.
    void terminateScheduler();

    /// Cancels a frame that still runs and waits for its end; does nothing if none is out. For the
    /// destructors of derived classes, whose overrides a running frame may be using. Never throws.
    void cancelAndJoin() noexcept;

    /// Waits for a frame that is still on its way, unless called on its own thread, and clears what a
    /// cancelled one left behind. For derived classes that prepare the nodes for a frame before process() or
    /// processAsync(). Throws InternalException "bGraphFlushed".
    void joinFrame();

private:
    friend class internal::ProcessFrameTask;
    friend class internal::processSliceHelper;
    friend struct internal::TestAccess;
    struct Pull;

    void setStatus(teControllerStatus eStatus) { eStatus_.store(eStatus, std::memory_order_release); }
    void launchFrame();
    void failSlice() noexcept;
    void saveCurrentException() noexcept;
    void saveShared(std::shared_ptr<ExceptionBase> spException) noexcept;
    Node* nextProducer(Pull& pull) const;
    static void processNode(Node& node);
    static void checkForCycle(std::vector<Pull> const& aPulls);

    std::vector<Node*> aNodes_;
    Node* pSink_ = nullptr;
    bool (*pfnCompleted_)(void*) = nullptr;
    void* pCompletedData_ = nullptr;
    // Written by the frame's thread, by cancelling threads and by the owner. Stores are releases and loads
    // acquires: a host that polls the end of a frame goes on to read what the frame wrote, without taking a
    // lock.
    std::atomic<teControllerStatus> eStatus_{CONTROLLER_STOPPED};
    std::unique_ptr<internal::ControllerImpl> pImpl_;
    std::mutex oExceptionLock_;
    std::shared_ptr<ExceptionBase> spException_;
    bool bSingleThreadMode_ = false;
    ThreadID oOwnerThread_;
};

} // namespace ORVO::DataFlow
