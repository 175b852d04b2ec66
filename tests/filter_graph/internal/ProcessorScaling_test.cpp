// Where a processor puts scaling filters in a graph on OpenGL, and how composites unfold. The library runs
// without OpenGL here, so each build ends at the executable; the intermediate graph stands by then, and
// probes in it write down how they are connected when they are asked to unfold.
#include <algorithm>

#include "orvo/filter_graph/impl/FilterFactory.h"
#include "orvo/filter_graph/impl/ImageDescriptorGL.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/Output.h"
#include "orvo/filter_graph/impl/Parameter.h"
#include "orvo/filter_graph/internal/Filter.h"
#include "orvo/filter_graph/internal/IFilterExecutable.h"
#include "orvo/filter_graph/internal/ParameterForwarder.h"
#include "orvo/ogl/Context.h"
#include "tests/support/Expect.h"
#include "tests/support/FrameTest.h"

namespace ORVO::FilterGraph {
namespace {

using namespace ORVO::Test;

using Log = std::vector<std::string>;
Log* pLog = nullptr;

std::string nameOf(IFilter const* pFilter) {
    if (!pFilter) {
        return "nothing";
    }
    std::string const name = pFilter->identifier().name();
    return name.empty() ? "adapter" : name;
}

/// Writes "producer -> name -> consumer consumer" when it is asked to unfold.
class Probe : public Internal::Filter {
public:
    explicit Probe(std::string const& name) : Probe(Identifier(name, "ORVO", "Norvane", 1)) {}

    explicit Probe(Identifier const& id) {
        setIdentifier(id);
        addInput("in", 0);
    }

    std::shared_ptr<Filter> clone() override { return std::shared_ptr<Filter>(new Probe(*this)); }

    std::shared_ptr<Internal::ParameterForwarder> unFold(OptimizationOptions const&) override {
        std::string line = nameOf(input("in")->producerFilter()) + " -> " + identifier().name() + " ->";
        for (InputIterator iInput = output()->consumerInputs(); iInput.isValid(); ++iInput) {
            line += " " + nameOf((*iInput)->parentFilter());
        }
        pLog->push_back(line);
        return nullptr;
    }

    std::shared_ptr<Internal::IFilterExecutable> buildFilterExecutable(TargetPlatform,
                                                                       Internal::GraphExecutable&) override {
        return nullptr;
    }

protected:
    Probe(Probe const&) = default;
};

class IdleContext : public OGL::Context {
public:
    void makeCurrent() const override { ADD_FAILURE() << "the context was made current"; }
    bool isSharingWithCurrentContext() const override { return false; }
};

class ProcessorScalingTest : public FrameTest {
protected:
    ProcessorScalingTest() {
        pLog = &aLog_;
        for (int nChannels = 1; nChannels <= 4; ++nChannels) {
            std::string const suffix = std::to_string(nChannels) + "channel";
            FilterFactory::Instance()->insert(Probe("scaleUp" + suffix));
            FilterFactory::Instance()->insert(Probe("scaleDown" + suffix));
        }
    }

    ~ProcessorScalingTest() override { pLog = nullptr; }

    /// An image without pixels, which is enough for a descriptor.
    static std::shared_ptr<ImageCPU> image(std::size_t nChannels, ImageDescriptor::eChannelType type) {
        return std::make_shared<ImageCPU>(ImageDescriptorCPU({nChannels, type}, PixelExtentInWorldSpace()));
    }

    static constexpr auto k15_1 = ImageDescriptor::CHANNEL_TYPE_UINT15_1;
    static constexpr auto kFloat = ImageDescriptor::CHANNEL_TYPE_FLOAT32;

    void bind(std::size_t nInput, ImageDescriptor::eChannelType input, std::size_t nOutput,
              ImageDescriptor::eChannelType output) {
        // The old images live until the adapters have let go of them.
        auto const spNewInput = image(nInput, input);
        auto const spNewOutput = image(nOutput, output);
        spSource_->setImage(spNewInput.get());
        spSink_->setImage(spNewOutput.get());
        spInput_ = spNewInput;
        spOutput_ = spNewOutput;
    }

