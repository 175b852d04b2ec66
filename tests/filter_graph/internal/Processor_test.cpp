// The compiled state of a processor: what builds it, what keeps it, what throws it away, and how it fails.
#include "orvo/filter_graph/internal/Processor.h"

#include <atomic>

#include "orvo/filter_graph/impl/Parameter.h"
#include "orvo/filter_graph/internal/Connect.h"
#include "orvo/filter_graph/internal/OutputAdapter.h"
#include "orvo/filter_graph/internal/StandardProcessor.h"
#include "orvo/ogl/Context.h"
#include "tests/support/Expect.h"
#include "tests/support/ExpectFilterGraph.h"
#include "tests/support/FrameTest.h"

namespace ORVO::FilterGraph {
namespace {

using namespace ORVO::Test;

/// source -> gain -> sink, 2 by 2 pixels.
class ProcessorTest : public FrameTest {
protected:
    ProcessorTest() {
        oInput_.pixels() = {1.0f, 2.0f, 3.0f, 4.0f};
        setParameter(*spGain_, "gain", 10.0f);
        Connect(spSource_, spGain_);
        Connect(spGain_, spSink_);
    }

    void run() { spProcessor_->processFrame(cpuOptions()); }

    /// A callback lives on the compiled graph: whether it is still called tells whether that was kept.
    static bool countCall(void*) {
        ++nCalls_;
        return true;
    }

    bool callbackSurvives() {
        nCalls_ = 0;
        spProcessor_->asyncProcessFrame(cpuOptions());
        spProcessor_->waitForFrame(10.0, 0.001);
        return nCalls_ == 1;
    }

    static inline std::atomic<int> nCalls_{0};

