// Both adapters: modes, images, channels, time stamps and regions.
#include <gtest/gtest.h>

#include <limits>

#include "orvo/filter_graph/impl/Connect.h"
#include "orvo/filter_graph/impl/ImageCPU.h"
#include "orvo/filter_graph/impl/ImageDescriptorGL.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/Output.h"
#include "orvo/filter_graph/internal/GraphExecutable.h"
#include "orvo/filter_graph/internal/IFilterExecutable.h"
#include "orvo/filter_graph/internal/InputAdapter.h"
#include "orvo/filter_graph/internal/OutputAdapter.h"
#include "tests/filter_graph/support/PlainFilter.h"
#include "tests/support/Expect.h"
#include "tests/support/ExpectFilterGraph.h"
#include "tests/support/FrameTest.h"

namespace ORVO::FilterGraph::Internal {
namespace {

using ORVO::Test::makePlain;
using ORVO::Test::PlainFilter;

constexpr auto fromImage = IAdapter::REGION_SYNC_FROM_IMAGE;
constexpr auto byHost = IAdapter::REGION_SYNC_EXPLICIT;
constexpr auto noMode = static_cast<IAdapter::eRegionSyncMode>(2);
constexpr char const* noImageText = "Enforce image_ != NULL";

PositionExtentInWorldSpace world(float x, float y, float width, float height) {
    return {PositionInWorldSpace(x, y), ExtentInWorldSpace(width, height)};
}

PositionExtentInPixelSpace pixels(int x, int y, int width, int height) {
    return {PositionInPixelSpace(x, y), ExtentInPixelSpace(width, height)};
}

/// A client image without storage, which is all that adapters look at.
FilterGraph::ImageCPU
image(std::size_t nChannel, ImageDescriptor::eChannelType channelType = ImageDescriptor::CHANNEL_TYPE_UINT8,
      PixelExtentInWorldSpace const& pixelExtent = PixelExtentInWorldSpace(2.0F, 2.0F)) {
    FilterGraph::ImageCPU handle(ImageDescriptorCPU({nChannel, channelType}, pixelExtent));
    handle.setRect(pixels(-1, 2, 10, 20));
    return handle;
}

/// An image on the target GL, which cannot be in host memory.
class TextureHandle : public FilterGraph::ImageBase {
public:
    explicit TextureHandle(ImageDescriptorGL const& descriptor) : ImageBase(descriptor) {}
    ~TextureHandle() override = default;
    void clear() override {}
};

/// The description of an image that lives nowhere.
class HomelessDescriptor : public ImageDescriptor {
public:
    HomelessDescriptor()
        : ImageDescriptor({1, CHANNEL_TYPE_UINT8}, PixelExtentInWorldSpace(), ORVO_TARGET_RESERVED_2) {}
};

/// An image that is neither in host memory nor a texture.
class HomelessImage : public FilterGraph::ImageBase {
public:
    HomelessImage() : ImageBase(HomelessDescriptor()) {}
    ~HomelessImage() override = default;
    void clear() override {}
};

template <class Adapter>
class AdapterTest : public testing::Test {};

using BothAdapters = testing::Types<InputAdapter, OutputAdapter>;
TYPED_TEST_SUITE(AdapterTest, BothAdapters);

TYPED_TEST(AdapterTest, IsAFilterWithoutAnImageAtFirst) {
    TypeParam adapter(byHost);
    EXPECT_EQ(adapter.getImage(), nullptr);
    EXPECT_EQ(adapter.mode(), byHost);
    EXPECT_EQ(adapter.getIFilter(), static_cast<IFilter*>(&adapter));
    EXPECT_EQ(static_cast<TypeParam const&>(adapter).getIFilter(), static_cast<IFilter const*>(&adapter));
    EXPECT_EQ(adapter.identifier().name(), "");
    EXPECT_TRUE(adapter.identifier().ignoresVersion());
    EXPECT_EQ(adapter.getTimeStamp(), 0);
    EXPECT_EQ(adapter.getNumberOfParameters(), 0u);
    EXPECT_FALSE(adapter.getDomainOfDefinition().extent().isDefined());
    EXPECT_FALSE(adapter.getRegionOfInterest().extent().isDefined());
    ORVO_EXPECT_INTERNAL(adapter.getImageDescriptor(), noImageText);
}

TYPED_TEST(AdapterTest, CanRunOnTheTwoTargets) {
    TypeParam const adapter(fromImage);
    EXPECT_TRUE(adapter.canBuildFilterExecutable(ORVO_TARGET_GL));
    EXPECT_TRUE(adapter.canBuildFilterExecutable(ORVO_TARGET_CPU));
    EXPECT_FALSE(adapter.canBuildFilterExecutable(ORVO_TARGET_RESERVED_2));
    EXPECT_FALSE(adapter.canBuildFilterExecutable(ORVO_TARGET_UNSET));
}

TYPED_TEST(AdapterTest, MovesItsTimeStampWithAnotherKindOfImageAlone) {
    FilterGraph::ImageCPU first = image(3);
    FilterGraph::ImageCPU like = image(3);
    like.setRect(pixels(0, 0, 1, 1));
    FilterGraph::ImageCPU otherChannels = image(4);
    FilterGraph::ImageCPU otherType = image(3, ImageDescriptor::CHANNEL_TYPE_FLOAT32);
    FilterGraph::ImageCPU otherExtent =
        image(3, ImageDescriptor::CHANNEL_TYPE_UINT8, PixelExtentInWorldSpace(2.0F, 1.0F));
    TextureHandle otherTarget(
        ImageDescriptorGL({3, ImageDescriptor::CHANNEL_TYPE_UINT8}, PixelExtentInWorldSpace(2.0F, 2.0F)));
    struct Step {
        char const* what;
        FilterGraph::ImageBase* pImage;
        int stamp;
    };
    Step const steps[] = {
        {"null on null", nullptr, 1},
        {"the first image", &first, 2},
        {"the same again", &first, 2},
        {"a like one", &like, 2},
        {"channels", &otherChannels, 3},
        {"back", &first, 4},
        {"channel type", &otherType, 5},
        {"back", &first, 6},
        {"pixel extent", &otherExtent, 7},
        {"back", &first, 8},
        {"target", &otherTarget, 9},
        {"back", &first, 10},
        {"null", nullptr, 11},
        {"the same after null", &first, 12},
    };
    TypeParam adapter(byHost);
    for (Step const& step : steps) {
        adapter.setImage(step.pImage);
        EXPECT_EQ(adapter.getTimeStamp(), step.stamp) << step.what;
        EXPECT_EQ(adapter.getImage(), step.pImage) << step.what;
    }
}

TYPED_TEST(AdapterTest, GivesTheDescriptorOfItsImage) {
    FilterGraph::ImageCPU bound = image(4, ImageDescriptor::CHANNEL_TYPE_FLOAT32);
    TypeParam adapter(fromImage);
    adapter.setImage(&bound);
    EXPECT_EQ(&adapter.getImageDescriptor(), &bound.imageDescriptor());
    adapter.setImage(nullptr);
    ORVO_EXPECT_INTERNAL(adapter.getImageDescriptor(), noImageText);
}

TYPED_TEST(AdapterTest, ClonesItsModeWithoutImageAndRegions) {
    FilterGraph::ImageCPU bound = image(3);
    TypeParam adapter(byHost);
    adapter.setImage(&bound);
    auto const spClone = adapter.clone();
    auto* const pClone = dynamic_cast<TypeParam*>(spClone.get());
    ASSERT_TRUE(pClone);
    EXPECT_EQ(pClone->mode(), byHost);
    EXPECT_EQ(pClone->getImage(), nullptr);
    EXPECT_FALSE(pClone->getDomainOfDefinition().extent().isDefined());
    EXPECT_FALSE(pClone->getRegionOfInterest().extent().isDefined());
    EXPECT_EQ(pClone->getClonedTimeStamp(), adapter.getTimeStamp());
    EXPECT_EQ(pClone->getTimeStamp(), 0);
    EXPECT_EQ(pClone->getNumberOfInputs(), adapter.getNumberOfInputs());
    EXPECT_EQ(pClone->nChannel(), adapter.nChannel());
}

TEST(AdapterModeTest, HasTheTwoValues) {
    EXPECT_EQ(static_cast<int>(IAdapter::REGION_SYNC_FROM_IMAGE), 0);
    EXPECT_EQ(static_cast<int>(IAdapter::REGION_SYNC_EXPLICIT), 1);
    EXPECT_EQ(createInputAdapter(byHost)->mode(), byHost);
    EXPECT_EQ(createInputAdapter(fromImage)->mode(), fromImage);
    EXPECT_EQ(createOutputAdapter(byHost)->mode(), byHost);
    EXPECT_EQ(createOutputAdapter(fromImage)->mode(), fromImage);
    EXPECT_EQ(OutputAdapter::create(byHost)->mode(), byHost);
}

TEST(InputAdapterTest, IsASource) {
    InputAdapter adapter(fromImage);
    EXPECT_EQ(adapter.getNumberOfInputs(), 0u);
    EXPECT_EQ(adapter.nChannel(), 0u);
}

TEST(InputAdapterTest, TakesItsDomainOfDefinitionFromTheImage) {
    InputAdapter adapter(fromImage);
    ORVO_EXPECT_INTERNAL(adapter.getDomainOfDefinition(), noImageText);
    FilterGraph::ImageCPU bound = image(1);
    adapter.setImage(&bound);
    adapter.setDomainOfDefinition(world(0, 0, 1, 1));
    EXPECT_TRUE(adapter.getDomainOfDefinition() == world(-2, 4, 20, 40));
    bound.setRect(pixels(0, 0, 3, 4));
    EXPECT_TRUE(adapter.getDomainOfDefinition() == world(0, 0, 6, 8));
}

TEST(InputAdapterTest, TakesItsDomainOfDefinitionFromTheHost) {
    InputAdapter adapter(byHost);
    adapter.setDomainOfDefinition(world(1, 2, 3, 4));
    EXPECT_TRUE(adapter.getDomainOfDefinition() == world(1, 2, 3, 4));
    FilterGraph::ImageCPU bound = image(1);
    adapter.setImage(&bound);
    EXPECT_TRUE(adapter.getDomainOfDefinition() == world(1, 2, 3, 4));
}

TEST(InputAdapterTest, RefusesAModeThatIsNone) {
    InputAdapter const adapter(noMode);
    ORVO_EXPECT_INTERNAL(adapter.getDomainOfDefinition(),
                         "Error in ORVO::FilterGraph::Internal::InputAdapter::getDOD");
}

TEST(InputAdapterTest, KeepsTheRegionThatThePropagationFound) {
    InputAdapter adapter(fromImage);
    adapter.updateROI(world(5, 6, 7, 8));
    EXPECT_TRUE(adapter.getRegionOfInterest() == world(5, 6, 7, 8));
}

TEST(InputAdapterTest, GivesItsOutputTheChannelsOfTheImage) {
    InputAdapter adapter(fromImage);
    FilterGraph::ImageCPU grey = image(1);
    FilterGraph::ImageCPU colour = image(4);
    adapter.setImage(&grey);
    EXPECT_EQ(adapter.nChannel(), 1u);
    adapter.setImage(&colour);
    EXPECT_EQ(adapter.nChannel(), 4u);
    adapter.setImage(nullptr);
    EXPECT_EQ(adapter.nChannel(), 0u);
}

TEST(InputAdapterTest, RefusesAnImageThatAConsumerCannotTake) {
    auto const spAdapter = std::make_shared<InputAdapter>(fromImage);
    auto const any = makePlain("any", {"src"});
    auto const grey = makePlain("grey");
    grey->addInput("src", 1);
    Connect(std::shared_ptr<IInputAdapter>(spAdapter), any->input("src"));
    Connect(std::shared_ptr<IInputAdapter>(spAdapter), grey->input("src"));
    int const stamp = spAdapter->getTimeStamp();

    FilterGraph::ImageCPU colour = image(4);
    ORVO_EXPECT_INTERNAL(spAdapter->setImage(&colour), "consumerNumChannels == output->nChannel()");
    EXPECT_EQ(spAdapter->getImage(), &colour);
    EXPECT_EQ(spAdapter->nChannel(), 4u);
    EXPECT_EQ(spAdapter->getTimeStamp(), stamp + 1);
    FilterGraph::ImageCPU one = image(1);
    spAdapter->setImage(&one);
    EXPECT_EQ(spAdapter->nChannel(), 1u);
}

TEST(InputAdapterTest, IsRefusedByAConsumerThatComesLater) {
    auto const spAdapter = createInputAdapter(fromImage);
    FilterGraph::ImageCPU colour = image(4);
    spAdapter->setImage(&colour);
    auto const grey = makePlain("grey");
    grey->addInput("src", 1);
    ORVO_EXPECT_FILTERGRAPH(
        Connect(spAdapter, grey->input("src")),
        "Channel mismatch between the output image and input image of the filters being "
        "connected:  node having4 channels is connected to grey node having 1 channels\n");
    EXPECT_EQ(grey->input("src")->producerFilter(), nullptr);
}

TEST(OutputAdapterTest, IsASinkWithOneInput) {
    OutputAdapter adapter(fromImage);
    ASSERT_EQ(adapter.getNumberOfInputs(), 1u);
    ASSERT_TRUE(adapter.input("InputImage"));
    EXPECT_EQ(adapter.input("InputImage")->nChannel(), 0u);
    EXPECT_FALSE(adapter.isSIMD());
}

TEST(OutputAdapterTest, TakesItsRegionOfInterestFromTheImage) {
    OutputAdapter adapter(fromImage);
    ORVO_EXPECT_INTERNAL(adapter.getRegionOfInterest(), noImageText);
    ORVO_EXPECT_INTERNAL(adapter.getImageRect(), noImageText);
    FilterGraph::ImageCPU bound = image(1);
    adapter.setImage(&bound);
    adapter.setRegionOfInterest(world(0, 0, 1, 1));
    EXPECT_TRUE(adapter.getRegionOfInterest() == world(-2, 4, 20, 40));
}

TEST(OutputAdapterTest, TakesItsRegionOfInterestFromTheHost) {
    OutputAdapter adapter(byHost);
    adapter.setRegionOfInterest(world(1, 2, 3, 4));
    EXPECT_TRUE(adapter.getRegionOfInterest() == world(1, 2, 3, 4));
    adapter.updateDOD(world(5, 6, 7, 8));
    EXPECT_TRUE(adapter.getDomainOfDefinition() == world(5, 6, 7, 8));
}

TEST(OutputAdapterTest, RefusesAModeThatIsNone) {
    // The words name the other adapter; hosts know them so.
    OutputAdapter const adapter(noMode);
    ORVO_EXPECT_INTERNAL(adapter.getRegionOfInterest(),
                         "Error in ORVO::FilterGraph::Internal::InputAdapter::getDOD");
}

TEST(OutputAdapterTest, DemandsTheChannelsOfTheImage) {
    OutputAdapter adapter(fromImage);
    FilterGraph::ImageCPU grey = image(1);
    adapter.setImage(&grey);
    EXPECT_EQ(adapter.input("InputImage")->nChannel(), 1u);
    adapter.setImage(nullptr);
    EXPECT_EQ(adapter.input("InputImage")->nChannel(), 0u);
}

TEST(OutputAdapterTest, RefusesAnImageThatTheProducerCannotFill) {
    auto const spAdapter = OutputAdapter::create(fromImage);
    auto const producer = makePlain("producer", {}, 3);
    Connect(producer, std::shared_ptr<IOutputAdapter>(spAdapter));
    FilterGraph::ImageCPU grey = image(1);
    ORVO_EXPECT_INTERNAL(spAdapter->setImage(&grey),
                         "this->getImageDescriptor().format().nChannel == producerChannels");
    EXPECT_EQ(spAdapter->getImage(), &grey);
    EXPECT_EQ(spAdapter->input("InputImage")->nChannel(), 1u);
    FilterGraph::ImageCPU colour = image(3);
    spAdapter->setImage(&colour);
    producer->output()->setNumChannels(0);
    spAdapter->setImage(&grey);
    EXPECT_EQ(spAdapter->getImage(), &grey);
}

TEST(OutputAdapterTest, RefusesAProducerThatComesLater) {
    auto const spAdapter = createOutputAdapter(fromImage);
    FilterGraph::ImageCPU grey = image(1);
    spAdapter->setImage(&grey);
    ORVO_EXPECT_FILTERGRAPH(
        Connect(makePlain("producer", {}, 3), spAdapter),
        "Channel mismatch between the output image and input image of the filters being "
        "connected: producer node having3 channels is connected to  node having 1 channels\n");
}

TEST(OutputAdapterTest, WritesTheRegionOfInterestInsideTheDomainOfDefinition) {
    constexpr float infinity = std::numeric_limits<float>::infinity();
    FilterGraph::ImageCPU bound = image(1);
    OutputAdapter adapter(byHost);
    adapter.setImage(&bound);
    struct Row {
        char const* what;
        PositionExtentInWorldSpace roi;
        PositionExtentInWorldSpace dod;
        PositionExtentInPixelSpace rect;
    };
    // A pixel is 2 by 2.
    Row const rows[] = {
        {"inside", world(2, 4, 6, 8), world(0, 0, 100, 100), pixels(1, 2, 3, 4)},
        {"overlap", world(-10, -10, 20, 16), world(0, 0, 100, 100), pixels(0, 0, 5, 3)},
        {"parts of pixels", world(1, 1, 2, 2), world(0, 0, 100, 100), pixels(0, 0, 2, 2)},
        {"infinite definition", world(2, 4, 6, 8), world(0, 0, infinity, infinity), pixels(1, 2, 3, 4)},
        {"miss", world(2, 4, 6, 8), world(50, 50, 10, 10), pixels(0, 0, 0, 0)},
    };
    for (Row const& row : rows) {
        adapter.setRegionOfInterest(row.roi);
        adapter.updateDOD(row.dod);
        PositionExtentInPixelSpace const rect = adapter.getImageRect();
        EXPECT_TRUE(rect.extent() == row.rect.extent()) << row.what << ": " << rect;
        if (row.rect.extent().width() > 0) {
            EXPECT_TRUE(rect.position() == row.rect.position()) << row.what << ": " << rect;
        }
    }
    adapter.updateDOD(PositionExtentInWorldSpace());
    EXPECT_FALSE(adapter.getImageRect().extent().isDefined());
}

/// A compiled graph to build executables for.
class AdapterBuildTest : public ORVO::Test::FrameTest {
protected:
    AdapterBuildTest() {
        Connect(spGenerator_, spSink_);
        pExecutable_ =
            std::make_unique<GraphExecutable>(spSink_->getIFilter(), ORVO::Test::cpuOptions(), nullptr);
    }