    /// The intermediate graph's probes, sorted.
    Log compile() {
        aLog_.clear();
        auto const spProcessor = createProcessor(spSink_, &oContext_);
        ORVO_EXPECT_INTERNAL(spProcessor->processFrame(OptimizationOptions()),
                             "!ORVO::ImageFlow::Library::cpuOnlyMode()");
        std::sort(aLog_.begin(), aLog_.end());
        return aLog_;
    }

    IdleContext oContext_;
    Log aLog_;
    std::shared_ptr<ImageCPU> spInput_;
    std::shared_ptr<ImageCPU> spOutput_;
    SourcePtr spSource_ = createInputAdapter(IAdapter::REGION_SYNC_FROM_IMAGE);
    SinkPtr spSink_ = createOutputAdapter(IAdapter::REGION_SYNC_FROM_IMAGE);
};

TEST_F(ProcessorScalingTest, OneSourceThatFeedsTwoFiltersGetsOneScalingFilter) {
    FilterPtr const spMix = makeFilter<MixNode>("mix");
    Connect(spSource_, spMix->input("a"));
    Connect(spSource_, spMix->input("b"));
    Connect(spMix, spSink_);
    for (std::size_t nChannels = 1; nChannels <= 4; ++nChannels) {
        bind(nChannels, k15_1, nChannels, kFloat);
        std::string const name = "scaleUp" + std::to_string(nChannels) + "channel";
        EXPECT_EQ(compile(), (Log{"adapter -> " + name + " -> mix mix"}));
    }
}

TEST_F(ProcessorScalingTest, TheOutputGetsAScalingFilterOfItsChannels) {
    FilterPtr const spGain = makeFilter<GainNode>("gain");
    Connect(spSource_, spGain);
    Connect(spGain, spSink_);
    for (std::size_t nChannels = 1; nChannels <= 4; ++nChannels) {
        bind(nChannels, kFloat, nChannels, k15_1);
        std::string const name = "scaleDown" + std::to_string(nChannels) + "channel";
        EXPECT_EQ(compile(), (Log{"gain -> " + name + " -> adapter"}));
    }
}

TEST_F(ProcessorScalingTest, ASourceStraightIntoASinkGetsBothInSeries) {
    bind(3, k15_1, 3, k15_1);
    Connect(spSource_, spSink_);
    EXPECT_EQ(compile(), (Log{"adapter -> scaleUp3channel -> scaleDown3channel",
                              "scaleUp3channel -> scaleDown3channel -> adapter"}));
}

TEST_F(ProcessorScalingTest, OtherChannelTypesGetNone) {
    Connect(spSource_, spSink_);
    for (auto const type : {ImageDescriptor::CHANNEL_TYPE_UINT8, ImageDescriptor::CHANNEL_TYPE_UINT16,
                            ImageDescriptor::CHANNEL_TYPE_FLOAT16, kFloat}) {
        bind(1, type, 1, type);
        EXPECT_EQ(compile(), Log{});
    }
}

constexpr char const* kNoFilter = "Not implemented: Only 1/2/3/4 channel 15+1 to 16 bit scaling nodes are "
                                  "available in the filter factory\n";

TEST_F(ProcessorScalingTest, FiveChannelsAreRefusedOnOpenGLAlone) {
    FilterPtr const spGain = makeFilter<GainNode>("gain");
    Connect(spSource_, spGain);
    Connect(spGain, spSink_);
    auto const spProcessor = createEmbeddedProcessor(spSink_, &oContext_);
    bind(5, k15_1, 1, kFloat);
    ORVO_EXPECT_INTERNAL(spProcessor->prepareForProcessing(OptimizationOptions()), kNoFilter);
    bind(1, kFloat, 5, k15_1);
    ORVO_EXPECT_INTERNAL(spProcessor->prepareForProcessing(OptimizationOptions()), kNoFilter);
    bind(5, k15_1, 5, k15_1);
    createEmbeddedProcessor(spSink_, nullptr)->prepareForProcessing(cpuOptions());
    EXPECT_EQ(aLog_, Log{});
}

TEST_F(ProcessorScalingTest, AMissingScalingFilterIsAnError) {
    bind(2, k15_1, 2, kFloat);
    Connect(spSource_, spSink_);
    FilterFactory::Instance()->remove(IFilter::Identifier("scaleUp2channel", "ORVO", "Norvane", 1));
    auto const spProcessor = createProcessor(spSink_, &oContext_);
    ORVO_EXPECT_INTERNAL(spProcessor->processFrame(OptimizationOptions()), "Enforce pPrototype != NULL");
}

// ---- Composites

/// Unfolds into two gains in a row: the first has the composite's "gain", the second always 2.
class DoubleGain : public Internal::Filter {
public:
    DoubleGain() {
        setIdentifier(Identifier("double gain", "test", "ORVO", 1));
        addInput("in", 0);
        addParameter(OwnedParameter(new Parameter<float>("gain", 1.0f, false)));
    }

