#pragma once

#include "orvo/core/memory/TrackedNew.h"
#include "orvo/data_flow/connectors/Connect.h"
#include "orvo/data_flow/connectors/Inputs.h"
#include "orvo/data_flow/connectors/Outputs.h"
#include "orvo/data_flow/controllers/Controller.h"
#include "orvo/data_flow/nodes/Node.h"

#include <atomic>
#include <cstddef>
#include <functional>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

namespace ORVO::Test {

/// What flows through the graphs of these tests.
struct Number {
    int iValue = 0;
};

/// The order in which nodes ran, by name.
class RunLog {
public:
    void add(std::string const& sName) {
        std::lock_guard const lock(oLock_);
        aNames_.push_back(sName);
    }
    std::vector<std::string> take() {
        std::lock_guard const lock(oLock_);
        return std::exchange(aNames_, {});
    }

private:
    std::mutex oLock_;
    std::vector<std::string> aNames_;
};

/// A node whose every output is the sum of its inputs plus a number of its own. Counts its runs, and can be
/// given something to do on each run and on each slice.
class SumNode : public DataFlow::Node {
public:
    SumNode(std::string const& sName, std::size_t nInputs, std::size_t nOutputs = 1, int iOwn = 1)
        : Node(sName), iOwn_(iOwn) {
        for (std::size_t i = 0; i < nInputs; ++i) {
            apInputs_.push_back(
                std::make_unique<DataFlow::ConstInput<Number>>("in" + std::to_string(i), this));
            addInput(apInputs_.back().get());
        }
        for (std::size_t i = 0; i < nOutputs; ++i) {
            apOutputs_.push_back(
                std::make_unique<DataFlow::ConstOutput<Number>>("out" + std::to_string(i), this));
            addOutput(apOutputs_.back().get());
        }
    }
    ~SumNode() override { disconnect(); }

    DataFlow::ConstInput<Number>& in(std::size_t i = 0) { return *apInputs_[i]; }
    DataFlow::ConstOutput<Number>& out(std::size_t i = 0) { return *apOutputs_[i]; }

    /// The number in the first output, or -1 if there is none.
    int result() const { return apOutputs_[0]->get() != nullptr ? apOutputs_[0]->get()->iValue : -1; }

    BlockedRange rangeToProcess() override { return oRange_; }
    void processSlice(std::size_t begin, std::size_t end) override {
        if (onSlice_) {
            onSlice_(begin, end);
        }
        nItemsDone_ += static_cast<int>(end - begin);
    }

    /// Makes the node run slices of `nItems` items.
    void setSlices(std::size_t nItems, std::size_t nUnitsPerItem = 1) {
        bSliced_ = true;
        oRange_.items = nItems;
        oRange_.unitsPerItem = nUnitsPerItem;
    }

    int iOwn_;
    std::atomic<int> nRuns_{0};
    std::atomic<int> nItemsDone_{0};
    RunLog* pLog_ = nullptr;
    std::function<void()> onRun_;
    std::function<void(std::size_t, std::size_t)> onSlice_;

protected:
    void internalProcess() override {
        ++nRuns_;
        if (pLog_ != nullptr) {
            pLog_->add(name());
        }
        if (onRun_) {
            onRun_();
        }
        if (bSliced_) {
            controller()->processSlices(this);
        }
        int iSum = iOwn_;
        for (auto const& pInput : apInputs_) {
            iSum += (*pInput)->iValue;
        }
        for (auto const& pOutput : apOutputs_) {
            pOutput->setData(ORVO_NEW Number{iSum});
        }
    }

private:
    std::vector<std::unique_ptr<DataFlow::ConstInput<Number>>> apInputs_;
    std::vector<std::unique_ptr<DataFlow::ConstOutput<Number>>> apOutputs_;
    BlockedRange oRange_;
    bool bSliced_ = false;
};

/// A chain of nodes, each of which adds 1: the last one gives its length. Planted in a controller.
class Chain {
public:
    Chain(DataFlow::Controller& controller, std::size_t nNodes) {
        for (std::size_t i = 0; i < nNodes; ++i) {
            apNodes_.push_back(std::make_unique<SumNode>("node" + std::to_string(i), i == 0 ? 0 : 1));
            if (i > 0) {
                DataFlow::Connect(apNodes_[i - 1]->out(), apNodes_[i]->in());
            }
            controller.addNode(apNodes_[i].get());
        }
        controller.setSinkNode(apNodes_.back().get());
    }

    SumNode& operator[](std::size_t i) { return *apNodes_[i]; }
    SumNode& sink() { return *apNodes_.back(); }
    std::size_t size() const { return apNodes_.size(); }

    /// How often the nodes ran, all together.
    int runs() const {
        int nRuns = 0;
        for (auto const& pNode : apNodes_) {
            nRuns += pNode->nRuns_;
        }
        return nRuns;
    }

private:
    std::vector<std::unique_ptr<SumNode>> apNodes_;
};

/// A flag that one thread raises and another waits for.
class Signal {
public:
    void raise() {
        bRaised_.store(true, std::memory_order_release);
        bRaised_.notify_all();
    }
    void await() const { bRaised_.wait(false, std::memory_order_acquire); }
    bool isRaised() const { return bRaised_.load(std::memory_order_acquire); }

private:
    std::atomic<bool> bRaised_{false};
};

/// Gives back the process-wide settings of controllers at the end of a scope.
class SettingsScope {
public:
    SettingsScope()
        : nThreads_(DataFlow::Controller::getNumberOfThreads()),
          nGrain_(DataFlow::Controller::getMinimumGrainSize()) {}
    SettingsScope(SettingsScope const&) = delete;
    SettingsScope& operator=(SettingsScope const&) = delete;
    ~SettingsScope() {
        DataFlow::Controller::setNumberOfThreads(nThreads_);
        DataFlow::Controller::setMinimumGrainSize(nGrain_);
    }

private:
    std::size_t nThreads_;
    std::size_t nGrain_;
};

/// A controller whose protected operations can be called.
class OpenController : public DataFlow::Controller {
public:
    using Controller::cancelAndJoin;
    using Controller::initializeScheduler;
    using Controller::processRecursive;
    using Controller::resetIfCancelled;
    using Controller::terminateScheduler;
};

} // namespace ORVO::Test
