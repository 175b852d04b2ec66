#pragma once

#include <tbb/blocked_range.h>

#include <cstddef>

namespace ORVO::DataFlow {

class Controller;
class Node;

namespace internal {

/// The body that the scheduler runs for each slice of a node. A failure of the node cancels the frame and is
/// saved in the controller; nothing passes the boundary of a worker thread.
///
/// Threads: any, several at a time.
class processSliceHelper {
public:
    /// Neither is owned; both outlive the call of the scheduler.
    processSliceHelper(Controller& controller, Node& node) : pController_(&controller), pNode_(&node) {}

    void operator()(tbb::blocked_range<std::size_t> const& range) const noexcept;

private:
    Controller* pController_;
    Node* pNode_;
};

} // namespace internal
} // namespace ORVO::DataFlow
