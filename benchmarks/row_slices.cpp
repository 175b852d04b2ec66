// Row slices of a node: what a second thread brings to work that computes, and what the slicing itself costs.
// Items are pixels for the first, rows for the second.
#include "benchmarks/support/Timing.h"
#include "orvo/core/CoreLibrary.h"
#include "orvo/data_flow/DataFlow.h"

#include <benchmark/benchmark.h>

#include <cmath>
#include <cstddef>
#include <cstdint>
#include <thread>
#include <vector>

namespace {

using namespace ORVO;
using Benchmarks::medianOf;
using Benchmarks::secondsOf;

constexpr std::size_t nWidth = 1920;
constexpr std::size_t nHeight = 1080;

/// A node with rows of its own and no connectors.
class RowNode : public DataFlow::Node {
public:
    RowNode(std::size_t nRows, int nSteps) : Node("rows"), nSteps_(nSteps), aPixels_(nWidth * nRows, 0.5f) {
        oRange_.items = nRows;
        oRange_.unitsPerItem = nWidth;
    }

    BlockedRange rangeToProcess() override { return oRange_; }

    /// The logistic map, again and again: nothing but arithmetic in registers.
    void processSlice(std::size_t begin, std::size_t end) override {
        for (std::size_t i = begin * nWidth; i < end * nWidth; ++i) {
            float f = aPixels_[i];
            for (int iStep = 0; iStep < nSteps_; ++iStep) {
                f = 3.7f * f * (1.0f - f);
            }
            aPixels_[i] = f;
        }
    }

protected:
    void internalProcess() override { controller()->processSlices(this); }

private:
    BlockedRange oRange_;
    int nSteps_;
    std::vector<float> aPixels_;
};

/// The layers, a node and its controller; gives the settings back.
class Fixture {
public:
    Fixture(std::size_t nRows, int nSteps, std::size_t nThreads)
        : oNode_(nRows, nSteps), nThreadsBefore_(DataFlow::Controller::getNumberOfThreads()) {
        DataFlow::Controller::setNumberOfThreads(nThreads);
        oController_.addNode(&oNode_);
        oController_.setSinkNode(oNode_);
    }
    Fixture(Fixture const&) = delete;
    Fixture& operator=(Fixture const&) = delete;
    ~Fixture() { DataFlow::Controller::setNumberOfThreads(nThreadsBefore_); }

    DataFlow::Controller& controller() { return oController_; }
    RowNode& node() { return oNode_; }

private:
    Core::AutoInitializer oCore_;
    DataFlow::AutoInitializer oDataFlow_;
    RowNode oNode_;
    DataFlow::Controller oController_;
    std::size_t nThreadsBefore_;
};

constexpr int nComputeSteps = 32;

void computeSynchronous(benchmark::State& state, std::size_t nThreads, bool bSingleThreadMode) {
    Fixture fixture(nHeight, nComputeSteps, nThreads);
    fixture.controller().setSingleThreadMode(bSingleThreadMode);
    for (auto _ : state) {
        fixture.controller().process();
    }
    state.SetItemsProcessed(static_cast<std::int64_t>(state.iterations() * nWidth * nHeight));
}

void computeAsynchronous(benchmark::State& state, std::size_t nThreads) {
    Fixture fixture(nHeight, nComputeSteps, nThreads);
    for (auto _ : state) {
        fixture.controller().processAsync();
        fixture.controller().wait(60.0, 0.0005);
    }
    state.SetItemsProcessed(static_cast<std::int64_t>(state.iterations() * nWidth * nHeight));
}

BENCHMARK_CAPTURE(computeSynchronous, single, 1, true)
    ->Name("row_slices_compute/single_thread_mode")
    ->UseRealTime();
BENCHMARK_CAPTURE(computeSynchronous, one, 1, false)->Name("row_slices_compute/threads_1")->UseRealTime();
BENCHMARK_CAPTURE(computeSynchronous, two, 2, false)->Name("row_slices_compute/threads_2")->UseRealTime();
BENCHMARK_CAPTURE(computeAsynchronous, two, 2)->Name("row_slices_compute/threads_2_async")->UseRealTime();

/// One thread, two threads and, as what the machine itself gives, two bare threads of which each takes one
/// half: by turns, since a neighbour's load otherwise falls on one of them alone.
void computeByTurns(benchmark::State& state) {
    Fixture fixture(nHeight, nComputeSteps, 2);
    RowNode& node = fixture.node();
    std::vector<double> aOne, aTwo, aBare;
    for (auto _ : state) {
        aOne.push_back(secondsOf([&] { node.processSlice(0, nHeight); }));
        aBare.push_back(secondsOf([&] {
            std::thread other([&] { node.processSlice(0, nHeight / 2); });
            node.processSlice(nHeight / 2, nHeight);
            other.join();
        }));
        aTwo.push_back(secondsOf([&] { fixture.controller().process(); }));
        state.SetIterationTime(aTwo.back());
    }
    double const one = medianOf(aOne);
    state.counters["to_one_thread"] = one / medianOf(aTwo);
    state.counters["bare_threads_to_one"] = one / medianOf(aBare);
}

BENCHMARK(computeByTurns)->Name("row_slices_by_turns")->UseManualTime()->MinTime(1.0);

/// Slices without work: the node's rows are walked over with no step at all.
class EmptyRows : public RowNode {
public:
    using RowNode::RowNode;
    void processSlice(std::size_t begin, std::size_t) override { benchmark::DoNotOptimize(begin); }
};

void overhead(benchmark::State& state) {
    Core::AutoInitializer const core;
    DataFlow::AutoInitializer const dataFlow;
    EmptyRows node(static_cast<std::size_t>(state.range(0)), 0);
    DataFlow::Controller controller;
    controller.addNode(&node);
    for (auto _ : state) {
        controller.processSlices(&node);
    }
    state.SetItemsProcessed(static_cast<std::int64_t>(state.iterations()) * state.range(0));
}

BENCHMARK(overhead)->Name("row_slices_overhead/rows")->Arg(1)->Arg(16)->Arg(1080)->UseRealTime();

} // namespace