    FloatImage oInput_{2, 2};
    FloatImage oOutput_{2, 2};
    SourcePtr spSource_ = makeSource(oInput_);
    FilterPtr spGain_ = makeFilter<GainNode>("gain");
    SinkPtr spSink_ = makeSink(oOutput_);
    std::shared_ptr<IProcessor> spProcessor_ = createProcessor(spSink_, nullptr);
};

TEST_F(ProcessorTest, ComputesAFrameIntoTheBoundImage) {
    EXPECT_EQ(spProcessor_->frameStatus(), IProcessorBase::FRAME_NONE);
    run();
    EXPECT_EQ(oOutput_.pixels(), (std::vector<float>{10.0f, 20.0f, 30.0f, 40.0f}));
    EXPECT_EQ(spProcessor_->frameStatus(), IProcessorBase::FRAME_COMPLETE);
}

TEST_F(ProcessorTest, TheAdaptersLearnTheirRegions) {
    run();
    EXPECT_EQ(spSink_->getDomainOfDefinition(), PositionExtentInWorldSpace(ExtentInWorldSpace(2.0f, 2.0f)));
    EXPECT_EQ(spSource_->getRegionOfInterest(), PositionExtentInWorldSpace(ExtentInWorldSpace(2.0f, 2.0f)));
}

TEST_F(ProcessorTest, NeedsAContextForOpenGLBeforeItLooksAtTheGraph) {
    Disconnect(spGain_->input("input"));
    OptimizationOptions const openGL;
    ASSERT_EQ(openGL.processingMode(), OptimizationOptions::FULL_OPTIMIZATION);
    ORVO_EXPECT_INTERNAL(spProcessor_->processFrame(openGL),
                         "Processing with FULL_OPTIMIZATION needs valid GL context.");
    ORVO_EXPECT_INTERNAL(spProcessor_->asyncProcessFrame(openGL),
                         "Processing with FULL_OPTIMIZATION needs valid GL context.");
    EXPECT_EQ(spProcessor_->frameStatus(), IProcessorBase::FRAME_NONE);
}

TEST_F(ProcessorTest, RefusesAnAdapterThatIsNull) {
    ORVO_EXPECT_INTERNAL(createProcessor(nullptr, nullptr), "Enforce pOriginalGraph_ != NULL");
    ORVO_EXPECT_INTERNAL(createEmbeddedProcessor(nullptr, nullptr), "Enforce pOriginalGraph_ != NULL");
}

TEST_F(ProcessorTest, RefusesAProcessingModeThatDoesNotExist) {
    OptimizationOptions options;
    options.setProcessingMode(static_cast<OptimizationOptions::eProcessingMode>(2));
    ORVO_EXPECT_INTERNAL(spProcessor_->processFrame(options), "!\"unsupported processing mode!\"");
    run();
    EXPECT_EQ(oOutput_.at(1, 1), 40.0f);
}

TEST_F(ProcessorTest, MostOperationsNeedACompiledGraph) {
    ORVO_EXPECT_INTERNAL(spProcessor_->waitForFrame(0.0, 0.0), "Enforce spGraphExecutable_ != NULL");
    ORVO_EXPECT_INTERNAL(spProcessor_->cancelFrame(), "Enforce spGraphExecutable_ != NULL");
    ORVO_EXPECT_INTERNAL(spProcessor_->sleep(0.0), "Enforce spGraphExecutable_ != NULL");
    ORVO_EXPECT_INTERNAL(spProcessor_->setCompletionCallback(nullptr), "Enforce spGraphExecutable_ != NULL");
    auto const spEmbedded = createEmbeddedProcessor(spSink_, nullptr);
    ORVO_EXPECT_INTERNAL(spEmbedded->propagateDomainsOfDefinition(), "Enforce spGraphExecutable_ != NULL");
    ORVO_EXPECT_INTERNAL(spEmbedded->propagateRegionOfInterest(), "Enforce spGraphExecutable_ != NULL");
    EXPECT_EQ(spProcessor_->frameStatus(), IProcessorBase::FRAME_NONE);
}

TEST_F(ProcessorTest, HandsOutTheEndOfTheClientGraph) {
    auto* const pOutput = dynamic_cast<Internal::OutputAdapter*>(spSink_.get());
    Internal::Processor processor(pOutput, IAdapter::REGION_SYNC_FROM_IMAGE, nullptr);
    EXPECT_EQ(processor.output(), spSink_.get());
}

// ---- What keeps the compiled graph

TEST_F(ProcessorTest, KeepsTheCompiledGraphWhileNothingChanges) {
    run();
    spProcessor_->setCompletionCallback(countCall);
    EXPECT_TRUE(callbackSurvives());
    EXPECT_TRUE(callbackSurvives());
}

TEST_F(ProcessorTest, AChangedParameterRebuildsNothingAndReachesTheNode) {
    run();
    spProcessor_->setCompletionCallback(countCall);
    setParameter(*spGain_, "gain", 100.0f);
    EXPECT_TRUE(callbackSurvives());
    EXPECT_EQ(oOutput_.pixels(), (std::vector<float>{100.0f, 200.0f, 300.0f, 400.0f}));
}

TEST_F(ProcessorTest, ALikeImageRebuildsNothing) {
    run();
    spProcessor_->setCompletionCallback(countCall);
    FloatImage other(2, 2);
    other.pixels() = {5.0f, 6.0f, 7.0f, 8.0f};
    FloatImage otherOutput(2, 2);
    spSource_->setImage(other.handle());
    spSink_->setImage(otherOutput.handle());
    EXPECT_TRUE(callbackSurvives());
    EXPECT_EQ(otherOutput.pixels(), (std::vector<float>{50.0f, 60.0f, 70.0f, 80.0f}));
    EXPECT_EQ(oOutput_.pixels(), (std::vector<float>{10.0f, 20.0f, 30.0f, 40.0f}));
}

TEST_F(ProcessorTest, AnImageOfAnotherFormRebuilds) {
    run();
    FloatImage fine(0, 0, 4, 4, 1, 3.0f, PixelExtentInWorldSpace(0.5f, 0.5f));
    FloatImage fineOutput(0, 0, 4, 4, 1, 0.0f, PixelExtentInWorldSpace(0.5f, 0.5f));
    FloatImage rgba(0, 0, 2, 2, 4, 2.0f);
    FloatImage rgbaOutput(0, 0, 2, 2, 4);
    for (auto const& [pInput, pOutput, value] :
         {std::tuple(&fine, &fineOutput, 30.0f), std::tuple(&rgba, &rgbaOutput, 20.0f)}) {
        spProcessor_->setCompletionCallback(countCall);
        spSource_->setImage(pInput->handle());
        spSink_->setImage(pOutput->handle());
        EXPECT_FALSE(callbackSurvives());
        EXPECT_EQ(pOutput->pixels(), std::vector<float>(pOutput->pixels().size(), value));
    }
}

TEST_F(ProcessorTest, AnImageOfAnotherChannelTypeRebuilds) {
    run();
    spProcessor_->setCompletionCallback(countCall);
    std::vector<unsigned char> bytes(4, 7);
    ImageCPU image(ImageDescriptorCPU({1, ImageDescriptor::CHANNEL_TYPE_UINT8}, PixelExtentInWorldSpace()),
                   PositionExtentInPixelSpace(ExtentInPixelSpace(2, 2)), bytes.data(), 0);
    spSource_->setImage(&image);
    EXPECT_FALSE(callbackSurvives());
    EXPECT_EQ(oOutput_.pixels(), std::vector<float>(4, 70.0f));
}

TEST_F(ProcessorTest, EachOptionRebuildsAndGivesTheSamePixels) {
    using Options = OptimizationOptions;
    Options a = cpuOptions();
    a.setConcatenationMode(Options::CONCATENATION_OFF);
    Options b = cpuOptions();
    b.setDebuggingMode(Options::DEBUGGING_SINGLE_THREAD);
    Options c = cpuOptions();
    c.setCachingMode(Options::CACHING_OFF);
    Options d = cpuOptions();
    d.setIntermediateBufferPrecision(Options::INTERMEDIATE_PRECISION_32_BIT_FLOAT);
    for (Options const& options : {a, b, c, d}) {
        run();
        spProcessor_->setCompletionCallback(countCall);
        nCalls_ = 0;
        oOutput_.pixels().assign(4, 0.0f);
        spProcessor_->asyncProcessFrame(options);
        spProcessor_->waitForFrame(10.0, 0.001);
        EXPECT_EQ(nCalls_, 0) << "the callback of the old graph was called";
        EXPECT_EQ(oOutput_.pixels(), (std::vector<float>{10.0f, 20.0f, 30.0f, 40.0f}));
    }
}

TEST_F(ProcessorTest, AnUnknownIntermediatePrecisionIsNotLookedAtOnTheCPU) {
    OptimizationOptions options = cpuOptions();
    options.setIntermediateBufferPrecision(static_cast<OptimizationOptions::eIntermediateBufferPrecision>(3));
    spProcessor_->processFrame(options);
    EXPECT_EQ(oOutput_.at(0, 1), 30.0f);
}

TEST_F(ProcessorTest, ANewConnectionRebuilds) {
    run();
    spProcessor_->setCompletionCallback(countCall);
    auto const spAdd = makeFilter<AddConstantNode>();
    setParameter(*spAdd, "value", 0.5f);
    Connect(spSource_, spAdd);
    Connect(spAdd, spGain_->input("input"));
    EXPECT_FALSE(callbackSurvives());
    EXPECT_EQ(oOutput_.pixels(), (std::vector<float>{15.0f, 25.0f, 35.0f, 45.0f}));
}

TEST_F(ProcessorTest, ADisconnectionAndTheSameConnectionAgainRebuild) {
    run();
    spProcessor_->setCompletionCallback(countCall);
    Disconnect(spGain_->input("input"));
    Connect(spSource_, spGain_);
    EXPECT_FALSE(callbackSurvives());
}

// ---- Mistakes in the graph

TEST_F(ProcessorTest, NamesAnUnconnectedInputAndRunsOnceItIsConnected) {
    run();
    Disconnect(spGain_->input("input"));
    for (int attempt = 0; attempt < 2; ++attempt) {
        ORVO_EXPECT_FILTERGRAPH(run(), "gain::input is not connected");
    }
    Connect(spSource_, spGain_);
    oOutput_.pixels().assign(4, 0.0f);
    run();
    EXPECT_EQ(oOutput_.at(1, 1), 40.0f);
}

TEST_F(ProcessorTest, NamesACycleAndRunsOnceItIsGone) {
    auto const spAdd = makeFilter<AddConstantNode>("add");
    Connect(spGain_, spAdd);
    Connect(spAdd, spGain_);
    for (int attempt = 0; attempt < 2; ++attempt) {
        ORVO_EXPECT_FILTERGRAPH(run(), "gain: circular reference detected in filter");
    }
    Disconnect(spAdd->input("input"));
    Connect(spSource_, spGain_);
    run();
    EXPECT_EQ(oOutput_.at(1, 1), 40.0f);
}

TEST_F(ProcessorTest, AConnectedSinkAloneIsNotEnough) {
    FloatImage output(2, 2);
    SinkPtr const spLonely = makeSink(output);
    ORVO_EXPECT_FILTERGRAPH(createProcessor(spLonely, nullptr)->processFrame(cpuOptions()),
                            "::InputImage is not connected");
}

TEST_F(ProcessorTest, RefusesABranchThatDoesNotReachItsOutput) {
    auto const spElsewhere = makeFilter<GainNode>();
    Connect(spSource_, spElsewhere);
    ORVO_EXPECT_INTERNAL(run(), "Enforce pConsumerClone != NULL");
    ORVO_EXPECT_INTERNAL(run(), "Enforce pConsumerClone != NULL");
    Disconnect(spElsewhere->input("input"));
    run();
    EXPECT_EQ(oOutput_.at(1, 1), 40.0f);
}

TEST_F(ProcessorTest, RefusesAFilterForAnotherTargetAndRunsOnceItIsReplaced) {
    Internal::ImageFlowFilter<GainNode> prototype(IFilter::Identifier("gpu", "test", "ORVO", 1),
                                                  ORVO_TARGET_GL);
    prototype.initialize();
    FilterPtr const spOther = prototype.clone();
    Connect(spSource_, spOther);
    Connect(spOther, spGain_->input("input"));
    ORVO_EXPECT_INTERNAL(run(), "Filter will not run on selected target!");
    ORVO_EXPECT_INTERNAL(run(), "Filter will not run on selected target!");
    DisconnectAll(spOther.get());
    Connect(spSource_, spGain_);
    run();
    EXPECT_EQ(oOutput_.at(1, 1), 40.0f);
}

TEST_F(ProcessorTest, AFilterThatDiedLeavesItsConsumerUnconnected) {
    {
        auto const spAdd = makeFilter<AddConstantNode>();
        Connect(spSource_, spAdd);
        Connect(spAdd, spGain_->input("input"));
        run();
        EXPECT_EQ(oOutput_.at(0, 0), 20.0f);
        setParameter(*spAdd, "value", 3.0f);
    }
    ORVO_EXPECT_FILTERGRAPH(run(), "gain::input is not connected");
    Connect(spSource_, spGain_);
    run();
    EXPECT_EQ(oOutput_.at(0, 0), 10.0f);
}

// ---- Images

TEST_F(ProcessorTest, AFrameNeedsImages) {
    run();
    spSource_->setImage(nullptr);
    ORVO_EXPECT_INTERNAL(run(), "Enforce image_ != NULL");
    spSource_->setImage(oInput_.handle());
    run();
    spSink_->setImage(nullptr);
    ORVO_EXPECT_INTERNAL(run(), "Enforce image_ != NULL");
    ORVO_EXPECT_INTERNAL(spProcessor_->asyncProcessFrame(cpuOptions()),
                         "pOriginalGraph_ && pOriginalGraph_->getImage()");
    spSink_->setImage(oOutput_.handle());
    run();
    EXPECT_EQ(oOutput_.at(1, 1), 40.0f);
}

TEST_F(ProcessorTest, AnOutputImageWithoutPixelsFailsTheLaunchAndLeavesTheOldPixelsAlone) {
    run();
    setParameter(*spGain_, "gain", 2.0f);
    ImageCPU const* const pPixels = oOutput_.handle();
    ImageCPU empty(ImageDescriptorCPU({1, ImageDescriptor::CHANNEL_TYPE_FLOAT32}, PixelExtentInWorldSpace()),
                   pPixels->rect(), nullptr, 0);
    spSink_->setImage(&empty);
    ORVO_EXPECT_INTERNAL(run(), "(pSink->imageOutput()->hasData()) == true");
    ORVO_EXPECT_INTERNAL(spProcessor_->asyncProcessFrame(cpuOptions()),
                         "(pSink->imageOutput()->hasData()) == true");
    EXPECT_EQ(oOutput_.pixels(), (std::vector<float>{10.0f, 20.0f, 30.0f, 40.0f}));
    spSink_->setImage(oOutput_.handle());
    run();
    EXPECT_EQ(oOutput_.pixels(), (std::vector<float>{2.0f, 4.0f, 6.0f, 8.0f}));
}

TEST_F(ProcessorTest, AnInputImageWithoutPixelsFailsTheLaunch) {
    ImageCPU empty(ImageDescriptorCPU({1, ImageDescriptor::CHANNEL_TYPE_FLOAT32}, PixelExtentInWorldSpace()),
                   oInput_.handle()->rect(), nullptr, 0);
    spSource_->setImage(&empty);
    ORVO_EXPECT_INTERNAL(run(), "No ImageCPU set yet.");
    spSource_->setImage(oInput_.handle());
    run();
    EXPECT_EQ(oOutput_.at(1, 1), 40.0f);
}

TEST_F(ProcessorTest, ASourceStraightIntoASinkCopies) {
    Disconnect(spGain_->input("input"));
    DisconnectAll(spSink_->getIFilter());
    Connect(spSource_, spSink_);
    run();
    EXPECT_EQ(oOutput_.pixels(), (std::vector<float>{1.0f, 2.0f, 3.0f, 4.0f}));
}

TEST_F(ProcessorTest, AnAdapterOfTheOtherModeFailsInThePropagation) {
    SourcePtr const spExplicit = makeSource(oInput_, IAdapter::REGION_SYNC_EXPLICIT);
    spExplicit->setDomainOfDefinition(PositionExtentInWorldSpace(ExtentInWorldSpace(2.0f, 2.0f)));
    Connect(spExplicit, spGain_);
    ORVO_EXPECT_INTERNAL(run(), "adapterOriginal->mode() == regionSyncMode_");
    auto const spEmbedded = createEmbeddedProcessor(spSink_, nullptr);
    spEmbedded->prepareForProcessing(cpuOptions());
    ORVO_EXPECT_INTERNAL(spEmbedded->propagateDomainsOfDefinition(),
                         "adapterOriginal->mode() == regionSyncMode_");
    ORVO_EXPECT_INTERNAL(spEmbedded->propagateRegionOfInterest(),
                         "adapterOriginal->mode() == regionSyncMode_");
}

TEST_F(ProcessorTest, TwoProcessorsOnOneGraphKeepApart) {
    run();
    auto const spOther = createProcessor(spSink_, nullptr);
    oOutput_.pixels().assign(4, 0.0f);
    spOther->processFrame(cpuOptions());
    EXPECT_EQ(oOutput_.at(1, 1), 40.0f);
    setParameter(*spGain_, "gain", 3.0f);
    run();
    EXPECT_EQ(oOutput_.at(1, 1), 12.0f);
    spOther->processFrame(cpuOptions());
    EXPECT_EQ(oOutput_.at(1, 1), 12.0f);
}

TEST_F(ProcessorTest, AChainOfAThousandFilters) {
    std::vector<FilterPtr> aChain;
    for (int i = 0; i < 1000; ++i) {
        aChain.push_back(makeFilter<AddConstantNode>());
        if (i > 0) {
            Connect(aChain[static_cast<std::size_t>(i) - 1], aChain.back());
        }
    }
    Connect(spSource_, aChain.front());
    Connect(aChain.back(), spGain_->input("input"));
    run();
    EXPECT_EQ(oOutput_.pixels(), (std::vector<float>{10010.0f, 10020.0f, 10030.0f, 10040.0f}));
    setParameter(*aChain[500], "value", 2.0f);
    run();
    EXPECT_EQ(oOutput_.at(0, 0), 10020.0f);
}

} // namespace
} // namespace ORVO::FilterGraph