    ORVO::Test::FloatImage oOutput_{2, 2};
    ORVO::Test::FilterPtr spGenerator_ = ORVO::Test::makeFilter<ORVO::Test::GeneratorNode>();
    ORVO::Test::SinkPtr spSink_ = ORVO::Test::makeSink(oOutput_);
    std::unique_ptr<GraphExecutable> pExecutable_;
};

TEST_F(AdapterBuildTest, NeedsAnImageOnATargetThatThereIsASourceFor) {
    InputAdapter adapter(byHost);
    ORVO_EXPECT_INTERNAL(adapter.buildFilterExecutable(ORVO_TARGET_CPU, *pExecutable_), noImageText);
    // Described as neither in host memory nor in a texture.
    HomelessImage strange;
    adapter.setImage(&strange);
    for (TargetPlatform const target : {ORVO_TARGET_GL, ORVO_TARGET_CPU})
        ORVO_EXPECT_PARAMETER(adapter.buildFilterExecutable(target, *pExecutable_), "false");
}

TEST_F(AdapterBuildTest, BuildsTheEndOfAGraph) {
    OutputAdapter adapter(byHost);
    FilterGraph::ImageCPU bound = image(1);
    adapter.setImage(&bound);
    auto const spExecutable = adapter.buildFilterExecutable(ORVO_TARGET_CPU, *pExecutable_);
    ASSERT_TRUE(spExecutable);
    EXPECT_EQ(spExecutable->getInputTargetPlatform(), ORVO_TARGET_CPU);
    EXPECT_EQ(spExecutable->getOutputTargetPlatform(), ORVO_TARGET_UNSET);
}

} // namespace
} // namespace ORVO::FilterGraph::Internal
