// The compiled graph: which nodes it is made of, how they are wired, and how building fails.
#include "orvo/filter_graph/internal/GraphExecutable.h"

#include <algorithm>
#include <chrono>
#include <limits>

#include "orvo/data_flow/connectors/InputConnector.h"
#include "orvo/data_flow/connectors/OutputConnector.h"
#include "orvo/filter_graph/impl/FilterGraphLibrary.h"
#include "orvo/filter_graph/impl/ImageDescriptorGL.h"
#include "orvo/filter_graph/internal/ImageFlowFilterExecutable.h"
#include "orvo/filter_graph/internal/OutputAdapter.h"
#include "orvo/image_flow/controllers/ImageFlowController.h"
#include "orvo/ogl/Context.h"
#include "tests/support/Expect.h"
#include "tests/support/ExpectFilterGraph.h"
#include "tests/support/FrameTest.h"

namespace ORVO::FilterGraph::Internal {
namespace {

using namespace ORVO::Test;

class GraphExecutableTest : public FrameTest {
protected:
    void build(OptimizationOptions const& options = cpuOptions()) {
        pExecutable_ = std::make_unique<GraphExecutable>(spSink_->getIFilter(), options, nullptr);
    }

    void runFrame() {
        pExecutable_->propagateDOD();
        pExecutable_->propagateROI();
        pExecutable_->processFrame();
    }

    /// The connections of the graph, "producer -> consumer" by the names of the nodes, sorted.
    std::vector<std::string> wires() const {
        std::vector<std::string> aWires;
        auto const& spController = pExecutable_->controller();
        for (auto iNode = spController->nodesBegin(); iNode != spController->nodesEnd(); ++iNode) {
            for (std::size_t iInput = 0; iInput < (*iNode)->numberOfInputs(); ++iInput) {
                aWires.push_back((*iNode)->input(iInput)->connectedOutput()->node()->name() + " -> " +
                                 (*iNode)->name());
            }
        }
        std::sort(aWires.begin(), aWires.end());
        return aWires;
    }

    std::string sinkName() const { return pExecutable_->controller()->imageSink()->name(); }

