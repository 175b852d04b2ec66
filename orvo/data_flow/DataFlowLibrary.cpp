#include "orvo/data_flow/DataFlowLibrary.h"

#include "orvo/core/Check.h"
#include "orvo/core/CoreLibrary.h"
#include "orvo/data_flow/controllers/FrameThreads.h"
#include "orvo/data_flow/librarian/NodeLibrarian.h"
#include "orvo/data_flow/nodes/Node.h"

#include <atomic>

namespace ORVO::DataFlow {

namespace {
std::atomic<bool> bInitialized_{false};
} // namespace

void Library::initialize() {
    ORVO_CHECK(!bInitialized_);
    ORVO_CHECK(Core::Library::isInitialized());
    Node::initializeNodeMaps();
    try {
        NodeLibrarian::Create();
    } catch (...) {
        Node::terminateNodeMaps();
        throw;
    }
    bInitialized_ = true;
}

void Library::terminate() {
    ORVO_CHECK(bInitialized_);
    ORVO_CHECK(Core::Library::isInitialized());
    ORVO_CHECK(!internal::FrameThreads::isFrameThread());
    // First the frames: they use nodes, and so the maps.
    internal::FrameThreads::instance().join();
    NodeLibrarian::Destroy();
    Node::terminateNodeMaps();
    bInitialized_ = false;
}

bool Library::isInitialized() { return bInitialized_; }

AutoInitializer::AutoInitializer() : bActive_(true) { Library::initialize(); }

AutoInitializer::~AutoInitializer() {
    if (!bActive_) {
        return;
    }
    try {
        Library::terminate();
    } catch (...) {
        // A destructor passes no failure on.
    }
}

} // namespace ORVO::DataFlow
