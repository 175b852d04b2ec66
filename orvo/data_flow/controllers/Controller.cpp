#include "orvo/data_flow/controllers/Controller.h"

#include "orvo/core/Check.h"
#include "orvo/core/exceptions/CPURuntimeException.h"
#include "orvo/core/exceptions/ResourceException.h"
#include "orvo/core/exceptions/SharedException.h"
#include "orvo/core/utility/SaturatingCast.h"
#include "orvo/core/utility/SharedPtr.h"
#include "orvo/data_flow/connectors/InputConnector.h"
#include "orvo/data_flow/connectors/OutputConnector.h"
#include "orvo/data_flow/controllers/ControllerImpl.h"
#include "orvo/data_flow/controllers/FrameThreads.h"
#include "orvo/data_flow/controllers/ProcessFrameTask.h"
#include "orvo/data_flow/controllers/processSliceHelper.h"
#include "orvo/data_flow/nodes/Node.h"

#include <tbb/info.h>

#include <algorithm>
#include <chrono>
#include <functional>
#include <limits>
#include <system_error>
#include <thread>
#include <utility>

namespace ORVO::DataFlow {

namespace {

/// What the static setters of Controller set.
struct Settings {
    std::atomic<std::uint64_t> nThreads{static_cast<std::uint64_t>(tbb::info::default_concurrency()) + 1};
    std::atomic<bool> bThreadsSet{false};
    std::atomic<std::uint64_t> nMinimumGrain{1};
};

Settings& settings() {
    static Settings oSettings;
    return oSettings;
}

/// Counts a synchronous frame, and marks its thread, for the time of a scope.
class FrameScope {
public:
    explicit FrameScope(internal::FrameLatch& root) : root_(root), mark_(root) { root_.add(); }
    FrameScope(FrameScope const&) = delete;
    FrameScope& operator=(FrameScope const&) = delete;
    ~FrameScope() { root_.release(); }

private:
    internal::FrameLatch& root_;
    internal::FrameLatch::ThreadMark mark_;
};

} // namespace

Controller::Controller() : pImpl_(std::make_unique<internal::ControllerImpl>(getNumberOfThreads())) {}

Controller::~Controller() { cancelAndJoin(); }

// Editing the graph

bool Controller::addNode(Node* pNode) {
    if (controllerStatus() != CONTROLLER_STOPPED) {
        return false;
    }
    ORVO_ENFORCE(pNode);
    aNodes_.push_back(pNode);
    try {
        pNode->setController(*this);
    } catch (...) {
        aNodes_.pop_back();
        throw;
    }
    return true;
}

bool Controller::removeNode(Node* pNode) {
    if (controllerStatus() != CONTROLLER_STOPPED) {
        return false;
    }
    auto const iter = std::find(aNodes_.begin(), aNodes_.end(), pNode);
    if (iter == aNodes_.end()) {
        return false;
    }
    aNodes_.erase(iter);
    return true;
}

bool Controller::removeAllNodes() {
    if (controllerStatus() != CONTROLLER_STOPPED) {
        return false;
    }
    aNodes_.clear();
    return true;
}

std::vector<Node*> Controller::findUnconnectedNodes() {
    auto const isUnconnected = [](Node const& node) {
        for (OutputConnector const* pOutput : node.aOutputs_) {
            if (pOutput->connectedInput() == nullptr) {
                return true;
            }
        }
        for (InputConnector const* pInput : node.aInputs_) {
            if (pInput->connectedOutput() == nullptr) {
                return true;
            }
        }
        return false;
    };
    std::vector<Node*> aUnconnected;
    for (Node* pNode : aNodes_) {
        if (pNode != nullptr && isUnconnected(*pNode)) {
            aUnconnected.push_back(pNode);
        }
    }
    return aUnconnected;
}

bool Controller::registerProcessingCompletedCallback(bool (*pfnCompleted)(void*), void* pData) {
    if (controllerStatus() != CONTROLLER_STOPPED) {
        return false;
    }
    pfnCompleted_ = pfnCompleted;
    pCompletedData_ = pData;
    return true;
}

bool Controller::flushGraph() {
    stop();
    if (controllerStatus() != CONTROLLER_STOPPED) {
        return false;
    }
    // A frame that was stopped just now may still be inside a node.
    if (internal::FrameLatch* const pRoot = pImpl_->root()) {
        pRoot->wait();
    }
    for (Node* pNode : aNodes_) {
        pNode->flush();
    }
    return true;
}

// Frames

void Controller::joinFrame() {
    // The last stop() of a frame comes after its completion callback. A host that launches as soon as it has
    // seen the completion would have its new frame ended by the old one's tail.
    if (internal::FrameLatch* const pRoot = pImpl_->root()) {
        pRoot->wait();
    }
    // A frame that was cancelled, and not waited for, left partial results and a cancelled group, in which no
    // slice would run.
    resetIfCancelled();
}

void Controller::process() {
    internal::FrameLatch* const root = pImpl_->root();
    ORVO_ENFORCE(root);
    joinFrame();
    FrameScope const scope(*root);
    setStatus(CONTROLLER_RUNNING);
    try {
        ORVO_CHECK(pSink_ != nullptr, "pSink");
        processRecursive(pSink_);
        stop();
    } catch (...) {
        stop();
        throw;
    }
}

void Controller::processAsync() {
    internal::FrameLatch* const root = pImpl_->root();
    ORVO_ENFORCE(root);
    joinFrame();
    {
        std::shared_ptr<ExceptionBase> spDropped;
        std::lock_guard const lock(oExceptionLock_);
        spDropped.swap(spException_);
    }
    pImpl_->oLaunchedCompletion_ = {pfnCompleted_, pCompletedData_};
    setStatus(CONTROLLER_RUNNING);
    root->add();
    try {
        launchFrame();
    } catch (...) {
        setStatus(CONTROLLER_STOPPED);
        root->release();
        throw;
    }
}

void Controller::launchFrame() {
    using internal::ProcessFrameTask;
    std::uint64_t const iLaunch = pImpl_->nLaunches_.fetch_add(1, std::memory_order_acq_rel) + 1;
    std::unique_ptr<ProcessFrameTask, ORVODeleter<ProcessFrameTask>> new_task(
        ProcessFrameTask::create(*this, iLaunch));
    ORVO_ENFORCE(new_task.get(), "new_task");
    try {
        internal::FrameThreads::instance().run([pTask = new_task.get()] { ProcessFrameTask::run(pTask); });
    } catch (std::system_error const&) {
        throw ResourceException(__FILE__, __LINE__, "No thread could be started for the frame.");
    }
    new_task.release(); // the frame's thread frees it, and may have done so already
}

void Controller::processFrameFunction() {
    pullFrame();
    notifyOfCompletion();
}

bool Controller::pullFrame() {
    // A cancel that came after the launch stays: the frame then pulls nothing.
    teControllerStatus eStopped = CONTROLLER_STOPPED;
    eStatus_.compare_exchange_strong(eStopped, CONTROLLER_RUNNING, std::memory_order_acq_rel);
    try {
        ORVO_CHECK(pSink_ != nullptr, "pSink");
        if (controllerStatus() == CONTROLLER_RUNNING) {
            processRecursive(pSink_);
        }
        stop();
        return true;
    } catch (...) {
        saveCurrentException();
        return false;
    }
}

void Controller::notifyOfCompletion() {
    std::uint64_t const iLaunch = pImpl_->nLaunches_.load(std::memory_order_acquire);
    pImpl_->iNotified_.store(iLaunch, std::memory_order_release);

    internal::FrameLatch const* const pRoot = pImpl_->root();
    bool const bOfFrame = pRoot != nullptr && pRoot->isOnFrameThread();
    auto const completion = bOfFrame ? pImpl_->oLaunchedCompletion_
                                     : internal::ControllerImpl::Completion{pfnCompleted_, pCompletedData_};
    if (completion.pfnCompleted != nullptr) {
        try {
            completion.pfnCompleted(completion.pData);
        } catch (...) {
            saveCurrentException();
        }
    }
    if (pImpl_->nLaunches_.load(std::memory_order_acquire) == iLaunch) {
        stop();
    }
}

void Controller::cancelProcess() {
    setStatus(CONTROLLER_CANCELLED);
    pImpl_->cancelProcess();
}

void Controller::stop() { setStatus(CONTROLLER_STOPPED); }

bool Controller::wait(double timeout, double interval) {
    double elapsed = 0.0;
    while (controllerStatus() == CONTROLLER_RUNNING) {
        if (pImpl_->isCancelled()) {
            break;
        }
        if (elapsed > timeout) {
            return false;
        }
        sleep(interval);
        elapsed += interval;
    }
    if (internal::FrameLatch* const pRoot = pImpl_->root()) {
        pRoot->wait();
    }
    resetIfCancelled();
    return true;
}

void Controller::sleep(double seconds) {
    std::chrono::nanoseconds const ticks(saturatingCast<std::int64_t>(seconds * 1e9));
    if (ticks.count() <= 0) {
        std::this_thread::yield();
    } else {
        std::this_thread::sleep_for(ticks);
    }
}

void Controller::resetIfCancelled() {
    if (!pImpl_->isCancelled()) {
        return;
    }
    bool const bGraphFlushed = flushGraph();
    ORVO_CHECK(bGraphFlushed);
    pImpl_->resetIfCancelled();
}

void Controller::cancelAndJoin() noexcept {
    internal::FrameLatch* const pRoot = pImpl_->root();
    if (pRoot == nullptr || pRoot->count() == 1) {
        return;
    }
    setStatus(CONTROLLER_CANCELLED);
    pImpl_->cancelProcess();
    pRoot->wait();
}

// The pull

/// A node whose producers are being pulled.
struct Controller::Pull {
    Node* pNode;
    std::size_t iInput; // the next input to look at
    bool bWasReady;
};

void Controller::processRecursive(Node* pNode) {
    ORVO_ENFORCE(pNode);
    constexpr std::size_t nUsualDepth = 64;
    constexpr std::size_t nSuspiciousDepth = 1024;

    std::vector<Pull> aPulls;
    aPulls.reserve(nUsualDepth);
    std::size_t nCheckedDepth = nSuspiciousDepth;
    auto const enter = [&](Node& node) {
        if (node.isProcessing()) {
            // Another thread runs it: wait until it has finished.
            std::lock_guard const lock(node.oProcessLock_);
            return;
        }
        aPulls.push_back({&node, 0, node.isReady()});
        if (aPulls.size() == nCheckedDepth) {
            checkForCycle(aPulls);
            nCheckedDepth *= 2;
        }
    };

    enter(*pNode);
    while (!aPulls.empty()) {
        Pull& pull = aPulls.back();
        if (!pull.bWasReady) {
            if (Node* const pProducer = nextProducer(pull)) {
                enter(*pProducer);
                continue;
            }
            // A frame that has ended in the meantime leaves the node alone, even where all its inputs came in
            // time. A node that is still not ready has its result already, and does not run.
            pull.bWasReady = controllerStatus() == CONTROLLER_RUNNING && pull.pNode->isReady();
        }
        if (pull.bWasReady) {
            processNode(*pull.pNode);
        }
        aPulls.pop_back();
    }
}

Node* Controller::nextProducer(Pull& pull) const {
    std::vector<InputConnector*> const& aInputs = pull.pNode->aInputs_;
    while (pull.iInput < aInputs.size() && controllerStatus() == CONTROLLER_RUNNING) {
        OutputConnector const* const producerOutput = aInputs[pull.iInput]->connectedOutput();
        ++pull.iInput;
        ORVO_CHECK(producerOutput != nullptr, "producerOutput");
        if (producerOutput->hasData()) {
            continue;
        }
        Node* const producer = producerOutput->node();
        ORVO_CHECK(producer != nullptr, "producer");
        return producer;
    }
    return nullptr;
}

void Controller::processNode(Node& node) {
    std::lock_guard const lock(node.oProcessLock_);
    node.setProcessing(true);
    node.process();
    node.setProcessing(false);
}

void Controller::checkForCycle(std::vector<Pull> const& aPulls) {
    // The stack is one way through the graph: a node that stands on it twice waits for itself.
    std::vector<Node const*> apNodes;
    apNodes.reserve(aPulls.size());
    for (Pull const& pull : aPulls) {
        apNodes.push_back(pull.pNode);
    }
    std::sort(apNodes.begin(), apNodes.end(), std::less<>());
    bool const bRepeated = std::adjacent_find(apNodes.begin(), apNodes.end()) != apNodes.end();
    ORVO_CHECK(!bRepeated, "Graph contains a cycle");
}

void Controller::processSlices(Node* pNode) {
    ORVO_ENFORCE(pNode);
    Node::BlockedRange const range = pNode->rangeToProcess();
    if (range.items != 0 && range.unitsPerItem != 0) {
        if (bSingleThreadMode_) {
            pNode->processSlice(0, range.items);
        } else {
            std::size_t const nGrain = std::max<std::size_t>(1, getMinimumGrainSize() / range.unitsPerItem);
            std::size_t const nThreads =
                settings().bThreadsSet ? getNumberOfThreads() : std::numeric_limits<std::size_t>::max();
            pImpl_->forEachSlice(range.items, nGrain, nThreads, internal::processSliceHelper(*this, *pNode));
        }
    }
    checkException();
}

// Exceptions across threads

void Controller::failSlice() noexcept {
    try {
        cancelProcess();
    } catch (...) {
        pImpl_->cancelProcess(); // an override failed
    }
    saveCurrentException();
}

void Controller::saveCurrentException() noexcept {
    try {
        try {
            throw;
        } catch (ExceptionBase& exception) {
            saveException(exception.clone());
        } catch (...) {
            saveException(new CPURuntimeException(CPURuntimeException::CONDITION_UNKNOWN));
        }
    } catch (...) {
        saveShared(pImpl_->reserveException());
    }
}

void Controller::saveException(ExceptionBase* pException) {
    saveShared(std::shared_ptr<ExceptionBase>(pException, ORVODeleter<ExceptionBase>()));
}

void Controller::saveShared(std::shared_ptr<ExceptionBase> spException) noexcept {
    bool const bFailed = spException != nullptr;
    {
        std::lock_guard const lock(oExceptionLock_);
        spException_.swap(spException);
    }
    if (bFailed) {
        setStatus(CONTROLLER_STOPPED);
    }
}

void Controller::checkException() {
    std::shared_ptr<ExceptionBase> spException;
    {
        std::lock_guard const lock(oExceptionLock_);
        spException.swap(spException_);
    }
    if (!spException) {
        return;
    }
    if (auto const* pShared = dynamic_cast<SharedException const*>(spException.get())) {
        throw SharedException(*pShared);
    }
    throw SharedException(spException);
}

// Settings

std::size_t Controller::threadsAvailable() { return getNumberOfThreads(); }

bool Controller::initializeScheduler(std::size_t nThreads) {
    internal::ControllerImpl::initializeScheduler(nThreads);
    return true;
}

void Controller::terminateScheduler() { internal::ControllerImpl::terminateScheduler(); }

bool Controller::setNumberOfThreads(std::size_t nThreads) {
    settings().nThreads = nThreads;
    settings().bThreadsSet = true;
    return true;
}

std::size_t Controller::getNumberOfThreads() { return settings().nThreads; }

bool Controller::setMinimumGrainSize(std::size_t nUnits) {
    settings().nMinimumGrain = nUnits;
    return true;
}

std::size_t Controller::getMinimumGrainSize() { return settings().nMinimumGrain; }

} // namespace ORVO::DataFlow