    FloatImage oInput_{0, 0, 5, 3, 1, 2.0f};
    FloatImage oOutput_{0, 0, 5, 3, 1, -1.0f};
    SourcePtr spSource_ = makeSource(oInput_);
    SinkPtr spSink_ = makeSink(oOutput_);
    std::unique_ptr<GraphExecutable> pExecutable_;
};

using Wires = std::vector<std::string>;

TEST_F(GraphExecutableTest, APlainChainHasNoConverters) {
    FilterPtr const spGain = makeFilter<GainNode>();
    Connect(spSource_, spGain);
    Connect(spGain, spSink_);
    build();
    EXPECT_EQ(wires(), (Wires{"ImageCPUInput -> Gain"}));
    EXPECT_EQ(sinkName(), "Gain");
    EXPECT_TRUE(pExecutable_->options().equals(cpuOptions()));
    EXPECT_EQ(pExecutable_->outputPixelExtentInWorldSpace(), PixelExtentInWorldSpace(1.0f, 1.0f));
}

TEST_F(GraphExecutableTest, ASIMDFilterIsBracketedByConverters) {
    FilterPtr const spGain = makeFilter<SIMDGainNode>();
    setParameter(*spGain, "gain", 3.0f);
    Connect(spSource_, spGain);
    Connect(spGain, spSink_);
    build();
    EXPECT_EQ(wires(), (Wires{"ConvertToSIMDOptimized -> SIMDGain", "ImageCPUInput -> ConvertToSIMDOptimized",
                              "SIMDGain -> ConvertFromSIMDOptimized"}));
    EXPECT_EQ(sinkName(), "ConvertFromSIMDOptimized");
    runFrame();
    EXPECT_EQ(oOutput_.pixels(), std::vector<float>(15, 6.0f));
}

TEST_F(GraphExecutableTest, TwoSIMDFiltersInARowNeedNoConverterBetweenThem) {
    FilterPtr const spA = makeFilter<SIMDGainNode>();
    FilterPtr const spB = makeFilter<SIMDGainNode>();
    setParameter(*spA, "gain", 3.0f);
    setParameter(*spB, "gain", 5.0f);
    Connect(spSource_, spA);
    Connect(spA, spB);
    Connect(spB, spSink_);
    build();
    EXPECT_EQ(wires(), (Wires{"ConvertToSIMDOptimized -> SIMDGain", "ImageCPUInput -> ConvertToSIMDOptimized",
                              "SIMDGain -> ConvertFromSIMDOptimized", "SIMDGain -> SIMDGain"}));
    runFrame();
    EXPECT_EQ(oOutput_.pixels(), std::vector<float>(15, 30.0f));
}

// The source feeds a plain filter first, so its output is taken when the converter for the SIMD filters is
// hung on: it goes on a cloned output, and the two SIMD filters share it through a clone of its own.
TEST_F(GraphExecutableTest, TheSIMDConsumersOfAProducerShareAConverter) {
    FilterPtr const spPlain = makeFilter<GainNode>();
    FilterPtr const spA = makeFilter<SIMDGainNode>();
    FilterPtr const spB = makeFilter<SIMDGainNode>();
    FilterPtr const spMix1 = makeFilter<MixNode>();
    FilterPtr const spMix2 = makeFilter<MixNode>();
    setParameter(*spPlain, "gain", 10.0f);
    setParameter(*spA, "gain", 20.0f);
    setParameter(*spB, "gain", 40.0f);
    Connect(spSource_, spPlain);
    Connect(spSource_, spA);
    Connect(spSource_, spB);
    Connect(spPlain, spMix1->input("a"));
    Connect(spA, spMix1->input("b"));
    Connect(spMix1, spMix2->input("a"));
    Connect(spB, spMix2->input("b"));
    Connect(spMix2, spSink_);
    build();
    EXPECT_EQ(wires(), (Wires{"ConvertFromSIMDOptimized -> Mix", "ConvertFromSIMDOptimized -> Mix",
                              "ConvertToSIMDOptimized -> SIMDGain", "ConvertToSIMDOptimized -> SIMDGain",
                              "Gain -> Mix", "ImageCPUInput -> ConvertToSIMDOptimized",
                              "ImageCPUInput -> Gain", "Mix -> Mix", "SIMDGain -> ConvertFromSIMDOptimized",
                              "SIMDGain -> ConvertFromSIMDOptimized"}));
    runFrame();
    // ((2 * 10 + 2 * 20) / 2 + 2 * 40) / 2
    EXPECT_EQ(oOutput_.pixels(), std::vector<float>(15, 55.0f));
    oInput_.pixels().assign(15, 4.0f);
    runFrame();
    EXPECT_EQ(oOutput_.pixels(), std::vector<float>(15, 110.0f));
}

TEST_F(GraphExecutableTest, ThePlainConsumersOfASIMDProducerShareAConverter) {
    FilterPtr const spSIMD = makeFilter<SIMDGainNode>();
    FilterPtr const spAnother = makeFilter<SIMDGainNode>();
    FilterPtr const spMix1 = makeFilter<MixNode>();
    FilterPtr const spMix2 = makeFilter<MixNode>();
    setParameter(*spSIMD, "gain", 2.0f);
    setParameter(*spAnother, "gain", 3.0f);
    Connect(spSource_, spSIMD);
    Connect(spSIMD, spAnother);
    Connect(spSIMD, spMix1->input("a"));
    Connect(spSIMD, spMix1->input("b"));
    Connect(spMix1, spMix2->input("a"));
    Connect(spAnother, spMix2->input("b"));
    Connect(spMix2, spSink_);
    build();
    EXPECT_EQ(wires(), (Wires{"ConvertFromSIMDOptimized -> Mix", "ConvertFromSIMDOptimized -> Mix",
                              "ConvertFromSIMDOptimized -> Mix", "ConvertToSIMDOptimized -> SIMDGain",
                              "ImageCPUInput -> ConvertToSIMDOptimized", "Mix -> Mix",
                              "SIMDGain -> ConvertFromSIMDOptimized", "SIMDGain -> ConvertFromSIMDOptimized",
                              "SIMDGain -> SIMDGain"}));
    runFrame();
    EXPECT_EQ(oOutput_.pixels(), std::vector<float>(15, 8.0f)); // (4 + 12) / 2
}

TEST_F(GraphExecutableTest, OneProducerMayFeedBothInputsOfAFilter) {
    FilterPtr const spMix = makeFilter<MixNode>();
    Connect(spSource_, spMix->input("a"));
    Connect(spSource_, spMix->input("b"));
    Connect(spMix, spSink_);
    build();
    EXPECT_EQ(wires(), (Wires{"ImageCPUInput -> Mix", "ImageCPUInput -> Mix"}));
    runFrame();
    EXPECT_EQ(oOutput_.pixels(), std::vector<float>(15, 2.0f));
}

TEST_F(GraphExecutableTest, AGeneratorTakesThePixelExtentOfTheOutput) {
    FloatImage fine(0, 0, 4, 2, 1, 0.0f, PixelExtentInWorldSpace(0.5f, 0.25f));
    spSink_->setImage(fine.handle());
    FilterPtr const spGenerator = makeFilter<GeneratorNode>();
    FilterPtr const spGain = makeFilter<GainNode>();
    Connect(spGenerator, spGain);
    Connect(spGain, spSink_);
    build();
    EXPECT_EQ(pExecutable_->outputPixelExtentInWorldSpace(), PixelExtentInWorldSpace(0.5f, 0.25f));
    runFrame();
    EXPECT_EQ(fine.pixels(), (std::vector<float>{0.0f, 0.5f, 1.0f, 1.5f, 1.0f, 1.5f, 2.0f, 2.5f}));
}

TEST_F(GraphExecutableTest, ABlurReadsBeyondItsRegion) {
    // The middle pixel alone is asked for; its neighbours are needed.
    FloatImage middle(2, 1, 1, 1);
    spSink_->setImage(middle.handle());
    for (int y = 0; y < 3; ++y) {
        for (int x = 0; x < 5; ++x) {
            oInput_.at(x, y) = static_cast<float>(x + 5 * y);
        }
    }
    FilterPtr const spBlur = makeFilter<BlurNode>();
    FilterPtr const spGain = makeFilter<GainNode>();
    Connect(spSource_, spGain);
    Connect(spGain, spBlur);
    Connect(spBlur, spSink_);
    build();
    runFrame();
    EXPECT_EQ(middle.at(2, 1), 7.0f);
    EXPECT_EQ(spSource_->getDomainOfDefinition(), PositionExtentInWorldSpace(ExtentInWorldSpace(5.0f, 3.0f)));
}

// ---- Options

TEST_F(GraphExecutableTest, RefusesWhatIsNoOutput) {
    ORVO_EXPECT_INTERNAL(GraphExecutable(spSource_->getIFilter(), cpuOptions(), nullptr),
                         "Enforce pOutput_ != NULL");
    ORVO_EXPECT_INTERNAL(GraphExecutable(nullptr, cpuOptions(), nullptr), "Enforce pOutput_ != NULL");
}

/// A context that is never made current.
class IdleContext : public OGL::Context {
public:
    void makeCurrent() const override { ADD_FAILURE() << "the context was made current"; }
    bool isSharingWithCurrentContext() const override { return false; }
};

TEST_F(GraphExecutableTest, AContextIsRefusedByALibraryThatWasStartedWithoutOne) {
    Connect(spSource_, spSink_);
    IdleContext const context;
    for (OptimizationOptions const& options : {cpuOptions(), OptimizationOptions()}) {
        ORVO_EXPECT_INTERNAL(GraphExecutable(spSink_->getIFilter(), options, &context),
                             "!ORVO::ImageFlow::Library::cpuOnlyMode()");
    }
}

TEST_F(GraphExecutableTest, RefusesAProcessingModeThatDoesNotExist) {
    Connect(spSource_, spSink_);
    OptimizationOptions options;
    options.setProcessingMode(static_cast<OptimizationOptions::eProcessingMode>(2));
    ORVO_EXPECT_INTERNAL(build(options), "!\"unsupported processing mode!\"");
}

TEST_F(GraphExecutableTest, ReportsMistakesOfTheGraph) {
    ORVO_EXPECT_FILTERGRAPH(build(), "::InputImage is not connected");
}

TEST_F(GraphExecutableTest, AConsumerThatTheOutputDoesNotReachHasNoExecutable) {
    FilterPtr const spElsewhere = makeFilter<GainNode>();
    Connect(spSource_, spElsewhere);
    Connect(spSource_, spSink_);
    ORVO_EXPECT_INTERNAL(build(), "Enforce pFilterExecutable != NULL");
}

// ---- The OpenGL road

/// A client image that claims to be a texture.
class TextureHandle : public FilterGraph::ImageBase {
public:
    TextureHandle()
        : ImageBase(ImageDescriptorGL({1, ImageDescriptor::CHANNEL_TYPE_FLOAT32}, PixelExtentInWorldSpace()),
                    PositionExtentInPixelSpace(ExtentInPixelSpace(5, 3))) {}
    ~TextureHandle() override = default;
    void clear() override {}
};

TEST_F(GraphExecutableTest, AnOutputInOpenGLMemoryGetsAnUpload) {
    TextureHandle texture;
    spSink_->setImage(&texture);
    Connect(spSource_, spSink_);
    build();
    EXPECT_EQ(wires(), (Wires{"ImageCPUInput -> CPU2GPU"}));
    EXPECT_EQ(sinkName(), "CPU2GPU");
}

// A SIMD output that goes to a texture gets the one conversion of its layout, with no upload behind it.
TEST_F(GraphExecutableTest, ASIMDOutputInOpenGLMemoryGetsNoUpload) {
    TextureHandle texture;
    spSink_->setImage(&texture);
    FilterPtr const spGain = makeFilter<SIMDGainNode>();
    Connect(spSource_, spGain);
    Connect(spGain, spSink_);
    build();
    EXPECT_EQ(sinkName(), "ConvertFromSIMDOptimized");
}

/// A filter in host memory whose input is on OpenGL, for the wiring alone.
class HardwareGain : public GainNode {
public:
    HardwareGain() { inputTarget_ = ORVO_TARGET_GL; }
    bool willRunInHardware() override { return true; }
};

TEST_F(GraphExecutableTest, AnUploadNeedsAnInputThatTakesTextures) {
    ImageFlowFilter<HardwareGain> filter(IFilter::Identifier("gl", "test", "ORVO", 1), ORVO_TARGET_GL);
    filter.initialize();
    FilterPtr const spGain = filter.clone();
    Connect(spSource_, spGain);
    Connect(spGain, spSink_);
    ORVO_EXPECT_INTERNAL(build(OptimizationOptions()), "pDstConnector->canConnect(pSrcConnector)");
}

/// A generator that says that it runs in OpenGL, so that a whole graph of that mode can be built.
class HardwareGenerator : public GeneratorNode {
public:
    HardwareGenerator() { outputTarget_ = ORVO_TARGET_GL; }
    bool willRunInHardware() override { return true; }
};

TEST_F(GraphExecutableTest, TheIntermediatePrecisionReplacesDefaultHints) {
    using Options = OptimizationOptions;
    ImageFlowFilter<HardwareGenerator> filter(IFilter::Identifier("gl", "test", "ORVO", 1), ORVO_TARGET_GL);
    filter.initialize();
    TextureHandle texture;
    spSink_->setImage(&texture);
    FilterPtr const spGenerator = filter.clone();
    Connect(spGenerator, spSink_);
    struct Row {
        int precision;
        ImageFilter::teOutputPrecisionHint eHint;
        char const* sFailure;
    };
    char const* const kNoData = "(pSink->imageOutput()->hasData()) == true";
    for (Row const& row : {Row{0, ImageFilter::OUTPUT_PRECISION_DEFAULT, kNoData},
                           Row{1, ImageFilter::OUTPUT_PRECISION_16_BIT_FLOAT, kNoData},
                           Row{2, ImageFilter::OUTPUT_PRECISION_32_BIT_FLOAT, kNoData},
                           Row{3, ImageFilter::OUTPUT_PRECISION_DEFAULT,
                               "Not implemented: This intermediate buffer precision is not supported\n"}}) {
        Options options;
        options.setIntermediateBufferPrecision(
            static_cast<Options::eIntermediateBufferPrecision>(row.precision));
        build(options); // a precision that does not exist is found at the launch
        ImageFilter& node = *pExecutable_->controller()->imageSink();
        ASSERT_EQ(node.outputPrecisionHintParameter().value(), ImageFilter::OUTPUT_PRECISION_DEFAULT);
        // The graph has no image to render into, so every launch fails after the hints were set.
        ORVO_EXPECT_INTERNAL(pExecutable_->processFrame(), row.sFailure);
        EXPECT_EQ(node.outputPrecisionHintParameter().value(), row.eHint);
        node.outputPrecisionHintParameter().setValue(ImageFilter::OUTPUT_PRECISION_8_BIT_INT);
        EXPECT_THROW(pExecutable_->processFrame(), InternalException);
        EXPECT_EQ(node.outputPrecisionHintParameter().value(), ImageFilter::OUTPUT_PRECISION_8_BIT_INT);
    }
}

TEST_F(GraphExecutableTest, TheIntermediatePrecisionIsForImageNodes) {
    ImageFlowFilter<HardwareGenerator> filter(IFilter::Identifier("gl", "test", "ORVO", 1), ORVO_TARGET_GL);
    filter.initialize();
    TextureHandle texture;
    spSink_->setImage(&texture);
    FilterPtr const spGenerator = filter.clone();
    Connect(spGenerator, spSink_);
    build(OptimizationOptions());
    DataFlow::Node stranger("stranger");
    pExecutable_->controller()->addNode(&stranger);
    ORVO_EXPECT_INTERNAL(pExecutable_->processFrame(), "iff!=0");
    pExecutable_.reset();
}

// ---- Frames

TEST_F(GraphExecutableTest, KnowsWhetherAFrameIsComplete) {
    Connect(spSource_, spSink_);
    build();
    EXPECT_TRUE(pExecutable_->isProcessingComplete()) << "no frame is out";
    runFrame();
    EXPECT_TRUE(pExecutable_->isProcessingComplete());
    EXPECT_EQ(pExecutable_->asyncProcessFrame(), pExecutable_.get());
    EXPECT_TRUE(pExecutable_->waitForFrame(60.0, 0.001));
    EXPECT_TRUE(pExecutable_->isProcessingComplete());
}

TEST_F(GraphExecutableTest, SleepsAsLongAsItIsTold) {
    Connect(spSource_, spSink_);
    build();
    auto const start = std::chrono::steady_clock::now();
    pExecutable_->sleep(0.01);
    EXPECT_GE(std::chrono::steady_clock::now() - start, std::chrono::milliseconds(10));
}

TEST_F(GraphExecutableTest, AnInfiniteRegionIsRefused) {
    class InfiniteNode : public GeneratorNode {
    public:
        PositionExtentInWorldSpace generated(RegionMap const&) override {
            float const inf = std::numeric_limits<float>::infinity();
            return PositionExtentInWorldSpace(ExtentInWorldSpace(inf, inf));
        }
    };
    FilterPtr const spGenerator = makeFilter<InfiniteNode>();
    SinkPtr const spExplicit = makeSink(oOutput_, IAdapter::REGION_SYNC_EXPLICIT);
    Connect(spGenerator, spExplicit);
    auto const spProcessor = createEmbeddedProcessor(spExplicit, nullptr);
    spProcessor->prepareForProcessing(cpuOptions());
    spProcessor->propagateDomainsOfDefinition();
    float const inf = std::numeric_limits<float>::infinity();
    spExplicit->setRegionOfInterest(PositionExtentInWorldSpace(ExtentInWorldSpace(inf, inf)));
    ORVO_EXPECT_INTERNAL(spProcessor->propagateRegionOfInterest(), "Output region can't be infinite.");
    spExplicit->setRegionOfInterest(PositionExtentInWorldSpace(ExtentInWorldSpace(5.0f, 3.0f)));
    spProcessor->processFrameEmbedded(cpuOptions());
    EXPECT_EQ(oOutput_.at(4, 2), 4.0f);
}

} // namespace
} // namespace ORVO::FilterGraph::Internal
