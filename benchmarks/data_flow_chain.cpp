// What a frame costs beside the work of its nodes: a chain of nodes that hand one object on, run by the
// controller alone. Items are nodes.
#include "orvo/core/CoreLibrary.h"
#include "orvo/core/memory/TrackedNew.h"
#include "orvo/data_flow/DataFlow.h"

#include <benchmark/benchmark.h>

#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace {

using namespace ORVO;

struct Pixel {
    float fValue = 0.0f;
};

/// Makes the object, hands it on, or drops it, by the connectors that it has.
class TrivialNode : public DataFlow::Node {
public:
    TrivialNode(bool bInput, bool bOutput) : Node("trivial") {
        if (bInput) {
            oInput_.emplace("in", this);
            addInput(&*oInput_);
        }
        if (bOutput) {
            oOutput_.emplace("out", this);
            addOutput(&*oOutput_);
        }
    }
    ~TrivialNode() override { disconnect(); }

    DataFlow::ConstInput<Pixel>& in() { return *oInput_; }
    DataFlow::ConstOutput<Pixel>& out() { return *oOutput_; }

protected:
    void internalProcess() override {
        if (!oInput_) {
            oOutput_->setData(ORVO_NEW Pixel());
        } else if (oOutput_) {
            oInput_->moveTo(*oOutput_);
        }
    }

private:
    std::optional<DataFlow::ConstInput<Pixel>> oInput_;
    std::optional<DataFlow::ConstOutput<Pixel>> oOutput_;
};

/// The layers, a controller and a chain of so many nodes.
class Chain {
public:
    explicit Chain(std::size_t nNodes) {
        for (std::size_t i = 0; i < nNodes; ++i) {
            apNodes_.push_back(std::make_unique<TrivialNode>(i > 0, i + 1 < nNodes));
            if (i > 0) {
                DataFlow::Connect(apNodes_[i - 1]->out(), apNodes_[i]->in());
            }
            oController_.addNode(apNodes_[i].get());
        }
        oController_.setSinkNode(apNodes_.back().get());
    }

    DataFlow::Controller& controller() { return oController_; }

private:
    Core::AutoInitializer oCore_;
    DataFlow::AutoInitializer oDataFlow_;
    std::vector<std::unique_ptr<TrivialNode>> apNodes_;
    DataFlow::Controller oController_;
};

void chainSynchronous(benchmark::State& state) {
    Chain chain(static_cast<std::size_t>(state.range(0)));
    for (auto _ : state) {
        chain.controller().process();
    }
    state.SetItemsProcessed(static_cast<std::int64_t>(state.iterations()) * state.range(0));
}

void chainAsynchronous(benchmark::State& state) {
    Chain chain(static_cast<std::size_t>(state.range(0)));
    for (auto _ : state) {
        chain.controller().processAsync();
        chain.controller().wait(60.0, 0.0);
    }
    state.SetItemsProcessed(static_cast<std::int64_t>(state.iterations()) * state.range(0));
}

BENCHMARK(chainSynchronous)->Name("data_flow_chain/process")->Arg(1)->Arg(1000)->Arg(10000)->UseRealTime();
BENCHMARK(chainAsynchronous)->Name("data_flow_chain/processAsync")->Arg(1)->Arg(1000)->UseRealTime();

} // namespace
