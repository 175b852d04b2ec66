#include "orvo/filter_graph/internal/ImageFlowFilterWrapper.h"

#include "orvo/core/utility/SharedPtr.h"
#include "orvo/data_flow/librarian/NodeLibrarian.h"
#include "orvo/data_flow/librarian/NodeMetaData.h"
#include "orvo/data_flow/parameters/IntervalParameter.h"
#include "orvo/filter_graph/impl/FilterFactory.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/MetadataItem.h"
#include "orvo/filter_graph/impl/Parameter.h"
#include "orvo/filter_graph/internal/GraphExecutable.h"
#include "orvo/filter_graph/internal/ImageFlowFilterExecutable.h"
#include "orvo/image_flow/controllers/ImageFlowController.h"
#include "tests/support/Expect.h"
#include "tests/support/FrameTest.h"

namespace ORVO::FilterGraph::Internal {
namespace {

using namespace ORVO::Test;

IFilter::Identifier testId(std::string const& name, int version = 1) {
    return {name, "test", "ORVO", version};
}

/// A node with parameters that have a public form and others that have none.
class ManyNode : public MixNode {
public:
    ManyNode()
        : oText_("t", "text"),
          oBounded_(1.0f, 0.0f, 2.0f, "bounded", "between two bounds"),
          oWords_(3u, "words") {
        registerParameter(&oText_);
        registerParameter(&oBounded_);
        registerParameter(&oWords_);
    }

private:
    DataFlow::Parameter<std::string> oText_;
    DataFlow::IntervalParameter<float> oBounded_;
    DataFlow::Parameter<unsigned int> oWords_;
};

class ImageFlowFilterWrapperTest : public FrameTest {
protected:
    using Target = DataFlow::NodeTargetType;

    ImageFlowFilterWrapperTest() {
        add("cpu", 1, [](Target target) -> DataFlow::Node* {
            return target == DataFlow::NODE_TARGET_CPU ? ORVO_NEW GainNode() : nullptr;
        });
        add("cpu", 2, [](Target target) -> DataFlow::Node* {
            return target == DataFlow::NODE_TARGET_CPU ? ORVO_NEW BlurNode() : nullptr;
        });
        add("gpu only", 1, [](Target target) -> DataFlow::Node* {
            return target == DataFlow::NODE_TARGET_GPU ? ORVO_NEW GainNode() : nullptr;
        });
        add("many", 1, [](Target) -> DataFlow::Node* { return ORVO_NEW ManyNode(); });
        add("no image filter", 1, [](Target) -> DataFlow::Node* { return ORVO_NEW DataFlow::Node("plain"); });
    }

    static void add(std::string const& name, unsigned version, DataFlow::Node* (*create)(Target)) {
        DataFlow::NodeLibrarian::Instance()->add(
            create, ORVO_NEW DataFlow::NodeMetaData(name, "test", "ORVO", version, "",
                                                    "test " + name + std::to_string(version)));
    }

