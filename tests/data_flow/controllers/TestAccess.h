#pragma once

#include "orvo/data_flow/controllers/Controller.h"
#include "orvo/data_flow/controllers/ControllerImpl.h"
#include "orvo/data_flow/librarian/NodeLibrarian.h"

#include <memory>
#include <utility>

namespace ORVO::DataFlow::internal {

/// Reaches what no client can, for states that cannot arise otherwise.
struct TestAccess {
    static std::unique_ptr<FrameLatch> takeRoot(Controller& controller) {
        return std::move(controller.pImpl_->pRoot_);
    }
    static void giveRoot(Controller& controller, std::unique_ptr<FrameLatch> pRoot) {
        controller.pImpl_->pRoot_ = std::move(pRoot);
    }
    /// Cancels the slices and leaves the status as it is.
    static void cancelGroup(Controller& controller) { controller.pImpl_->oGroup_.cancel_group_execution(); }
    static std::size_t rootCount(Controller& controller) { return controller.pImpl_->root()->count(); }

    static void createLibrarian() { NodeLibrarian::Create(); }
    static void destroyLibrarian() { NodeLibrarian::Destroy(); }

    struct DeleteLibrarian {
        void operator()(NodeLibrarian* pLibrarian) const { delete pLibrarian; }
    };
    /// A librarian that is not the one of the process.
    static std::unique_ptr<NodeLibrarian, DeleteLibrarian> makeLoneLibrarian() {
        return std::unique_ptr<NodeLibrarian, DeleteLibrarian>(new NodeLibrarian);
    }
};

} // namespace ORVO::DataFlow::internal
