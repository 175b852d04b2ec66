// How the compiler joins a producer to a consumer, and which broken promises of filters and nodes it finds
// while it does so.
#include "orvo/core/utility/SharedPtr.h"
#include "orvo/data_flow/connectors/InputConnector.h"
#include "orvo/data_flow/connectors/OutputConnector.h"
#include "orvo/filter_graph/internal/GraphExecutable.h"
#include "orvo/filter_graph/internal/IFilterExecutable.h"
#include "orvo/filter_graph/internal/ImageFlowFilterExecutable.h"
#include "orvo/filter_graph/internal/InputAdapter.h"
#include "orvo/filter_graph/internal/OutputAdapter.h"
#include "orvo/image_flow/controllers/ImageFlowController.h"
#include "tests/filter_graph/support/PlainFilter.h"
#include "tests/support/Expect.h"
#include "tests/support/FrameTest.h"

namespace ORVO::FilterGraph::Internal {
namespace {

using namespace ORVO::Test;
using DataFlow::InputConnector;
using DataFlow::OutputConnector;
using Outputs = std::vector<OutputConnector*>;

// The steps of a build. An explicit instantiation may name private members.
template <class Tag, typename Tag::type Member>
struct Access {
    friend typename Tag::type access(Tag) { return Member; }
};

struct ConvertedOutputIndex {
    using type = int (*)(TargetPlatform, bool);
    friend type access(ConvertedOutputIndex);
};

struct CheckTargetsAndConnect {
    using type = OutputConnector* (GraphExecutable::*)(Filter*, OutputConnector*, Filter*, InputConnector*,
                                                       Outputs*);
    friend type access(CheckTargetsAndConnect);
};

struct MakeDataFlowConnection {
    using type = void (GraphExecutable::*)(OutputConnector*, InputConnector*);
    friend type access(MakeDataFlowConnection);
};

struct AppendConverter {
    using type = OutputConnector* (GraphExecutable::*)(std::shared_ptr<ImageFilter> const&, OutputConnector*);
    friend type access(AppendConverter);
};

struct PrependConverter {
    using type = InputConnector* (GraphExecutable::*)(std::shared_ptr<ImageFilter> const&, InputConnector*);
    friend type access(PrependConverter);
};

template struct Access<ConvertedOutputIndex, &GraphExecutable::convertedOutputIndex>;
template struct Access<CheckTargetsAndConnect, &GraphExecutable::checkTargetsAndConnect>;
template struct Access<MakeDataFlowConnection, &GraphExecutable::makeDataFlowConnection>;
template struct Access<AppendConverter, &GraphExecutable::appendImageFlowConverter>;
template struct Access<PrependConverter, &GraphExecutable::prependImageFlowConverter>;

/// A node that is no image node, with connectors for numbers.
class NumberNode : public DataFlow::Node {
public:
    NumberNode() : DataFlow::Node("number") {}
    ~NumberNode() override { disconnect(); }

    DataFlow::ConstOutput<float> oOutput_{"output", this};
    DataFlow::ConstInput<float> oInput_{"input", this};
    DataFlow::ConstInput<float> oSecondInput_{"second", this};

protected:
    void internalProcess() override {}
};

template <class Node>
std::shared_ptr<ImageFilter> makeNode() {
    return std::shared_ptr<ImageFilter>(ORVO_NEW Node(), ImageNodeDeleter());
}

/// source -> gain -> sink, compiled; the producer's output is connected.
class GraphConnectionsTest : public FrameTest {
protected:
    GraphConnectionsTest() {
        Connect(spSource_, spGain_);
        Connect(spGain_, spSink_);
        pExecutable_ = std::make_unique<GraphExecutable>(spSink_->getIFilter(), cpuOptions(), nullptr);
        for (auto iNode = pExecutable_->controller()->nodesBegin();
             iNode != pExecutable_->controller()->nodesEnd(); ++iNode) {
            if ((*iNode)->name() == "ImageCPUInput") {
                pSourceNode_ = (*iNode)->asImageFilter();
            }
        }
        pGainNode_ = pExecutable_->controller()->imageSink();
    }

