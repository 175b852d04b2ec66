// The colour transformer: its interface, how it is replaced by its node, what its forwarder makes, and frames
// on the CPU.
#include "orvo/filter_graph/filters/ColorspaceTransformer.h"

#include <atomic>
#include <exception>
#include <memory>
#include <string>
#include <vector>

#include "orvo/colour_engine/EngineStatistics.h"
#include "orvo/core/memory/MemoryStatistics.h"
#include "orvo/filter_graph/filters/Bilateral.h"
#include "orvo/filter_graph/filters/StandardFilters.h"
#include "orvo/filter_graph/impl/FilterFactory.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/MetadataItem.h"
#include "orvo/filter_graph/internal/Connect.h"
#include "orvo/filter_graph/internal/GraphExecutable.h"
#include "orvo/filter_graph/internal/IFilterExecutable.h"
#include "tests/filter_graph/support/ColourGraph.h"
#include "tests/filter_graph/support/PlainFilter.h"
#include "tests/image_flow/colour/FakeEngine.h"
#include "tests/support/Expect.h"
#include "tests/support/ExpectFilterGraph.h"

namespace ORVO::FilterGraph {
namespace {

using namespace ORVO::Test;
using namespace ORVO::ColourEngine;
using Internal::Filters::ColorspaceTransformer;

constexpr std::uint32_t kUnknown = profileCode("none");
constexpr char const* kNoSource = "Cannot make src profile from code";
constexpr char const* kNoDestination = "Cannot make dst profile from code";

/// A transformer is unfolded between two filters.
class UnfoldTest : public FrameTest {
protected:
    /// Unfolds between a producer and a consumer, which are made for it.
    std::shared_ptr<Internal::ParameterForwarder> unfold(ColorspaceTransformer& filter,
                                                         OptimizationOptions const& options) {
        Internal::Connect(spProducer_.get(), &filter);
        Internal::Connect(&filter, spConsumer_->input("in"));
        return filter.unFold(options);
    }
    Internal::Filter* node() const {
        return dynamic_cast<Internal::Filter*>(spConsumer_->input("in")->producerFilter());
    }
    void* transformOfNode() const { return node()->parameter("Transform")->as<void*>().value(); }