    std::shared_ptr<Filter> clone() override { return std::shared_ptr<Filter>(new DoubleGain(*this)); }

    std::shared_ptr<Internal::ParameterForwarder> unFold(OptimizationOptions const& options) override {
        if (options.concatenationMode() == OptimizationOptions::CONCATENATION_OFF) {
            throw std::bad_alloc();
        }
        spFirst_ = makeFilter<GainNode>("first");
        spSecond_ = makeFilter<GainNode>("second");
        setParameter(*spSecond_, "gain", 2.0f);
        auto* const pProducer = dynamic_cast<Filter*>(input("in")->producerFilter());
        std::vector<Input*> aConsumers(output()->consumerInputs().begin(), output()->consumerInputs().end());
        Disconnect(input("in"));
        Connect(std::shared_ptr<IFilter>(std::shared_ptr<IFilter>(), pProducer), spFirst_);
        Connect(std::shared_ptr<IFilter>(spFirst_), spSecond_);
        for (Input* const pInput : aConsumers) {
            Connect(std::shared_ptr<IFilter>(spSecond_), pInput);
        }
        auto const spForwarder = std::make_shared<Internal::ParameterForwarder>();
        spForwarder->addForward(*this, *spFirst_);
        return spForwarder;
    }

    std::shared_ptr<Internal::IFilterExecutable> buildFilterExecutable(TargetPlatform,
                                                                       Internal::GraphExecutable&) override {
        ADD_FAILURE() << "the composite itself was built";
        return nullptr;
    }

protected:
    DoubleGain(DoubleGain const& other) : Filter(other) {}

private:
    std::shared_ptr<Filter> spFirst_;
    std::shared_ptr<Filter> spSecond_;
};

class CompositeTest : public FrameTest {
protected:
    CompositeTest() {
        oInput_.at(0, 0) = 3.0f;
        Connect(spSource_, spComposite_);
        Connect(spComposite_, spSink_);
    }

    FloatImage oInput_{1, 1};
    FloatImage oOutput_{1, 1};
    SourcePtr spSource_ = makeSource(oInput_);
    FilterPtr spComposite_ = std::make_shared<DoubleGain>();
    SinkPtr spSink_ = makeSink(oOutput_);
    std::shared_ptr<IProcessor> spProcessor_ = createProcessor(spSink_, nullptr);
};

TEST_F(CompositeTest, ItsPartsAreRunAndGetItsValuesOnEachFrame) {
    for (float const gain : {1.0f, 5.0f, 7.0f}) {
        setParameter(*spComposite_, "gain", gain);
        spProcessor_->processFrame(cpuOptions());
        EXPECT_EQ(oOutput_.at(0, 0), 6.0f * gain);
    }
}

TEST_F(CompositeTest, AFailureToUnfoldLeavesNothingBehind) {
    OptimizationOptions failing = cpuOptions();
    failing.setConcatenationMode(OptimizationOptions::CONCATENATION_OFF);
    EXPECT_THROW(spProcessor_->processFrame(failing), std::bad_alloc);
    EXPECT_THROW(spProcessor_->processFrame(failing), std::bad_alloc);
    ORVO_EXPECT_INTERNAL(spProcessor_->waitForFrame(0.0, 0.0), "Enforce spGraphExecutable_ != NULL");
    spProcessor_->processFrame(cpuOptions());
    EXPECT_EQ(oOutput_.at(0, 0), 6.0f);
}

} // namespace
} // namespace ORVO::FilterGraph
