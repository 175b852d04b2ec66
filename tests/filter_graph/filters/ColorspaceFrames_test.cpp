// Frames of the colour transformer on the CPU: pictures of one to four channels, the way there and back, and
// frames on several threads at once.
#include <atomic>
#include <memory>
#include <thread>
#include <vector>

#include "orvo/colour_engine/EngineStatistics.h"
#include "tests/filter_graph/support/ColourGraph.h"
#include "tests/filter_graph/support/GreyTransforms.h"
#include "tests/filter_graph/support/RoundTrips.h"

namespace ORVO::FilterGraph {
namespace {

using namespace ORVO::Test;
using namespace ORVO::ColourEngine;

class ColorspaceFrames : public FrameTest {};

template <typename T>
void expectGreyRows() {
    UnevenProfile const profile;
    for (GreyRow const& row : greyRows()) {
        SCOPED_TRACE(row.pName_);
        PackedColourGraph<T> graph(16, 16, row.filters(), row.nInput_, row.nOutput_);
        fillWithLightColours(graph.oInput_);
        graph.spProcessor_->processFrame(cpuOptions());
        expectResultOf(row, graph.oInput_.pixels(), graph.oOutput_.pixels());
    }
}

TEST_F(ColorspaceFrames, GreyGoesInAsRGBAndComesOutAsGreen) {
    expectGreyRows<std::uint8_t>();
    expectGreyRows<std::uint16_t>();
}

TEST_F(ColorspaceFrames, InBytesThereAndBackIsAsFarAsBytesCarry) {
    PackedColourGraph<std::uint8_t> graph(64, 64, roundTrip());
    for (RoundTripRow const& row : roundTripRows()) {
        SCOPED_TRACE(row.pName_);
        row.fill(graph.oInput_);
        graph.spProcessor_->processFrame(cpuOptions());
        row.expectWithin(graph.oInput_.pixels(), graph.oOutput_.pixels());
    }
}

// Each thread has a graph of its own, and all of them come for one transform at once, which nobody has asked
// for before.
TEST_F(ColorspaceFrames, FramesOnManyThreadsShareATransform) {
    constexpr int kThreads = 4;
    constexpr int kFrames = 8;
    UnevenProfile const profile;
    std::vector<std::unique_ptr<PackedColourGraph<std::uint8_t>>> aGraphs;
    for (int i = 0; i < kThreads; ++i) {
        aGraphs.push_back(std::make_unique<PackedColourGraph<std::uint8_t>>(
            24, 24, std::vector<FilterPtr>{makeTransformer(UnevenProfile::kCode, PROFILE_BT_2020)}));
        aGraphs.back()->oInput_.fillAtRandom(static_cast<unsigned>(i));
    }
    auto const before = engineStatistics();
    std::atomic<int> nReady{0};
    std::atomic<int> nFailed{0};
    std::vector<std::thread> aThreads;
    aThreads.reserve(kThreads);
    for (auto const& upGraph : aGraphs) {
        aThreads.emplace_back([&nReady, &nFailed, &graph = *upGraph] {
            ++nReady;
            while (nReady < kThreads)
                std::this_thread::yield();
            try {
                for (int i = 0; i < kFrames; ++i)
                    graph.spProcessor_->processFrame(cpuOptions());
            } catch (...) {
                ++nFailed;
            }
        });
    }
    for (std::thread& thread : aThreads)
        thread.join();
    EXPECT_EQ(0, nFailed);
    EXPECT_EQ(before.nTransforms + 1, engineStatistics().nTransforms);
    for (auto const& upGraph : aGraphs) {
        EXPECT_EQ(transformed(upGraph->oInput_.pixels(), UnevenProfile::kCode, PROFILE_BT_2020),
                  upGraph->oOutput_.pixels());
    }
}

} // namespace
} // namespace ORVO::FilterGraph