    std::shared_ptr<PlainFilter> spProducer_ = makePlain("producer");
    std::shared_ptr<PlainFilter> spConsumer_ = makePlain("consumer", {"in"});
};

class ColorspaceTransformerTest : private WithRecordingEngine, public UnfoldTest {};

TEST_F(ColorspaceTransformerTest, HasItsIdentifierInputAndParameters) {
    ColorspaceTransformer const filter;
    EXPECT_EQ("ColorspaceTransformer", filter.identifier().name());
    EXPECT_EQ("com.norvane.orvo", filter.identifier().nameSpace());
    EXPECT_EQ("Norvane", filter.identifier().vendor());
    EXPECT_EQ(1, filter.identifier().version());
    ASSERT_EQ(1U, filter.getNumberOfInputs());
    EXPECT_EQ(0U, filter.input("src")->nChannel());
    ASSERT_EQ(2U, filter.getNumberOfParameters());
    for (char const* name : {"srcProfile", "dstProfile"}) {
        ParameterBase const& parameter = *filter.parameter(name);
        EXPECT_EQ(0x41533938, parameter.as<int>().value()) << name;
        EXPECT_EQ(0, parameter.metadataItem("minValue")->as<int>().value()) << name;
        EXPECT_EQ(-1, parameter.metadataItem("maxValue")->as<int>().value()) << name;
        EXPECT_NE("", parameter.metadataItem("Description")->as<std::string>().value()) << name;
    }
}

TEST_F(ColorspaceTransformerTest, BuildsNoExecutable) {
    FloatImage output(1, 1);
    FilterPtr const spGenerator = makeFilter<GeneratorNode>();
    SinkPtr const spSink = makeSink(output);
    Connect(spGenerator, spSink);
    Internal::GraphExecutable graphExecutable(spSink->getIFilter(), cpuOptions(), nullptr);
    ColorspaceTransformer filter;
    for (int target = 0; target < 5; ++target) {
        EXPECT_EQ(target < 2, filter.canBuildFilterExecutable(static_cast<TargetPlatform>(target)));
        EXPECT_EQ(nullptr,
                  filter.buildFilterExecutable(static_cast<TargetPlatform>(target), graphExecutable));
    }
}

TEST_F(ColorspaceTransformerTest, CloneCarriesValuesAndNoConnections) {
    auto const spFilter = std::make_shared<ColorspaceTransformer>();
    setCodes(*spFilter, PROFILE_SRGB, PROFILE_BT_2020);
    Internal::Connect(spProducer_.get(), spFilter.get());
    std::shared_ptr<Internal::Filter> const spClone = spFilter->clone();
    ASSERT_NE(nullptr, dynamic_cast<ColorspaceTransformer*>(spClone.get()));
    EXPECT_TRUE(spClone->identifier() == spFilter->identifier());
    EXPECT_EQ(int(PROFILE_SRGB), spClone->parameter("srcProfile")->as<int>().value());
    EXPECT_EQ(int(PROFILE_BT_2020), spClone->parameter("dstProfile")->as<int>().value());
    EXPECT_EQ(-1, spClone->parameter("dstProfile")->metadataItem("maxValue")->as<int>().value());
    EXPECT_EQ(nullptr, spClone->input("src")->producerFilter());
    DisconnectAll(spFilter.get());
}

TEST_F(ColorspaceTransformerTest, ACloneSharesTheNodesThatItsOriginalHas) {
    ColorspaceTransformer filter;
    setCodes(filter, PROFILE_SRGB, PROFILE_DISPLAY_P3);
    auto const spForwarder = unfold(filter, cpuOptions());
    std::shared_ptr<Internal::Filter> const spClone = filter.clone();
    // What the clone forwards reaches the original's node.
    ColorspaceTransformer::Forwarder forwarder(dynamic_cast<ColorspaceTransformer&>(*spClone));
    EXPECT_EQ(nullptr, transformOfNode());
    forwarder.forwardStuff();
    void* const pTransform = transformOfNode();
    EXPECT_NE(nullptr, pTransform);
    spForwarder->forwardStuff();
    EXPECT_EQ(pTransform, transformOfNode());
    // For OpenGL alike; the codes are the clone's own.
    ColorspaceTransformer other;
    DisconnectAll(spProducer_.get());
    auto const spOtherForwarder = unfold(other, OptimizationOptions());
    std::shared_ptr<Internal::Filter> const spOtherClone = other.clone();
    setCodes(*spOtherClone, PROFILE_SRGB, PROFILE_DISPLAY_P3);
    ColorspaceTransformer::Forwarder(dynamic_cast<ColorspaceTransformer&>(*spOtherClone)).forwardStuff();
    EXPECT_EQ(pTransform, transformOfNode());
}

TEST_F(ColorspaceTransformerTest, AForwarderOfAFoldedTransformerAsksTheEngineForNothing) {
    ColorspaceTransformer filter;
    auto const before = engineStatistics();
    ColorspaceTransformer::Forwarder forwarder(filter);
    for (std::uint32_t const source : {PROFILE_SRGB, kUnknown}) {
        setCodes(filter, source, PROFILE_WIDE_GAMUT);
        ORVO_EXPECT_INTERNAL(forwarder.forwardStuff(), "Enforce vantleNode_g != NULL");
    }
    EXPECT_EQ(0U, RecordingEngine::calls("ProfileFromCode"));
    EXPECT_EQ(before.nTransforms, engineStatistics().nTransforms);
    EXPECT_EQ(before.nReferences, engineStatistics().nReferences);
}

TEST_F(ColorspaceTransformerTest, UnfoldsIntoTheNodeOfTheTarget) {
    for (auto const& [options, target] :
         {std::pair(OptimizationOptions(), ORVO_TARGET_GL), {cpuOptions(), ORVO_TARGET_CPU}}) {
        auto const spOther = makePlain("other", {"left", "right"});
        ColorspaceTransformer filter;
        Internal::Connect(&filter, spOther->input("left"));
        Internal::Connect(&filter, spOther->input("right"));
        ASSERT_NE(nullptr, unfold(filter, options));
        Internal::Filter* const pNode = node();
        ASSERT_NE(nullptr, pNode);
        EXPECT_EQ("VantleFilterGPU", pNode->identifier().name());
        EXPECT_EQ("ImageFlow", pNode->identifier().nameSpace());
        EXPECT_EQ("Norvane", pNode->identifier().vendor());
        EXPECT_EQ(1, pNode->identifier().version());
        for (auto const candidate : {ORVO_TARGET_GL, ORVO_TARGET_CPU})
            EXPECT_EQ(candidate == target, pNode->canBuildFilterExecutable(candidate));
        EXPECT_EQ(pNode, spOther->input("left")->producerFilter());
        EXPECT_EQ(pNode, spOther->input("right")->producerFilter());
        EXPECT_EQ(spProducer_.get(), (*pNode->inputs())->producerFilter());
        EXPECT_EQ(nullptr, filter.input("src")->producerFilter());
        EXPECT_EQ(0U, filter.output()->numConsumerInputs());
        EXPECT_EQ(1U, spProducer_->output()->numConsumerInputs());
        DisconnectAll(spProducer_.get());
    }
}

TEST_F(ColorspaceTransformerTest, RefusesToUnfoldWithoutAProducer) {
    ColorspaceTransformer filter;
    ORVO_EXPECT_INTERNAL(filter.unFold(cpuOptions()), "producer");
    ORVO_EXPECT_INTERNAL(filter.unFold(OptimizationOptions()), "producer");
}

TEST_F(ColorspaceTransformerTest, ForwarderMakesATransformOnEachFrame) {
    ColorspaceTransformer filter;
    setCodes(filter, PROFILE_GRAY, PROFILE_LINEAR_SRGB); // which no other test asks for
    auto const spForwarder = unfold(filter, cpuOptions());
    EXPECT_EQ(nullptr, transformOfNode());
    auto const before = engineStatistics();
    spForwarder->forwardStuff();
    void* const pFirst = transformOfNode();
    EXPECT_NE(nullptr, pFirst);
    spForwarder->forwardStuff();
    EXPECT_EQ(pFirst, transformOfNode());
    EXPECT_EQ(4U, RecordingEngine::calls("ProfileFromCode"));
    EXPECT_EQ(4U, RecordingEngine::calls("UnReferenceProfile"));
    EXPECT_EQ(2U, RecordingEngine::calls("MakeColorTransform"));
    EXPECT_EQ(2U, RecordingEngine::calls("OptimizeTransform"));
    // The unoptimised ones; the optimised one goes on to the node.
    EXPECT_EQ(2U, RecordingEngine::calls("UnReferenceTransform"));
    EXPECT_EQ(before.nProfiles, engineStatistics().nProfiles);
    // One at most: what an earlier graph had made between the two spaces is the same one.
    EXPECT_GE(before.nTransforms + 1, engineStatistics().nTransforms);
    setCodes(filter, PROFILE_SRGB, PROFILE_DISPLAY_P3);
    spForwarder->forwardStuff();
    EXPECT_NE(pFirst, transformOfNode());
}

class CountingForwarder : public Internal::ParameterForwarder {
public:
    void forwardStuff() override { ++nRuns_; }
    int nRuns_ = 0;
};

TEST_F(ColorspaceTransformerTest, ForwarderRunsItsChildrenAndNotItsPairs) {
    ColorspaceTransformer filter;
    auto const spForwarder = unfold(filter, cpuOptions());
    auto const spChild = std::make_shared<CountingForwarder>();
    spForwarder->addChild(spChild);
    Parameter<int> source("a", 1, false);
    Parameter<int> destination("a", 2, false);
    spForwarder->addForward(source, destination);
    spForwarder->forwardStuff();
    EXPECT_EQ(1, spChild->nRuns_);
    EXPECT_EQ(2, destination.value());
}

TEST_F(ColorspaceTransformerTest, ForwarderNamesTheSourceBeforeTheDestination) {
    struct Row {
        std::uint32_t source_;
        std::uint32_t destination_;
        char const* pFails_;
        char const* pMessage_;
    };
    ColorspaceTransformer filter;
    auto const spForwarder = unfold(filter, cpuOptions());
    spForwarder->forwardStuff();
    void* const pTransform = transformOfNode();
    auto const before = engineStatistics();
    for (Row const& row :
         {Row{kUnknown, kUnknown, nullptr, kNoSource}, Row{kUnknown, PROFILE_SRGB, nullptr, kNoSource},
          Row{PROFILE_SRGB, kUnknown, nullptr, kNoDestination},
          Row{PROFILE_SRGB, PROFILE_BT_2020, "MakeColorTransform",
              "Cannot transform from source colorspace to destination colorspace"},
          Row{PROFILE_SRGB, PROFILE_BT_2020, "OptimizeTransform",
              "Cannot optimize the colorspace transformation"}}) {
        setCodes(filter, row.source_, row.destination_);
        if (row.pFails_ != nullptr)
            RecordingEngine::fail(row.pFails_);
        ORVO_EXPECT_INTERNAL(spForwarder->forwardStuff(), row.pMessage_);
        RecordingEngine::failNothing();
        // The node keeps what it had, and the engine nothing of what was begun.
        EXPECT_EQ(pTransform, transformOfNode());
        EXPECT_EQ(before.nProfiles, engineStatistics().nProfiles);
        EXPECT_EQ(before.nTransforms, engineStatistics().nTransforms);
    }
}

template <typename T>
void expectTheEnginesResult() {
    PackedColourGraph<T> graph(37, 23, {makeTransformer(PROFILE_SRGB, PROFILE_WIDE_GAMUT)});
    graph.oInput_.fillAtRandom(3);
    for (auto const& [source, destination] : {std::pair(PROFILE_SRGB, PROFILE_WIDE_GAMUT),
                                              {PROFILE_WIDE_GAMUT, PROFILE_SRGB},
                                              {PROFILE_DISPLAY_P3, PROFILE_BT_2020},
                                              {PROFILE_LINEAR_SRGB, PROFILE_SRGB}}) {
        setCodes(*graph.aFilters_.front(), source, destination);
        graph.spProcessor_->processFrame(cpuOptions());
        EXPECT_EQ(transformed(graph.oInput_.pixels(), source, destination), graph.oOutput_.pixels());
    }
}

TEST_F(ColorspaceTransformerTest, FramesFollowTheCodes) {
    expectTheEnginesResult<std::uint8_t>();
    expectTheEnginesResult<std::uint16_t>();
}

TEST_F(ColorspaceTransformerTest, NewCodesDoNotRebuildTheGraph) {
    static std::atomic<int> nCalls;
    nCalls = 0;
    PackedColourGraph<std::uint8_t> graph(8, 8, {makeTransformer(PROFILE_SRGB, PROFILE_WIDE_GAMUT)});
    graph.oInput_.fillAtRandom(4);
    graph.spProcessor_->processFrame(cpuOptions());
    // A callback lives on the compiled graph: it is still called if that was kept.
    graph.spProcessor_->setCompletionCallback([](void*) {
        ++nCalls;
        return true;
    });
    for (auto const code : {PROFILE_DISPLAY_P3, PROFILE_BT_2020}) {
        setCodes(*graph.aFilters_.front(), PROFILE_SRGB, code);
        graph.spProcessor_->asyncProcessFrame(cpuOptions());
        graph.spProcessor_->waitForFrame(60.0, 0.0005);
        EXPECT_EQ(transformed(graph.oInput_.pixels(), PROFILE_SRGB, code), graph.oOutput_.pixels());
    }
    EXPECT_EQ(2, nCalls);
}

TEST_F(ColorspaceTransformerTest, ThereAndBackIsWithinOne) {
    // In words nothing of the way is lost; 255 codes of a byte are 32768 steps of a word.
    PackedColourGraph<std::uint16_t> graph(64, 64,
                                           {makeTransformer(PROFILE_SRGB, PROFILE_WIDE_GAMUT),
                                            makeTransformer(PROFILE_WIDE_GAMUT, PROFILE_SRGB)});
    PackedImage<std::uint8_t> bytes(64, 64);
    bytes.fillAtRandom(5);
    auto const toWord = [](int byte) { return static_cast<std::uint16_t>((byte * 32768 + 127) / 255); };
    std::transform(bytes.pixels().begin(), bytes.pixels().end(), graph.oInput_.pixels().begin(), toWord);
    graph.spProcessor_->processFrame(cpuOptions());
    // 129 steps of a word are one of a byte: 32768 / 255 = 128.5.
    EXPECT_LE(largestDifference(graph.oInput_.pixels(), graph.oOutput_.pixels()), 128);
    EXPECT_GT(largestDifference(transformed(graph.oInput_.pixels(), PROFILE_SRGB, PROFILE_WIDE_GAMUT),
                                graph.oInput_.pixels()),
              1000);
}

TEST_F(ColorspaceTransformerTest, FramesWithUnknownCodesFailAndTheNextIsRight) {
    PackedColourGraph<std::uint8_t> graph(4, 4, {makeTransformer(kUnknown, kUnknown)});
    graph.oInput_.fillAtRandom(6);
    FilterPtr const& spFilter = graph.aFilters_.front();
    for (int i = 0; i < 2; ++i)
        ORVO_EXPECT_INTERNAL(graph.spProcessor_->processFrame(cpuOptions()), kNoSource);
    setCodes(*spFilter, PROFILE_SRGB, kUnknown);
    ORVO_EXPECT_INTERNAL(graph.spProcessor_->processFrame(cpuOptions()), kNoDestination);
    setCodes(*spFilter, PROFILE_SRGB, PROFILE_DISPLAY_P3);
    graph.spProcessor_->processFrame(cpuOptions());
    EXPECT_EQ(transformed(graph.oInput_.pixels(), PROFILE_SRGB, PROFILE_DISPLAY_P3), graph.oOutput_.pixels());
    setCodes(*spFilter, kUnknown, PROFILE_SRGB);
    ORVO_EXPECT_INTERNAL(graph.spProcessor_->processFrame(cpuOptions()), kNoSource);
}

TEST_F(ColorspaceTransformerTest, FloatImagesAreRefusedOnTheCPU) {
    FloatImage input(0, 0, 3, 3, 4);
    FloatImage output(0, 0, 3, 3, 4);
    FilterPtr const spFilter = std::make_shared<ColorspaceTransformer>();
    SourcePtr const spSource = makeSource(input);
    SinkPtr const spSink = makeSink(output);
    Connect(spSource, spFilter);
    Connect(spFilter, spSink);
    auto const spProcessor = createProcessor(spSink, nullptr);
    try {
        spProcessor->processFrame(cpuOptions());
        ADD_FAILURE() << "nothing thrown";
    } catch (std::exception const& error) { // a worker's failure comes wrapped
        EXPECT_NE(std::string::npos, std::string(error.what()).find("Invalid input image type"))
            << error.what();
    }
}

// 10,000 frames of 2 by 2 pixels, codes changed on every hundredth. Counted are tracked blocks and bytes, and
// the engine's objects; references on the transforms, which are never dropped, are not objects.
TEST_F(ColorspaceTransformerTest, TenThousandFramesLeaveNothing) {
    PackedColourGraph<std::uint8_t> graph(2, 2, {makeTransformer(PROFILE_SRGB, PROFILE_WIDE_GAMUT)});
    constexpr std::uint32_t aCodes[] = {PROFILE_WIDE_GAMUT, PROFILE_DISPLAY_P3, PROFILE_BT_2020};
    OptimizationOptions options = cpuOptions();
    options.setDebuggingMode(OptimizationOptions::DEBUGGING_SINGLE_THREAD);
    auto const frame = [&](int i) {
        setCodes(*graph.aFilters_.front(), PROFILE_SRGB, aCodes[i / 100 % 3]);
        graph.spProcessor_->processFrame(options);
    };
    for (int i = 0; i < 300; i += 50)
        frame(i);
    auto const counts = [] {
        EngineStatistics const engine = engineStatistics();
        return std::vector<std::size_t>{Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT),
                                        Core::MemoryStatistics::bytes(MEMORY_TYPE_OBJECT),
                                        Core::MemoryStatistics::blocks(MEMORY_TYPE_IMAGE),
                                        Core::MemoryStatistics::bytes(MEMORY_TYPE_IMAGE),
                                        engine.nProfiles,
                                        engine.nTransforms,
                                        engine.nShaders,
                                        engine.nStrings,
                                        engine.nErrors,
                                        engine.nBlocks,
                                        engine.nResolved};
    };
    auto const before = counts();
    for (int i = 0; i < 10000; ++i)
        frame(i);
    setCodes(*graph.aFilters_.front(), PROFILE_SRGB, aCodes[0]);
    EXPECT_EQ(before, counts());
}

TEST_F(ColorspaceTransformerTest, IsCreatedByTheFactory) {
    insertStandardFilters();
    FilterPtr const spCreated = FilterFactory::Instance()->create(
        IFilter::Identifier("ColorspaceTransformer", "com.norvane.orvo", "Norvane"));
    setCodes(*spCreated, PROFILE_SRGB, PROFILE_BT_2020);
    PackedColourGraph<std::uint8_t> graph(8, 8, {spCreated});
    graph.oInput_.fillAtRandom(7);
    graph.spProcessor_->processFrame(cpuOptions());
    EXPECT_EQ(transformed(graph.oInput_.pixels(), PROFILE_SRGB, PROFILE_BT_2020), graph.oOutput_.pixels());
    DisconnectAll(spCreated.get());
}

/// Before all layers come up.
struct WithFakeEngine {
    WithFakeEngine() {
        FakeEngine::reset();
        Core::Library::setQuorGetAddressProc(&FakeEngine::address);
    }
};

class ColorspaceTransformerFakeEngineTest : private WithFakeEngine, public UnfoldTest {};

TEST_F(ColorspaceTransformerFakeEngineTest, ForwarderCallsTheEngineInOrderAndHandsItsTransformOn) {
    using Calls = std::vector<std::string>;
    ColorspaceTransformer filter;
    setCodes(filter, 1, 2);
    auto const spForwarder = unfold(filter, cpuOptions());
    EXPECT_EQ(Calls(), FakeEngine::calls());
    spForwarder->forwardStuff();
    // The engine's profile of code n is 1000 + n, its transform 2000, the optimised one 3000.
    EXPECT_EQ((Calls{"ProfileFromCode 1", "ProfileFromCode 2", "MakeColorTransform 1001 1002 0 0",
                     "UnReferenceProfile 1002", "UnReferenceProfile 1001", "OptimizeTransform 2000 0",
                     "UnReferenceTransform 2000"}),
              FakeEngine::calls());
    EXPECT_EQ(FakeEngine::handle<void>(3000), transformOfNode());
}

struct WithoutEngine {
    WithoutEngine() { Core::Library::setQuorGetAddressProc(nullptr); }
};

class ColorspaceTransformerWithoutEngineTest : private WithoutEngine, public FrameTest {};

TEST_F(ColorspaceTransformerWithoutEngineTest, SaysSoAndEverythingElseWorks) {
    {
        PackedColourGraph<std::uint8_t> graph(4, 4, {makeTransformer(PROFILE_SRGB, PROFILE_BT_2020)});
        ORVO_EXPECT_INTERNAL(graph.spProcessor_->processFrame(cpuOptions()), kNoSource);
    }
    PackedColourGraph<std::uint8_t> graph(4, 4, {std::make_shared<Internal::Bilateral>()});
    for (auto& value : graph.oInput_.pixels())
        value = 200;
    graph.spProcessor_->processFrame(cpuOptions());
    EXPECT_LE(largestDifference(graph.oInput_.pixels(), graph.oOutput_.pixels()), 1);
}

} // namespace
} // namespace ORVO::FilterGraph
