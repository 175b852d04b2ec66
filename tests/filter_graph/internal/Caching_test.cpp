// What a frame keeps of the frame before, counted by the runs of the nodes.
#include "orvo/filter_graph/internal/Connect.h"
#include "tests/support/FrameTest.h"

namespace ORVO::FilterGraph {
namespace {

using namespace ORVO::Test;

constexpr int kA = 1;
constexpr int kB = 2;
constexpr int kC = 3;
constexpr int kD = 4;

template <typename Node>
FilterPtr counted(int id) {
    FilterPtr spFilter = makeFilter<Node>();
    setParameter(*spFilter, "id", id);
    return spFilter;
}

class CachingTest : public FrameTest {
protected:
    CachingTest() { oInput_.at(0, 0) = 1.0f; }

    void run() { runWith(oOptions_); }

    void runWith(OptimizationOptions const& options) {
        TestNode::resetRuns();
        oOutput_.at(0, 0) = -1.0f;
        spProcessor_->processFrame(options);
    }

    float result() { return oOutput_.at(0, 0); }

    FloatImage oInput_{1, 1};
    FloatImage oOutput_{1, 1};
    SourcePtr spSource_ = makeSource(oInput_);
    SinkPtr spSink_ = makeSink(oOutput_);
    std::shared_ptr<IProcessor> spProcessor_ = createProcessor(spSink_, nullptr);
    OptimizationOptions oOptions_ = cpuOptions();
};

/// source -> A -> B -> C -> sink, each adding 1.
class CachedChainTest : public CachingTest {
protected:
    CachedChainTest() {
        oInput_.handle()->setContentStamp(1);
        Connect(spSource_, spA_);
        Connect(spA_, spB_);
        Connect(spB_, spC_);
        Connect(spC_, spSink_);
    }

    FilterPtr spA_ = counted<AddConstantNode>(kA);
    FilterPtr spB_ = counted<AddConstantNode>(kB);
    FilterPtr spC_ = counted<AddConstantNode>(kC);
};

TEST_F(CachedChainTest, RunsOnlyWhatHangsBehindAParameterThatChangesAgain) {
    run();
    EXPECT_EQ(result(), 4.0f);
    // The first change finds nothing kept yet: results are kept where a clean node feeds a dirty one.
    setParameter(*spC_, "value", 2.0f);
    run();
    EXPECT_EQ(result(), 5.0f);
    for (int frame = 0; frame < 3; ++frame) {
        setParameter(*spC_, "value", 10.0f + static_cast<float>(frame));
        run();
        EXPECT_EQ(result(), 13.0f + static_cast<float>(frame));
        EXPECT_EQ(TestNode::runs(kA), 0);
        EXPECT_EQ(TestNode::runs(kB), 0);
        EXPECT_EQ(TestNode::runs(kC), 1);
    }
}

TEST_F(CachedChainTest, AChangeAboveAKeptResultDropsIt) {
    run();
    setParameter(*spC_, "value", 2.0f);
    run();
    setParameter(*spA_, "value", 100.0f);
    run();
    EXPECT_EQ(result(), 104.0f);
    EXPECT_EQ(TestNode::runs(kA), 1);
    EXPECT_EQ(TestNode::runs(kB), 1);
    EXPECT_EQ(TestNode::runs(kC), 1);
}

TEST_F(CachedChainTest, WithoutCachingEveryNodeRuns) {
    oOptions_.setCachingMode(OptimizationOptions::CACHING_OFF);
    run();
    for (int frame = 0; frame < 3; ++frame) {
        setParameter(*spC_, "value", static_cast<float>(frame));
        run();
        EXPECT_EQ(result(), 3.0f + static_cast<float>(frame));
        EXPECT_EQ(TestNode::runs(kA), 1);
        EXPECT_EQ(TestNode::runs(kB), 1);
        EXPECT_EQ(TestNode::runs(kC), 1);
    }
}

TEST_F(CachedChainTest, ACachingModeBeyondTheTwoKeeps) {
    oOptions_.setCachingMode(static_cast<OptimizationOptions::eCachingMode>(7));
    run();
    setParameter(*spC_, "value", 2.0f);
    run();
    setParameter(*spC_, "value", 3.0f);
    run();
    EXPECT_EQ(result(), 6.0f);
    EXPECT_EQ(TestNode::runs(kA), 0);
}

TEST_F(CachedChainTest, PixelsWithoutAStampCountAsChangedOnEveryFrame) {
    oInput_.handle()->setContentStamp(0);
    run();
    for (int frame = 0; frame < 3; ++frame) {
        oInput_.at(0, 0) = 100.0f * static_cast<float>(frame);
        setParameter(*spC_, "value", static_cast<float>(frame));
        run();
        EXPECT_EQ(result(), 100.0f * static_cast<float>(frame) + 2.0f + static_cast<float>(frame));
        EXPECT_EQ(TestNode::runs(kA), 1);
    }
}

TEST_F(CachedChainTest, AnotherStampIsAnotherContent) {
    run();
    setParameter(*spC_, "value", 2.0f);
    run();
    oInput_.at(0, 0) = 50.0f;
    oInput_.handle()->setContentStamp(2);
    setParameter(*spC_, "value", 3.0f);
    run();
    EXPECT_EQ(result(), 55.0f);
}

TEST_F(CachedChainTest, AnotherImageOfTheSameStampIsAnotherContent) {
    run();
    setParameter(*spC_, "value", 2.0f);
    run();
    FloatImage other(1, 1);
    other.at(0, 0) = 70.0f;
    other.handle()->setContentStamp(1);
    spSource_->setImage(other.handle());
    run();
    EXPECT_EQ(result(), 74.0f);
    spSource_->setImage(oInput_.handle());
    run();
    EXPECT_EQ(result(), 5.0f);
}

TEST_F(CachedChainTest, AnotherRegionRunsTheNodesAgain) {
    run();
    setParameter(*spC_, "value", 2.0f);
    run();
    FloatImage wideInput(0, 0, 3, 2, 1, 4.0f);
    FloatImage wideOutput(0, 0, 3, 2);
    wideInput.handle()->setContentStamp(9);
    spSource_->setImage(wideInput.handle());
    spSink_->setImage(wideOutput.handle());
    run();
    EXPECT_EQ(wideOutput.pixels(), std::vector<float>(6, 8.0f));
    FloatImage partOutput(1, 0, 1, 1);
    spSink_->setImage(partOutput.handle());
    run();
    EXPECT_EQ(partOutput.pixels(), std::vector<float>(1, 8.0f));
    spSink_->setImage(wideOutput.handle());
    wideOutput.pixels().assign(6, 0.0f);
    run();
    EXPECT_EQ(wideOutput.pixels(), std::vector<float>(6, 8.0f));
}

TEST_F(CachedChainTest, TheBoundImageIsWrittenAlsoWhenNothingChanged) {
    run();
    FloatImage other(1, 1);
    spSink_->setImage(other.handle());
    run();
    EXPECT_EQ(other.at(0, 0), 4.0f);
    oOutput_.at(0, 0) = 0.0f;
    spSink_->setImage(oOutput_.handle());
    run();
    EXPECT_EQ(result(), 4.0f);
}

//              B
//            /   \        D mixes b and c; A feeds both through its output and a clone of it
// source -> A     D -> sink
//            \   /
//              C
class CachedDiamondTest : public CachingTest {
protected:
    CachedDiamondTest() {
        oInput_.handle()->setContentStamp(1);
        Connect(spSource_, spA_);
        Connect(spA_, spB_);
        Connect(spA_, spC_);
        Connect(spB_, spD_->input("a"));
        Connect(spC_, spD_->input("b"));
        Connect(spD_, spSink_);
    }

