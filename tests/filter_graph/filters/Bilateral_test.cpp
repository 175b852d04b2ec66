// The bilateral composite: its interface, how it is replaced by its node, and frames through it.
#include "orvo/filter_graph/filters/Bilateral.h"

#include <algorithm>
#include <atomic>
#include <cmath>

#include "orvo/filter_graph/filters/StandardFilters.h"
#include "orvo/filter_graph/impl/Connect.h"
#include "orvo/filter_graph/impl/FilterFactory.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/MetadataItem.h"
#include "orvo/filter_graph/impl/Parameter.h"
#include "orvo/filter_graph/internal/Connect.h"
#include "orvo/filter_graph/internal/GraphExecutable.h"
#include "orvo/filter_graph/internal/IFilterExecutable.h"
#include "orvo/filter_graph/internal/ParameterForwarder.h"
#include "tests/filter_graph/support/PlainFilter.h"
#include "tests/image_flow/support/BilateralReference.h"
#include "tests/support/Expect.h"
#include "tests/support/ExpectFilterGraph.h"
#include "tests/support/FrameTest.h"

namespace ORVO::FilterGraph {
namespace {

using namespace ORVO::Test;
using Internal::Bilateral;
using ORVO::Test::reference::Settings;

OptimizationOptions gpuOptions() {
    OptimizationOptions options;
    options.setProcessingMode(OptimizationOptions::FULL_OPTIMIZATION);
    return options;
}

class BilateralTest : public FrameTest {};

TEST_F(BilateralTest, HasItsIdentifierInputAndParameters) {
    Bilateral const filter;
    EXPECT_EQ("FastBilateralBlur", filter.identifier().name());
    EXPECT_EQ("Motion Loft", filter.identifier().nameSpace());
    EXPECT_EQ("Norvane Works", filter.identifier().vendor());
    EXPECT_EQ(1, filter.identifier().version());
    EXPECT_FALSE(filter.identifier().ignoresVersion());
    ASSERT_EQ(1U, filter.getNumberOfInputs());
    ASSERT_NE(nullptr, filter.input("src"));
    EXPECT_EQ(0U, filter.input("src")->nChannel());
    EXPECT_EQ(0U, filter.nChannel());
    ASSERT_EQ(3U, filter.getNumberOfParameters());
    EXPECT_EQ(float2(10.0F, 10.0F), filter.parameter("spatialSigma")->as<float2>().value());
    EXPECT_EQ(0.15F, filter.parameter("rangeSigma")->as<float>().value());
    EXPECT_FALSE(filter.parameter("colorize")->as<bool>().value());
}

TEST_F(BilateralTest, ParametersSayTheirBounds) {
    Bilateral const filter;
    ParameterBase const& spatial = *filter.parameter("spatialSigma");
    EXPECT_EQ(float2(0.1F, 0.1F), spatial.metadataItem("Minimum Value")->as<float2>().value());
    EXPECT_EQ(float2(100.0F, 100.0F), spatial.metadataItem("Maximum Value")->as<float2>().value());
    ParameterBase const& range = *filter.parameter("rangeSigma");
    EXPECT_EQ(0.01F, range.metadataItem("Minimum Value")->as<float>().value());
    EXPECT_EQ(1.0F, range.metadataItem("Maximum Value")->as<float>().value());
}

TEST_F(BilateralTest, NeverBuildsAnExecutable) {
    FloatImage output(1, 1);
    FilterPtr const spGenerator = makeFilter<GeneratorNode>();
    SinkPtr const spSink = makeSink(output);
    Connect(spGenerator, spSink);
    Internal::GraphExecutable graphExecutable(spSink->getIFilter(), cpuOptions(), nullptr);
    Bilateral filter;
    for (int target = 0; target < 5; ++target) {
        EXPECT_FALSE(filter.canBuildFilterExecutable(static_cast<TargetPlatform>(target)));
        EXPECT_EQ(nullptr,
                  filter.buildFilterExecutable(static_cast<TargetPlatform>(target), graphExecutable));
    }
}

TEST_F(BilateralTest, CloneCarriesValuesAndNoConnections) {
    auto const producer = makePlain("producer");
    auto const spFilter = std::make_shared<Bilateral>();
    spFilter->parameter("rangeSigma")->as<float>().setValue(0.4F);
    Internal::Connect(producer.get(), spFilter.get());
    std::shared_ptr<Internal::Filter> const spClone = spFilter->clone();
    ASSERT_NE(nullptr, dynamic_cast<Bilateral*>(spClone.get()));
    EXPECT_TRUE(spClone->identifier() == spFilter->identifier());
    EXPECT_EQ(0.4F, spClone->parameter("rangeSigma")->as<float>().value());
    EXPECT_EQ(nullptr, spClone->input("src")->producerFilter());
    DisconnectAll(spFilter.get());
}

TEST_F(BilateralTest, UnfoldsIntoANodeBetweenProducerAndConsumers) {
    auto const producer = makePlain("producer");
    auto const a = makePlain("a", {"in"});
    auto const b = makePlain("b", {"left", "right"});
    Bilateral filter;
    Internal::Connect(producer.get(), &filter);
    Internal::Connect(&filter, a.get());
    Internal::Connect(&filter, b->input("left"));
    Internal::Connect(&filter, b->input("right"));
    // It needs no other filter from the factory.
    EXPECT_EQ(0U, FilterFactory::Instance()->numberOfPrototypes());
    std::shared_ptr<Internal::ParameterForwarder> const spForwarder = filter.unFold(cpuOptions());
    ASSERT_NE(nullptr, spForwarder);

    auto* const pNode = dynamic_cast<Internal::Filter*>(a->input("in")->producerFilter());
    ASSERT_NE(nullptr, pNode);
    EXPECT_EQ("Bilateral Node", pNode->identifier().name());
    EXPECT_EQ("Aux", pNode->identifier().nameSpace());
    EXPECT_EQ("Norvane Works", pNode->identifier().vendor());
    EXPECT_EQ(1, pNode->identifier().version());
    EXPECT_EQ(pNode, b->input("left")->producerFilter());
    EXPECT_EQ(pNode, b->input("right")->producerFilter());
    EXPECT_EQ(producer.get(), (*pNode->inputs())->producerFilter());
    EXPECT_TRUE(pNode->canBuildFilterExecutable(ORVO_TARGET_CPU));
    EXPECT_FALSE(pNode->canBuildFilterExecutable(ORVO_TARGET_GL));
    // No traversal reaches the composite any more.
    EXPECT_EQ(nullptr, filter.input("src")->producerFilter());
    EXPECT_EQ(0U, filter.output()->numConsumerInputs());
    EXPECT_EQ(1U, producer->output()->numConsumerInputs());
    EXPECT_EQ(3U, pNode->output()->numConsumerInputs());

    // Values flow from the composite to the node on each forward, and not before.
    filter.parameter("spatialSigma")->as<float2>().setValue(float2(3.0F, 4.0F));
    filter.parameter("colorize")->as<bool>().setValue(true);
    EXPECT_EQ(float2(10.0F, 10.0F), pNode->parameter("spatialSigma")->as<float2>().value());
    spForwarder->forwardStuff();
    EXPECT_EQ(float2(3.0F, 4.0F), pNode->parameter("spatialSigma")->as<float2>().value());
    EXPECT_EQ(0.15F, pNode->parameter("rangeSigma")->as<float>().value());
    EXPECT_TRUE(pNode->parameter("colorize")->as<bool>().value());

    // A copy knows nothing of it.
    std::shared_ptr<Internal::Filter> const spClone = filter.clone();
    EXPECT_EQ(0U, spClone->output()->numConsumerInputs());
}

TEST_F(BilateralTest, UnfoldsWithoutConsumers) {
    auto const producer = makePlain("producer");
    Bilateral filter;
    Internal::Connect(producer.get(), &filter);
    EXPECT_NE(nullptr, filter.unFold(cpuOptions()));
    EXPECT_EQ(nullptr, filter.input("src")->producerFilter());
}

TEST_F(BilateralTest, RefusesToUnfoldWithoutAProducer) {
    Bilateral filter;
    ORVO_EXPECT_INTERNAL(filter.unFold(cpuOptions()), "myProducer");
    EXPECT_EQ(0U, filter.output()->numConsumerInputs());
}

/// source -> bilateral -> sink, RGBA floats.
class BilateralFrameTest : public FrameTest {
protected:
    static constexpr int kWidth = 61;
    static constexpr int kHeight = 43;

