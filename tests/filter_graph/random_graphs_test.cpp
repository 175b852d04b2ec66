// Random graphs, changed at random between frames: every frame equals the same graph evaluated from scratch.
// The number of graphs is 2,000, or that of the environment variable ORVO_RANDOM_GRAPHS; ORVO_RANDOM_SEED is
// the first seed.
#include <chrono>
#include <cstdlib>
#include <thread>

#include "orvo/data_flow/controllers/Controller.h"
#include "orvo/filter_graph/impl/FilterGraphLibrary.h"
#include "tests/filter_graph/RandomGraph.h"

namespace ORVO::FilterGraph {
namespace {

using namespace ORVO::Test;

constexpr int kFrames = 6;

int numberFrom(char const* variable, int otherwise) {
    char const* const pText = std::getenv(variable);
    return pText ? std::atoi(pText) : otherwise;
}

/// Runs frames of one graph, each in a way that is chosen at random.
class RandomRun {
public:
    explicit RandomRun(std::uint32_t seed)
        : oRandom_(seed * 2654435761u + 1),
          eMode_(pick(4) == 0 ? IAdapter::REGION_SYNC_EXPLICIT : IAdapter::REGION_SYNC_FROM_IMAGE),
          oGraph_(seed, eMode_) {
        if (eMode_ == IAdapter::REGION_SYNC_EXPLICIT) {
            spEmbedded_ = createEmbeddedProcessor(oGraph_.sink(), nullptr);
        } else {
            spStandard_ = createProcessor(oGraph_.sink(), nullptr);
        }
    }

    /// Empty if all frames are right.
    std::string run() {
        for (int frame = 0; frame < kFrames; ++frame) {
            if (frame > 0 && pick(6) != 0) {
                oGraph_.change();
            }
            chooseSettings();
            if (pick(8) == 0) {
                cancelledFrame();
            }
            oGraph_.spoilOutput();
            runFrame();
            if (!oGraph_.isOutputRight()) {
                return "frame " + std::to_string(frame) + ": " + oGraph_.describeDifference();
            }
        }
        return {};
    }

private:
    int pick(int choices) { return static_cast<int>(oRandom_() % static_cast<std::uint32_t>(choices)); }

    IProcessorBase& processor() {
        return spStandard_ ? static_cast<IProcessorBase&>(*spStandard_)
                           : static_cast<IProcessorBase&>(*spEmbedded_);
    }

    void chooseSettings() {
        static constexpr std::size_t kThreads[] = {1, 2, 8};
        static constexpr std::size_t kGrains[] = {0, 1, 3, 16, 1000000};
        setNumberOfThreads(kThreads[pick(3)]);
        DataFlow::Controller::setMinimumGrainSize(kGrains[pick(5)]);
        // Another option throws the compiled graph away, and with it what is kept: not on every frame.
        if (pick(4) == 0) {
            oOptions_.setCachingMode(pick(3) == 0 ? OptimizationOptions::CACHING_OFF
                                                  : OptimizationOptions::CACHING_ON);
            oOptions_.setDebuggingMode(pick(3) == 0 ? OptimizationOptions::DEBUGGING_SINGLE_THREAD
                                                    : OptimizationOptions::DEBUGGING_OFF);
            oOptions_.setConcatenationMode(pick(2) == 0 ? OptimizationOptions::CONCATENATION_OFF
                                                        : OptimizationOptions::CONCATENATION_ON);
        }
    }

    void launch() {
        if (spStandard_) {
            spStandard_->asyncProcessFrame(oOptions_);
        } else {
            spEmbedded_->asyncProcessFrameEmbedded(oOptions_);
        }
    }

    void runFrame() {
        if (pick(2) == 0) {
            launch();
            while (processor().waitForFrame(1.0, 0.0001) != IProcessorBase::FRAME_COMPLETE) {
            }
        } else if (spStandard_) {
            spStandard_->processFrame(oOptions_);
        } else {
            spEmbedded_->processFrameEmbedded(oOptions_);
        }
    }

    void cancelledFrame() {
        launch();
        std::this_thread::sleep_for(std::chrono::microseconds(pick(100)));
        processor().cancelFrame();
        if (pick(2) == 0) {
            // The launch has to join the cancelled frame.
            launch();
            processor().cancelFrame();
        }
        // The images belong to the frame until it has ended.
        while (processor().waitForFrame(1.0, 0.0001) != IProcessorBase::FRAME_COMPLETE) {
        }
    }

    std::minstd_rand oRandom_;
    IAdapter::eRegionSyncMode eMode_;
    RandomGraph oGraph_;
    std::shared_ptr<IProcessor> spStandard_;
    std::shared_ptr<IEmbeddedProcessor> spEmbedded_;
    OptimizationOptions oOptions_ = cpuOptions();
};

class RandomGraphsTest : public testing::TestWithParam<Library::eAllocationMode> {
protected:
    ~RandomGraphsTest() override {
        setNumberOfThreads(nThreads_);
        DataFlow::Controller::setMinimumGrainSize(nGrain_);
    }

    static Library::InitializationOptions initialization() {
        Library::InitializationOptions options;
        options.setAllocationMode(GetParam());
        return options;
    }

    ImageFlowLayers oLayers_;
    AutoInitializer oFilterGraph_{initialization()};
    std::size_t nThreads_ = DataFlow::Controller::getNumberOfThreads();
    std::size_t nGrain_ = DataFlow::Controller::getMinimumGrainSize();
};

TEST_P(RandomGraphsTest, EveryFrameEqualsTheGraphEvaluatedFromScratch) {
    int const nGraphs = numberFrom("ORVO_RANDOM_GRAPHS", 2000) / 2;
    int const nFirst = numberFrom("ORVO_RANDOM_SEED", GetParam() == Library::ALLOCATE_ON_DEMAND ? 1 : 100001);
    std::size_t nFilters = 0;
    std::size_t nBilaterals = 0;
    std::size_t nTransformers = 0;
    for (int iGraph = 0; iGraph < nGraphs; ++iGraph) {
        auto const seed = static_cast<std::uint32_t>(nFirst + iGraph);
        std::string difference;
        ASSERT_NO_THROW(difference = RandomRun(seed).run()) << "seed " << seed;
        ASSERT_EQ(difference, "") << "seed " << seed;
        RandomGraph const graph(seed, IAdapter::REGION_SYNC_FROM_IMAGE);
        nFilters += graph.numberOfFilters();
        nBilaterals += graph.numberOf(RandomGraph::BILATERAL);
        nTransformers += graph.numberOf(RandomGraph::TRANSFORMER);
    }
    RecordProperty("filters", static_cast<int>(nFilters));
    EXPECT_GT(nFilters, static_cast<std::size_t>(4 * nGraphs)) << "the graphs are too small to mean much";
    EXPECT_GT(nBilaterals, static_cast<std::size_t>(nGraphs / 20)) << "hardly any bilateral filter";
    EXPECT_GT(nTransformers, static_cast<std::size_t>(nGraphs / 20)) << "hardly any colour transformer";
}

INSTANTIATE_TEST_SUITE_P(BothAllocationModes, RandomGraphsTest,
                         testing::Values(Library::ALLOCATE_ON_DEMAND, Library::ALLOCATE_BEFORE_LAUNCH));

} // namespace
} // namespace ORVO::FilterGraph