    OutputConnector* join(Filter* pSource, OutputConnector* pOutput, Filter* pDestination,
                          InputConnector* pInput, Outputs* pOutputs) {
        return (*pExecutable_.*access(CheckTargetsAndConnect()))(pSource, pOutput, pDestination, pInput,
                                                                 pOutputs);
    }

    void connectNodes(OutputConnector* pOutput, InputConnector* pInput) {
        (*pExecutable_.*access(MakeDataFlowConnection()))(pOutput, pInput);
    }

    OutputConnector* append(std::shared_ptr<ImageFilter> const& spConverter, OutputConnector* pOutput) {
        return (*pExecutable_.*access(AppendConverter()))(spConverter, pOutput);
    }

    InputConnector* prepend(std::shared_ptr<ImageFilter> const& spConverter, InputConnector* pInput) {
        return (*pExecutable_.*access(PrependConverter()))(spConverter, pInput);
    }

    FloatImage oInput_{2, 2};
    FloatImage oOutput_{2, 2};
    SourcePtr spSource_ = makeSource(oInput_);
    std::shared_ptr<Filter> spGain_ = makeFilter<GainNode>();
    SinkPtr spSink_ = makeSink(oOutput_);
    std::unique_ptr<GraphExecutable> pExecutable_;
    ImageFilter* pSourceNode_ = nullptr;
    ImageFilter* pGainNode_ = nullptr;
};

TEST(ConvertedOutputIndexTest, GivesEachFormItsPlace) {
    auto const indexOf = [](int target, bool isSIMD) {
        return access(ConvertedOutputIndex())(static_cast<TargetPlatform>(target), isSIMD);
    };
    EXPECT_EQ(indexOf(0, false), 0);
    EXPECT_EQ(indexOf(1, true), 1);
    EXPECT_EQ(indexOf(1, false), 2);
    EXPECT_EQ(indexOf(2, false), 3);
    EXPECT_EQ(indexOf(3, false), 4);
    for (int const target : {0, 2, 3}) {
        ORVO_EXPECT_INTERNAL(indexOf(target, true), "!isSIMD");
    }
    for (bool const isSIMD : {false, true}) {
        ORVO_EXPECT_INTERNAL(indexOf(4, isSIMD), "Uninitialized targetPlatform.");
        EXPECT_EQ(indexOf(5, isSIMD), -1);
        EXPECT_EQ(indexOf(-1, isSIMD), -1);
    }
}

TEST_F(GraphConnectionsTest, JoiningNeedsAllItsArguments) {
    auto* const pSource = dynamic_cast<Filter*>(spSource_.get());
    OutputConnector* const pOutput = pSourceNode_->imageOutput();
    InputConnector* const pInput = pGainNode_->imageInput(0);
    Outputs aOutputs(10, nullptr);
    ORVO_EXPECT_INTERNAL(join(nullptr, pOutput, spGain_.get(), pInput, &aOutputs),
                         "Enforce pSrcFilter != NULL");
    ORVO_EXPECT_INTERNAL(join(pSource, nullptr, spGain_.get(), pInput, &aOutputs),
                         "Enforce pSrcConnector != NULL");
    ORVO_EXPECT_INTERNAL(join(pSource, pOutput, nullptr, pInput, &aOutputs), "Enforce pDstFilter != NULL");
    ORVO_EXPECT_INTERNAL(join(pSource, pOutput, spGain_.get(), nullptr, &aOutputs),
                         "Enforce pDstConnector != NULL");
    ORVO_EXPECT_INTERNAL(join(pSource, pOutput, spGain_.get(), pInput, nullptr),
                         "Enforce pConvertedOutputsVec != NULL");
    EXPECT_EQ(aOutputs, Outputs(10, nullptr));
}

TEST_F(GraphConnectionsTest, TheFormOfAProducerIsEnteredOnceAndMustNotDiffer) {
    auto* const pSource = dynamic_cast<Filter*>(spSource_.get());
    OutputConnector* const pOutput = pSourceNode_->imageOutput();
    GainNode first;
    GainNode second;
    Outputs aOutputs(10, nullptr);
    EXPECT_EQ(join(pSource, pOutput, spGain_.get(), first.imageInput(0), &aOutputs), pOutput);
    EXPECT_EQ(aOutputs[2], pOutput);
    EXPECT_EQ(join(pSource, pOutput, spGain_.get(), second.imageInput(0), &aOutputs), pOutput);
    // The output was taken, so both hang on clones of it.
    EXPECT_EQ(pSourceNode_->numberOfClonedImageOutputs(), 2u);
    EXPECT_EQ(first.imageInput(0)->connectedOutput(), pSourceNode_->clonedImageOutput(0));
    EXPECT_EQ(second.imageInput(0)->connectedOutput(), pSourceNode_->clonedImageOutput(1));

    aOutputs[2] = pGainNode_->imageOutput();
    GainNode third;
    ORVO_EXPECT_INTERNAL(join(pSource, pOutput, spGain_.get(), third.imageInput(0), &aOutputs),
                         "(*pConvertedOutputsVec)[nOriginalOutputIndex] == pSrcConnector");
    EXPECT_EQ(third.imageInput(0)->connectedOutput(), nullptr);
    first.disconnect();
    second.disconnect();
}

TEST_F(GraphConnectionsTest, ConnectsOnlyWhatFits) {
    NumberNode number;
    GainNode gain;
    ORVO_EXPECT_INTERNAL(connectNodes(nullptr, gain.imageInput(0)), "Enforce pSrcConnector != NULL");
    ORVO_EXPECT_INTERNAL(connectNodes(gain.imageOutput(), nullptr), "Enforce pDstConnector != NULL");
    ORVO_EXPECT_INTERNAL(connectNodes(&number.oOutput_, gain.imageInput(0)),
                         "pDstConnector->canConnect(pSrcConnector)");
    ASSERT_TRUE(pSourceNode_->imageOutput()->connectedInput());
    ORVO_EXPECT_INTERNAL(connectNodes(pSourceNode_->imageOutput(), &number.oInput_),
                         "pDstConnector->canConnect(pClonedSrcConnector)");
    EXPECT_EQ(number.oInput_.connectedOutput(), nullptr);
}

TEST_F(GraphConnectionsTest, OnlyAnImageNodeFansOutAndOnlyInHostMemory) {
    NumberNode producer;
    NumberNode consumer;
    connectNodes(&producer.oOutput_, &consumer.oInput_);
    EXPECT_EQ(consumer.oInput_.connectedOutput(), &producer.oOutput_);
    ORVO_EXPECT_INTERNAL(connectNodes(&producer.oOutput_, &consumer.oSecondInput_),
                         "Enforce pSrcNode != NULL");

    class ElsewhereNode : public GainNode {
    public:
        ElsewhereNode() { outputTarget_ = ORVO_TARGET_RESERVED_2; }
    } elsewhere;
    GainNode first;
    GainNode second;
    connectNodes(elsewhere.imageOutput(), first.imageInput(0));
    ORVO_EXPECT_INTERNAL(connectNodes(elsewhere.imageOutput(), second.imageInput(0)),
                         "Enforce pClonedSrcConnector != NULL");
    elsewhere.disconnect();
}

TEST_F(GraphConnectionsTest, ConvertersAreHungBehindAnOutputOrInFrontOfAnInput) {
    GainNode gain;
    std::shared_ptr<ImageFilter> const spBehind = makeNode<GainNode>();
    std::shared_ptr<ImageFilter> const spBefore = makeNode<GainNode>();
    EXPECT_EQ(append(spBehind, gain.imageOutput()), spBehind->imageOutput());
    EXPECT_EQ(spBehind->imageInput(0)->connectedOutput(), gain.imageOutput());
    EXPECT_EQ(prepend(spBefore, gain.imageInput(0)), spBefore->imageInput(0));
    EXPECT_EQ(gain.imageInput(0)->connectedOutput(), spBefore->imageOutput());
    EXPECT_EQ(spBehind->controller(), pExecutable_->controller().get());
    EXPECT_EQ(spBefore->controller(), pExecutable_->controller().get());

    NumberNode number;
    ORVO_EXPECT_INTERNAL(append(makeNode<GainNode>(), &number.oOutput_),
                         "pConverter->imageInput(0)->canConnect(pOutputConnector)");
    ORVO_EXPECT_INTERNAL(prepend(makeNode<GainNode>(), &number.oInput_),
                         "pInputConnector->canConnect(pConverter->imageOutput())");
    gain.disconnect();
}

// ---- Filters that do not keep what they promise

/// An executable with the given output, and no inputs.
class OddExecutable : public IFilterExecutable {
public:
    explicit OddExecutable(OutputConnector* pOutput) : pOutput_(pOutput) {}
    void forwardStuff() override {}
    void returnStuff() override {}
    InputConnector* getImageFlowInputConnector(std::string const&) override { return nullptr; }
    OutputConnector* getImageFlowOutputConnector() override { return pOutput_; }
    OutputConnector* cloneImageFlowOutputConnector() override { return nullptr; }
    OutputConnector* getClonedImageFlowOutputConnector(std::size_t) override { return nullptr; }
    TargetPlatform getInputTargetPlatform() override { return ORVO_TARGET_CPU; }
    TargetPlatform getOutputTargetPlatform() override { return ORVO_TARGET_CPU; }

private:
    OutputConnector* pOutput_;
};

/// A filter with such an executable.
class OddFilter : public PlainFilter {
public:
    using PlainFilter::PlainFilter;
    std::shared_ptr<IFilterExecutable> buildFilterExecutable(TargetPlatform, GraphExecutable&) override {
        return std::make_shared<OddExecutable>(pOutput);
    }
    OutputConnector* pOutput = nullptr;
};

class OddGraphTest : public FrameTest {
protected:
    void build() { GraphExecutable(spSink_->getIFilter(), cpuOptions(), nullptr); }