    BilateralFrameTest() : oPicture_(randomPicture(0, 0, kWidth, kHeight, 71)) {
        for (int row = 0; row < kHeight; ++row) {
            for (int column = 0; column < kWidth; ++column) {
                for (std::size_t c = 0; c < 4; ++c) {
                    oInput_.at(column, row, c) = oPicture_.at(column, row)[c];
                }
            }
        }
        Connect(spSource_, spBilateral_);
        Connect(spBilateral_, spSink_);
    }

    void set(Settings const& s) {
        spBilateral_->parameter("spatialSigma")
            ->as<float2>()
            .setValue(float2(float(s.sigmaX), float(s.sigmaY)));
        spBilateral_->parameter("rangeSigma")->as<float>().setValue(float(s.rangeSigma));
        spBilateral_->parameter("colorize")->as<bool>().setValue(s.colorize);
    }

    Picture result() {
        Picture picture(0, 0, kWidth, kHeight);
        for (int row = 0; row < kHeight; ++row) {
            for (int column = 0; column < kWidth; ++column) {
                for (std::size_t c = 0; c < 4; ++c) {
                    picture.at(column, row)[c] = oOutput_.at(column, row, c);
                }
            }
        }
        return picture;
    }

    static bool countCall(void*) {
        ++nCalls_;
        return true;
    }
    static inline std::atomic<int> nCalls_{0};

