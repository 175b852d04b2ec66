// Random graphs on OpenGL, changed at random between frames: every frame equals its filters run one by one,
// without anything kept. There are 16 graphs, fewer under a sanitizer; ORVO_RANDOM_SEED is the first seed.
#include <chrono>
#include <cstdlib>
#include <thread>

#include "orvo/filter_graph/filters/StandardFilters.h"
#include "tests/filter_graph/gl/RandomGLGraph.h"

namespace ORVO::FilterGraph {
namespace {

using namespace ORVO::Test;

constexpr int kGLGraphs = 16;
constexpr int kGLFrames = 5;

/// Runs frames of one graph, each in a way that is chosen at random.
class RandomGLRun {
public:
    RandomGLRun(std::uint32_t seed, FilterBenches& benches, OGL::Context const* pContext)
        : oRandom_(seed * 2654435761u + 1),
          oGraph_(seed, benches),
          spProcessor_(createProcessor(oGraph_.sink(), pContext)) {}

    /// Empty if all frames are right.
    std::string run() {
        for (int frame = 0; frame < kGLFrames; ++frame) {
            if (frame > 0 && pick(5) != 0) {
                oGraph_.change();
            }
            // Another option throws the compiled graph away, and with it what is kept: not on every frame.
            if (pick(5) == 0) {
                oOptions_.setCachingMode(pick(3) == 0 ? OptimizationOptions::CACHING_OFF
                                                      : OptimizationOptions::CACHING_ON);
            }
            if (pick(4) == 0) {
                cancelledFrame();
            }
            oGraph_.spoilOutput();
            runFrame();
            std::string const sDifference = oGraph_.difference();
            if (!sDifference.empty()) {
                return "frame " + std::to_string(frame) + ": " + sDifference;
            }
        }
        return {};
    }

    RandomGLGraph const& graph() const { return oGraph_; }

private:
    int pick(int choices) { return static_cast<int>(oRandom_() % static_cast<std::uint32_t>(choices)); }

    void join() {
        // The images belong to the frame until it has ended.
        while (spProcessor_->waitForFrame(1.0, 0.0001) != IProcessorBase::FRAME_COMPLETE) {
        }
    }

    void runFrame() {
        if (pick(2) == 0) {
            spProcessor_->asyncProcessFrame(oOptions_);
            join();
        } else {
            spProcessor_->processFrame(oOptions_);
        }
    }

    void cancelledFrame() {
        spProcessor_->asyncProcessFrame(oOptions_);
        std::this_thread::sleep_for(std::chrono::microseconds(pick(400)));
        spProcessor_->cancelFrame();
        join();
    }

    std::minstd_rand oRandom_;
    RandomGLGraph oGraph_;
    std::shared_ptr<IProcessor> spProcessor_;
    OptimizationOptions oOptions_ = glOptions();
};

class RandomGLGraphsTest : public GLFrameTest {
protected:
    static int numberFrom(char const* variable, int otherwise) {
        char const* const pText = std::getenv(variable);
        return pText ? std::atoi(pText) : otherwise;
    }
};

TEST_F(RandomGLGraphsTest, EveryFrameEqualsTheFiltersRunOneByOne) {
    insertStandardFilters();
    int const nGraphs = kGLGraphs * numberFrom("ORVO_RANDOM_GRAPHS", 2000) / 2000;
    int const nFirst = numberFrom("ORVO_RANDOM_SEED", 1);
    std::map<GLKind, std::size_t> aSeen;
    {
        FilterBenches benches(context());
        for (int iGraph = 0; iGraph < nGraphs; ++iGraph) {
            auto const seed = static_cast<std::uint32_t>(nFirst + iGraph);
            RandomGLRun run(seed, benches, context());
            std::string sDifference;
            ASSERT_NO_THROW(sDifference = run.run()) << "seed " << seed;
            ASSERT_EQ(sDifference, "") << "seed " << seed;
            ASSERT_FALSE(HasFailure()) << "seed " << seed;
            for (int iKind = 0; iKind <= int(GLKind::TRANSFORMER); ++iKind) {
                aSeen[static_cast<GLKind>(iKind)] += run.graph().numberOf(static_cast<GLKind>(iKind));
            }
        }
    }
    for (auto const& [eKind, nNodes] : aSeen) {
        EXPECT_TRUE(nNodes > 0 || nGraphs < kGLGraphs) << "no graph had the kind " << int(eKind);
    }
    removeStandardFilters();
}

} // namespace
} // namespace ORVO::FilterGraph