    static std::string text(IFilter const& filter, std::string const& item) {
        return filter.metadataItem(item)->as<std::string>().value();
    }
};

TEST_F(ImageFlowFilterWrapperTest, BearsTheClientIDOfTheFirstExactMatch) {
    ImageFlowFilterWrapper const wrapper(testId("cpu", 2));
    EXPECT_EQ(wrapper.identifier().name(), "cpu");
    ASSERT_EQ(wrapper.getNumberOfMetadataItems(), 2u);
    EXPECT_EQ((*wrapper.metadata())->name(), "mlMatchname");
    EXPECT_EQ(text(wrapper, "mlMatchname"), "test cpu2");
    EXPECT_EQ(text(wrapper, "clientID"), "test cpu2");
}

TEST_F(ImageFlowFilterWrapperTest, StandsWithoutMetadataForAnUnknownIdentity) {
    for (IFilter::Identifier const& id :
         {testId("unknown"), testId("cpu", 3), IFilter::Identifier("cpu", "other", "ORVO", 1),
          IFilter::Identifier("cpu", "test", "other", 1)}) {
        ImageFlowFilterWrapper wrapper(id);
        EXPECT_EQ(wrapper.getNumberOfMetadataItems(), 0u);
        // Without OpenGL the set-up goes on to the end and finds nothing.
        wrapper.initialize();
        EXPECT_EQ(wrapper.getNumberOfInputs(), 0u);
    }
}

TEST_F(ImageFlowFilterWrapperTest, TakesItsInterfaceFromTheNode) {
    ImageFlowFilterWrapper wrapper(testId("many"));
    EXPECT_EQ(wrapper.getNumberOfInputs(), 0u);
    wrapper.initialize();
    ASSERT_EQ(wrapper.getNumberOfInputs(), 2u);
    std::vector<std::string> aInputs;
    for (InputConstIterator iInput = static_cast<IFilter const&>(wrapper).inputs(); iInput.isValid();
         ++iInput) {
        aInputs.push_back((*iInput)->name());
        EXPECT_EQ((*iInput)->nChannel(), 0u);
    }
    EXPECT_EQ(aInputs, (std::vector<std::string>{"a", "b"}));

    // Regions, hints, texts and unsigned numbers have no public form.
    std::vector<std::string> aParameters;
    for (ParameterIterator iParameter = wrapper.parameters(); iParameter.isValid(); ++iParameter) {
        aParameters.push_back((*iParameter)->name());
    }
    EXPECT_EQ(aParameters, (std::vector<std::string>{"id", "amount", "bounded"}));
    EXPECT_EQ(wrapper.parameter("amount")->as<float>().value(), 0.5f);
    EXPECT_EQ(wrapper.parameter("bounded")->getNumberOfMetadataItems(), 5u);
}

TEST_F(ImageFlowFilterWrapperTest, AGPUOnlyNodeGivesAnEmptyInterfaceWithoutOpenGL) {
    FilterFactory::Instance()->insert(ImageFlowFilterWrapper(testId("gpu only")));
    auto const spFilter = FilterFactory::Instance()->create(testId("gpu only"));
    EXPECT_EQ(spFilter->getNumberOfInputs(), 0u);
    EXPECT_EQ(spFilter->getNumberOfParameters(), 0u);
    EXPECT_EQ(text(*spFilter, "clientID"), "test gpu only1");
}

TEST_F(ImageFlowFilterWrapperTest, ANodeThatIsNoImageFilterCountsAsNone) {
    ImageFlowFilterWrapper wrapper(testId("no image filter"));
    wrapper.initialize();
    EXPECT_EQ(wrapper.getNumberOfInputs(), 0u);
}

TEST_F(ImageFlowFilterWrapperTest, CanBuildForTheTargetOfItsNodeAlone) {
    ImageFlowFilterWrapper wrapper(testId("cpu"));
    for (int target = 0; target < 4; ++target) {
        EXPECT_FALSE(wrapper.canBuildFilterExecutable(static_cast<TargetPlatform>(target)));
    }
    EXPECT_TRUE(wrapper.canBuildFilterExecutable(ORVO_TARGET_UNSET)) << "no target was asked for yet";
    wrapper.initialize();
    EXPECT_TRUE(wrapper.canBuildFilterExecutable(ORVO_TARGET_CPU));
    EXPECT_FALSE(wrapper.canBuildFilterExecutable(ORVO_TARGET_GL));
    EXPECT_TRUE(wrapper.clone()->canBuildFilterExecutable(ORVO_TARGET_CPU));
}

TEST(ImageFlowFilterWrapper, NeedsALibrarian) {
    ORVO_EXPECT_INTERNAL(ImageFlowFilterWrapper{testId("cpu")}, "Enforce librarian != NULL");
}

TEST_F(ImageFlowFilterWrapperTest, RunsInAGraphThroughTheFactory) {
    FilterFactory::Instance()->insert(ImageFlowFilterWrapper(testId("cpu")));
    FilterPtr const spGain = FilterFactory::Instance()->create(testId("cpu"));
    FloatImage input(1, 1);
    FloatImage output(1, 1);
    input.at(0, 0) = 3.0f;
    SourcePtr const spSource = makeSource(input);
    SinkPtr const spSink = makeSink(output);
    Connect(spSource, spGain);
    Connect(spGain, spSink);
    setParameter(*spGain, "gain", 5.0f);
    auto const spProcessor = createProcessor(spSink, nullptr);
    spProcessor->processFrame(cpuOptions());
    EXPECT_EQ(output.at(0, 0), 15.0f);
}

/// A compiled graph of a generator and a sink, for filters to be built into.
class WrapperBuildTest : public ImageFlowFilterWrapperTest {
protected:
    WrapperBuildTest() {
        Connect(spGenerator_, spSink_);
        pExecutable_ = std::make_unique<GraphExecutable>(spSink_->getIFilter(), cpuOptions(), nullptr);
    }