    Picture oPicture_;
    FloatImage oInput_{0, 0, kWidth, kHeight, 4};
    FloatImage oOutput_{0, 0, kWidth, kHeight, 4};
    SourcePtr spSource_ = makeSource(oInput_);
    FilterPtr spBilateral_ = std::make_shared<Bilateral>();
    SinkPtr spSink_ = makeSink(oOutput_);
    std::shared_ptr<IProcessor> spProcessor_ = createProcessor(spSink_, nullptr);
};

TEST_F(BilateralFrameTest, ComputesTheFilter) {
    for (bool colorize : {false, true}) {
        Settings const settings = {0.15, 10, 10, colorize};
        set(settings);
        spProcessor_->processFrame(cpuOptions());
        expectNear(result(), clamped(reference::gridFilter(oPicture_, oPicture_, settings)), 5e-5F);
    }
}

TEST_F(BilateralFrameTest, NewValuesReachTheNodeWithoutARebuild) {
    spProcessor_->processFrame(cpuOptions());
    // A callback lives on the compiled graph: it is still called if that was kept.
    spProcessor_->setCompletionCallback(&countCall);
    nCalls_ = 0;
    int nFrames = 0;
    for (Settings const& settings :
         {Settings{0.15, 4, 7, false}, Settings{0.3, 4, 7, false}, Settings{0.3, 12, 5, true}}) {
        set(settings);
        spProcessor_->asyncProcessFrame(cpuOptions());
        spProcessor_->waitForFrame(60.0, 0.0005);
        ++nFrames;
        expectNear(result(), clamped(reference::gridFilter(oPicture_, oPicture_, settings)), 5e-5F);
    }
    EXPECT_EQ(nFrames, nCalls_);
}

TEST_F(BilateralFrameTest, FramesWithoutThreadsAndWithoutCacheAreTheSame) {
    spProcessor_->processFrame(cpuOptions());
    Picture const expected = result();
    OptimizationOptions options = cpuOptions();
    options.setDebuggingMode(OptimizationOptions::DEBUGGING_SINGLE_THREAD);
    options.setCachingMode(OptimizationOptions::CACHING_OFF);
    spProcessor_->processFrame(options);
    EXPECT_TRUE(areIdentical(expected, result()));
}

TEST_F(BilateralFrameTest, TwoInARowAndSeveralConsumersWork) {
    // bilateral -> second bilateral -> mix.a, bilateral -> mix.b, half of each.
    auto const spSecond = std::make_shared<Bilateral>();
    FilterPtr const spMix = makeFilter<MixNode>("mix");
    setParameter(*spMix, "amount", 0.5F);
    Connect(spBilateral_, FilterPtr(spSecond));
    Connect(FilterPtr(spSecond), spMix->input("a"));
    Connect(spBilateral_, spMix->input("b"));
    Connect(spMix, spSink_);
    Settings const settings = {0.15, 5, 5, true};
    set(settings);
    spSecond->parameter("spatialSigma")->as<float2>().setValue(float2(8.0F, 8.0F));
    spProcessor_->processFrame(cpuOptions());
    Picture const once = clamped(reference::gridFilter(oPicture_, oPicture_, settings));
    Picture const twice = clamped(reference::gridFilter(once, once, {0.15, 8, 8, false}));
    Picture expected = once;
    for (std::size_t i = 0; i < expected.pixels.size(); ++i) {
        expected.pixels[i] = 0.5F * (once.pixels[i] + twice.pixels[i]);
    }
    // The second filter sees more than the picture: the first one's result reaches beyond it.
    Picture const actual = result();
    float largest = 0.0F;
    for (int column = 24; column <= 36; ++column) {
        EXPECT_NEAR(expected.at(column, 21).x, actual.at(column, 21).x, 0.02) << column;
        EXPECT_NEAR(expected.at(column, 21).w, actual.at(column, 21).w, 1e-5) << column;
        largest = std::max(largest, std::abs(twice.at(column, 21).x - once.at(column, 21).x));
    }
    // A second filter that does nothing would be off by half of this.
    EXPECT_GT(largest, 4 * 0.02F);
}

TEST_F(BilateralFrameTest, UnconnectedInputIsReportedByTheTraversal) {
    DisconnectAll(spBilateral_.get());
    ORVO_EXPECT_FILTERGRAPH(spProcessor_->processFrame(cpuOptions()),
                            "FastBilateralBlur::src is not connected");
    Connect(spSource_, spBilateral_);
    EXPECT_NO_THROW(spProcessor_->processFrame(cpuOptions()));
}

TEST_F(BilateralFrameTest, FullOptimizationIsRefusedWithoutAContext) {
    ORVO_EXPECT_INTERNAL(spProcessor_->processFrame(gpuOptions()),
                         "Processing with FULL_OPTIMIZATION needs valid GL context.");
    EXPECT_NO_THROW(spProcessor_->processFrame(cpuOptions()));
}

TEST_F(BilateralFrameTest, IsCreatedByTheFactory) {
    insertStandardFilters();
    FilterPtr const spCreated = FilterFactory::Instance()->create(
        IFilter::Identifier("FastBilateralBlur", "Motion Loft", "Norvane Works"));
    DisconnectAll(spBilateral_.get());
    Connect(spSource_, spCreated);
    Connect(spCreated, spSink_);
    spProcessor_->processFrame(cpuOptions());
    expectNear(result(), clamped(reference::gridFilter(oPicture_, oPicture_, {0.15, 10, 10, false})), 5e-5F);
    DisconnectAll(spCreated.get());
}

} // namespace
} // namespace ORVO::FilterGraph
