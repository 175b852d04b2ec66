#include "orvo/filter_graph/internal/ExecutableBuilderVisitor.h"

#include "orvo/filter_graph/internal/GraphExecutable.h"
#include "orvo/filter_graph/internal/ImageFlowFilterExecutable.h"
#include "orvo/filter_graph/internal/OutputAdapter.h"
#include "tests/support/Expect.h"
#include "tests/support/FrameTest.h"

namespace ORVO::FilterGraph::Internal {
namespace {

using namespace ORVO::Test;

/// An executable with nothing behind it.
class NoNodeExecutable : public IFilterExecutable {
public:
    void forwardStuff() override {}
    void returnStuff() override {}
    DataFlow::InputConnector* getImageFlowInputConnector(std::string const&) override { return nullptr; }
    DataFlow::OutputConnector* getImageFlowOutputConnector() override { return nullptr; }
    DataFlow::OutputConnector* cloneImageFlowOutputConnector() override { return nullptr; }
    DataFlow::OutputConnector* getClonedImageFlowOutputConnector(std::size_t) override { return nullptr; }
    TargetPlatform getInputTargetPlatform() override { return ORVO_TARGET_GL; }
    TargetPlatform getOutputTargetPlatform() override { return ORVO_TARGET_GL; }
};

/// A filter that hands out what the test gives it.
class GivenFilter : public Filter {
public:
    explicit GivenFilter(std::shared_ptr<IFilterExecutable> spGiven) : spGiven_(std::move(spGiven)) {}
    std::shared_ptr<Filter> clone() override { return nullptr; }
    std::shared_ptr<IFilterExecutable> buildFilterExecutable(TargetPlatform, GraphExecutable&) override {
        ++nBuilt;
        return spGiven_;
    }
    int nBuilt = 0;

private:
    std::shared_ptr<IFilterExecutable> spGiven_;
};

/// A node that says that it runs on the hardware.
class HardwareNode : public GainNode {
public:
    bool willRunInHardware() override { return true; }
};

class ExecutableBuilderVisitorTest : public FrameTest {
protected:
    ExecutableBuilderVisitorTest() {
        Connect(spGenerator_, spSink_);
        pExecutable_ = std::make_unique<GraphExecutable>(spSink_->getIFilter(), cpuOptions(), nullptr);
    }

    ExecutableBuilderVisitor visitor(TargetPlatform target) { return {&oTable_, pExecutable_.get(), target}; }

    FloatImage oOutput_{1, 1};
    FilterPtr spGenerator_ = makeFilter<GeneratorNode>();
    SinkPtr spSink_ = makeSink(oOutput_);
    std::unique_ptr<GraphExecutable> pExecutable_;
    std::map<Filter*, std::shared_ptr<IFilterExecutable>> oTable_;
};

TEST_F(ExecutableBuilderVisitorTest, RefusesNull) {
    ORVO_EXPECT_INTERNAL(visitor(ORVO_TARGET_CPU).postVisit(nullptr), "pFilter");
}

TEST_F(ExecutableBuilderVisitorTest, BuildsEachFilterOnce) {
    GivenFilter filter(std::make_shared<NoNodeExecutable>());
    ExecutableBuilderVisitor builder = visitor(ORVO_TARGET_CPU);
    builder.postVisit(&filter);
    builder.postVisit(&filter);
    EXPECT_EQ(filter.nBuilt, 1);
    EXPECT_TRUE(oTable_.at(&filter));
}

TEST_F(ExecutableBuilderVisitorTest, RefusesAFilterForAnotherTarget) {
    auto const spFilter = makeFilter<GainNode>();
    ORVO_EXPECT_INTERNAL(visitor(ORVO_TARGET_GL).postVisit(spFilter.get()),
                         "Filter will not run on selected target!");
    EXPECT_TRUE(oTable_.empty());
}

TEST_F(ExecutableBuilderVisitorTest, RefusesAnEmptyExecutable) {
    GivenFilter filter(nullptr);
    ORVO_EXPECT_INTERNAL(visitor(ORVO_TARGET_CPU).postVisit(&filter), "filterExecutable.get()");
    EXPECT_TRUE(oTable_.empty());
}

TEST_F(ExecutableBuilderVisitorTest, AnOpenGLFilterNeedsANodeThatRunsOnTheHardware) {
    GivenFilter noNode(std::make_shared<NoNodeExecutable>());
    ORVO_EXPECT_INTERNAL(visitor(ORVO_TARGET_GL).postVisit(&noNode), "imageFlowFilterExecutable");

    auto const spAny = makeFilter<GainNode>();
    GivenFilter nullNode(std::make_shared<ImageFlowFilterExecutable>(*pExecutable_, *spAny, nullptr));
    ORVO_EXPECT_INTERNAL(visitor(ORVO_TARGET_GL).postVisit(&nullNode), "pImageFlowFilter");

    ImageFlowFilter<GainNode> soft(IFilter::Identifier("soft", "test", "ORVO", 1), ORVO_TARGET_GL);
    ORVO_EXPECT_INTERNAL(visitor(ORVO_TARGET_GL).postVisit(&soft), "Filter will not run on selected target!");

    ImageFlowFilter<HardwareNode> hard(IFilter::Identifier("hard", "test", "ORVO", 1), ORVO_TARGET_GL);
    visitor(ORVO_TARGET_GL).postVisit(&hard);
    EXPECT_TRUE(oTable_.at(&hard));
}

TEST_F(ExecutableBuilderVisitorTest, AdaptersNeedNoHardware) {
    auto const spAdapter = OutputAdapter::create(IAdapter::REGION_SYNC_EXPLICIT);
    visitor(ORVO_TARGET_GL).postVisit(spAdapter.get());
    EXPECT_TRUE(oTable_.at(spAdapter.get()));
}

TEST_F(ExecutableBuilderVisitorTest, ExecutablesAreOfThePlainLayoutUnlessTheySayOtherwise) {
    NoNodeExecutable executable;
    EXPECT_FALSE(executable.hasSIMDInput());
    EXPECT_FALSE(executable.hasSIMDOutput());
}

} // namespace
} // namespace ORVO::FilterGraph::Internal