    FilterPtr spA_ = counted<AddConstantNode>(kA);
    FilterPtr spB_ = counted<GainNode>(kB);
    FilterPtr spC_ = counted<GainNode>(kC);
    FilterPtr spD_ = counted<MixNode>(kD);
};

TEST_F(CachedDiamondTest, RunsOnlyTheBranchThatChanges) {
    run();
    EXPECT_EQ(result(), 2.0f);
    setParameter(*spB_, "gain", 2.0f);
    run();
    EXPECT_EQ(result(), 3.0f);
    for (int frame = 0; frame < 3; ++frame) {
        setParameter(*spB_, "gain", 3.0f + static_cast<float>(frame));
        run();
        EXPECT_EQ(result(), 4.0f + static_cast<float>(frame));
        EXPECT_EQ(TestNode::runs(kA), 0);
        EXPECT_EQ(TestNode::runs(kB), 1);
        EXPECT_EQ(TestNode::runs(kC), 0);
        EXPECT_EQ(TestNode::runs(kD), 1);
    }
}

// The branch whose result was kept took its share of A's image along. When that branch runs again, it needs
// the share back, while A's other output is still full.
TEST_F(CachedDiamondTest, TheOtherBranchMayChangeAfterwards) {
    run();
    setParameter(*spB_, "gain", 2.0f);
    run();
    setParameter(*spC_, "gain", 5.0f);
    run();
    EXPECT_EQ(result(), 7.0f);
    setParameter(*spB_, "gain", 4.0f);
    run();
    EXPECT_EQ(result(), 9.0f);
    setParameter(*spC_, "gain", 1.0f);
    setParameter(*spB_, "gain", 1.0f);
    run();
    EXPECT_EQ(result(), 2.0f);
    EXPECT_EQ(TestNode::runs(kA), 0);
}

TEST_F(CachedDiamondTest, ChangesInTurnNeverLoseAFrame) {
    float gainB = 1.0f;
    float gainC = 1.0f;
    float added = 1.0f;
    for (int frame = 1; frame < 60; ++frame) {
        if (frame % 2 == 0) {
            setParameter(*spB_, "gain", gainB = static_cast<float>(frame));
        }
        if (frame % 3 == 0) {
            setParameter(*spC_, "gain", gainC = static_cast<float>(2 * frame));
        }
        if (frame % 7 == 0) {
            setParameter(*spA_, "value", added = static_cast<float>(frame));
        }
        if (frame % 11 == 0) {
            oInput_.handle()->setContentStamp(static_cast<std::uint64_t>(frame));
        }
        run();
        ASSERT_EQ(result(), 0.5f * (1.0f + added) * gainB + 0.5f * (1.0f + added) * gainC)
            << "frame " << frame;
    }
}

TEST_F(CachingTest, AGeneratorIsKeptToo) {
    FilterPtr const spGenerator = counted<GeneratorNode>(kA);
    FilterPtr const spB = counted<AddConstantNode>(kB);
    Connect(spGenerator, spB);
    Connect(spB, spSink_);
    run();
    setParameter(*spB, "value", 2.0f);
    run();
    setParameter(*spB, "value", 3.0f);
    run();
    EXPECT_EQ(result(), 3.0f);
    EXPECT_EQ(TestNode::runs(kA), 0);
    setParameter(*spGenerator, "value", 10.0f);
    run();
    EXPECT_EQ(result(), 13.0f);
    EXPECT_EQ(TestNode::runs(kA), 1);
}

} // namespace
} // namespace ORVO::FilterGraph