    FloatImage oInput_{2, 2};
    FloatImage oOutput_{2, 2};
    SourcePtr spSource_ = makeSource(oInput_);
    SinkPtr spSink_ = makeSink(oOutput_);
};

TEST_F(OddGraphTest, OnlyTheEndOfAGraphHasNoOutput) {
    auto const spOdd = std::make_shared<OddFilter>("odd");
    Connect(spOdd, spSink_);
    ORVO_EXPECT_INTERNAL(build(), "out == pOutput_");
}

TEST_F(OddGraphTest, OnlyTheEndOfAGraphHasNoInput) {
    GeneratorNode generator;
    auto const spOdd = std::make_shared<OddFilter>("odd", std::initializer_list<char const*>{"in"});
    spOdd->pOutput = generator.imageOutput();
    Connect(spSource_, std::shared_ptr<IFilter>(spOdd));
    Connect(spOdd, spSink_);
    ORVO_EXPECT_INTERNAL(build(), "pParent == pOutput_");
}

TEST_F(OddGraphTest, TheLastNodeIsAnImageNode) {
    NumberNode number;
    auto const spOdd = std::make_shared<OddFilter>("odd");
    spOdd->pOutput = &number.oOutput_;
    Connect(spOdd, spSink_);
    ORVO_EXPECT_INTERNAL(build(), "Enforce pSink != NULL");
}

TEST_F(OddGraphTest, TheSinkBuildsTheExecutableOfAnEnd) {
    class OddSink : public OutputAdapter {
    public:
        OddSink() : OutputAdapter(REGION_SYNC_FROM_IMAGE) {}
        std::shared_ptr<IFilterExecutable> buildFilterExecutable(TargetPlatform, GraphExecutable&) override {
            return std::make_shared<OddExecutable>(nullptr);
        }
    };
    auto const spOdd = std::make_shared<OddSink>();
    spOdd->setImage(oOutput_.handle());
    Connect(spSource_, std::shared_ptr<IOutputAdapter>(spOdd));
    ORVO_EXPECT_INTERNAL(GraphExecutable(spOdd.get(), cpuOptions(), nullptr), "Enforce oE != NULL");
}

} // namespace
} // namespace ORVO::FilterGraph::Internal