    std::size_t nodes() const {
        return static_cast<std::size_t>(pExecutable_->controller()->nodesEnd() -
                                        pExecutable_->controller()->nodesBegin());
    }

    FloatImage oOutput_{1, 1};
    FilterPtr spGenerator_ = makeFilter<GeneratorNode>();
    SinkPtr spSink_ = makeSink(oOutput_);
    std::unique_ptr<GraphExecutable> pExecutable_;
};

ImageFilter* nodeOf(std::shared_ptr<IFilterExecutable> const& spExecutable) {
    return dynamic_cast<ImageFlowFilterExecutable&>(*spExecutable).getImageFlowFilter();
}

TEST_F(WrapperBuildTest, EachBuildMakesANodeOfItsOwn) {
    ImageFlowFilterWrapper prototype(testId("cpu"));
    prototype.initialize();
    auto const spA = prototype.clone();
    auto const spB = prototype.clone();
    std::size_t const nBefore = nodes();
    auto const spExecutableA = spA->buildFilterExecutable(ORVO_TARGET_CPU, *pExecutable_);
    auto const spExecutableB = spB->buildFilterExecutable(ORVO_TARGET_CPU, *pExecutable_);
    auto const spExecutableA2 = spA->buildFilterExecutable(ORVO_TARGET_CPU, *pExecutable_);
    EXPECT_NE(nodeOf(spExecutableA), nodeOf(spExecutableB));
    EXPECT_NE(nodeOf(spExecutableA), nodeOf(spExecutableA2));
    EXPECT_EQ(nodes(), nBefore + 3);
    EXPECT_EQ(nodeOf(spExecutableA)->controller(), pExecutable_->controller().get());
}

TEST_F(WrapperBuildTest, NothingToBuildIsAFailure) {
    ImageFlowFilterWrapper unknown(testId("unknown"));
    ORVO_EXPECT_INTERNAL(unknown.buildFilterExecutable(ORVO_TARGET_CPU, *pExecutable_), "filter");
    ImageFlowFilterWrapper wrapper(testId("cpu"));
    ORVO_EXPECT_INTERNAL(wrapper.buildFilterExecutable(ORVO_TARGET_GL, *pExecutable_), "filter");
    ORVO_EXPECT_INTERNAL(wrapper.buildFilterExecutable(ORVO_TARGET_RESERVED_2, *pExecutable_), "filter");
    ImageFlowFilter<GainNode> fixed(testId("fixed"), ORVO_TARGET_CPU);
    ORVO_EXPECT_INTERNAL(fixed.buildFilterExecutable(ORVO_TARGET_GL, *pExecutable_), "filter");
}

TEST_F(WrapperBuildTest, AFilterOfAKnownNodeClassKeepsItsTarget) {
    ImageFlowFilter<GainNode> filter(testId("fixed"), ORVO_TARGET_CPU);
    for (int target = 0; target < 5; ++target) {
        bool const bCPU = target == ORVO_TARGET_CPU;
        EXPECT_EQ(filter.canBuildFilterExecutable(static_cast<TargetPlatform>(target)), bCPU);
        EXPECT_EQ(filter.clone()->canBuildFilterExecutable(static_cast<TargetPlatform>(target)), bCPU);
    }
    filter.initialize();
    EXPECT_EQ(filter.getNumberOfInputs(), 1u);
    EXPECT_EQ(filter.clone()->getNumberOfInputs(), 1u);
    auto const spExecutable = filter.buildFilterExecutable(ORVO_TARGET_CPU, *pExecutable_);
    EXPECT_TRUE(dynamic_cast<GainNode*>(nodeOf(spExecutable)));
}

TEST_F(WrapperBuildTest, ValuesGoToNamesakesAndOtherParametersKeepTheirDefaults) {
    // The public filter has "gain" but no "id".
    class Narrow : public ImageFlowFilterWrapperBase {
    public:
        Narrow() : ImageFlowFilterWrapperBase(testId("narrow")) {
            addParameter(OwnedParameter(new Parameter<float>("gain", 4.0f, false)));
            addParameter(OwnedParameter(new Parameter<float>("stranger", 4.0f, false)));
        }
        std::shared_ptr<Filter> clone() override { return nullptr; }

    private:
        ImageFilter* createFilter(TargetPlatform target) override {
            return target == ORVO_TARGET_CPU ? ORVO_NEW GainNode() : nullptr;
        }
    } filter;
    auto const spExecutable = filter.buildFilterExecutable(ORVO_TARGET_CPU, *pExecutable_);
    ImageFilter& node = *nodeOf(spExecutable);
    auto const value = [&] {
        return dynamic_cast<DataFlow::Parameter<float>*>(node.parameter("gain"))->value();
    };
    EXPECT_EQ(value(), 1.0f);
    spExecutable->forwardStuff();
    EXPECT_EQ(value(), 4.0f);
    EXPECT_EQ(dynamic_cast<DataFlow::Parameter<int>*>(node.parameter("id"))->value(), 0);
}

TEST_F(WrapperBuildTest, ConnectorsTargetsAndLayoutAreThoseOfTheNode) {
    auto const spMix = makeFilter<MixNode>();
    auto const spExecutable = spMix->buildFilterExecutable(ORVO_TARGET_CPU, *pExecutable_);
    ImageFilter& node = *nodeOf(spExecutable);
    auto& executable = dynamic_cast<ImageFlowFilterExecutable&>(*spExecutable);
    EXPECT_EQ(executable.getFilterGraphFilter(), spMix.get());
    EXPECT_EQ(executable.getImageFlowInputConnector("b"), node.imageInput(1));
    EXPECT_EQ(executable.getImageFlowInputConnector("c"), nullptr);
    EXPECT_EQ(executable.getImageFlowOutputConnector(), node.imageOutput());
    DataFlow::OutputConnector* const pClone = executable.cloneImageFlowOutputConnector();
    EXPECT_EQ(executable.getClonedImageFlowOutputConnector(0), pClone);
    EXPECT_EQ(node.clonedImageOutput(0), pClone);
    EXPECT_EQ(executable.getInputTargetPlatform(), ORVO_TARGET_CPU);
    EXPECT_EQ(executable.getOutputTargetPlatform(), ORVO_TARGET_CPU);
    EXPECT_FALSE(executable.hasSIMDInput());
    EXPECT_FALSE(executable.hasSIMDOutput());
    auto const spSIMD = makeFilter<SIMDGainNode>()->buildFilterExecutable(ORVO_TARGET_CPU, *pExecutable_);
    EXPECT_TRUE(spSIMD->hasSIMDInput());
    EXPECT_TRUE(spSIMD->hasSIMDOutput());
}

TEST_F(WrapperBuildTest, ANodeMayBeSetLaterAndReplaced) {
    auto const spFilter = makeFilter<GainNode>();
    setParameter(*spFilter, "gain", 6.0f);
    std::size_t const nBefore = nodes();
    ImageFlowFilterExecutable executable(*pExecutable_, *spFilter, nullptr);
    EXPECT_EQ(nodes(), nBefore);
    EXPECT_EQ(executable.getImageFlowFilter(), nullptr);
    ORVO_EXPECT_INTERNAL(executable.setImageFlowFilter(nullptr), "Enforce pImageFlowFilter != NULL");
    executable.setImageFlowFilter(ORVO_NEW GainNode());
    executable.setImageFlowFilter(ORVO_NEW GainNode());
    EXPECT_EQ(nodes(), nBefore + 1);
    executable.forwardStuff();
    auto* const pParameter = executable.getImageFlowFilter()->parameter("gain");
    EXPECT_EQ(dynamic_cast<DataFlow::Parameter<float>*>(pParameter)->value(), 6.0f);
}

} // namespace
} // namespace ORVO::FilterGraph::Internal
