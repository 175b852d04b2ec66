// What the ends of a compiled graph carry across: images, regions, pixel extents and the precision of the
// output.
#include "orvo/filter_graph/internal/ClientImageSource.h"
#include "orvo/filter_graph/internal/GraphExecutable.h"
#include "orvo/filter_graph/internal/InputAdapter.h"
#include "orvo/filter_graph/internal/InputAdapterExecutableCPU.h"
#include "orvo/filter_graph/internal/OutputAdapter.h"
#include "orvo/filter_graph/internal/OutputAdapterExecutable.h"
#include "orvo/image_flow/controllers/ImageFlowController.h"
#include "tests/support/Expect.h"
#include "tests/support/FrameTest.h"

namespace ORVO::FilterGraph::Internal {
namespace {

using namespace ORVO::Test;

PositionExtentInWorldSpace world(float x, float y, float width, float height) {
    return {PositionInWorldSpace(x, y), ExtentInWorldSpace(width, height)};
}

/// The pixel extent that the node's output takes with the next pass.
PixelExtentInWorldSpace extentOf(ImageFilter& node) {
    struct Open : ImageFilter {
        using ImageFilter::outputPixelExtent;
    };
    node.computePixelExtents();
    return (node.*(&Open::outputPixelExtent))();
}

class AdapterExecutablesTest : public FrameTest {
protected:
    AdapterExecutablesTest() {
        Connect(spGenerator_, spSink_);
        pExecutable_ = std::make_unique<GraphExecutable>(spSink_->getIFilter(), cpuOptions(), nullptr);
    }

    static InputAdapter& adapter(SourcePtr const& spSource) { return dynamic_cast<InputAdapter&>(*spSource); }
    OutputAdapter& sinkAdapter() { return dynamic_cast<OutputAdapter&>(*spSink_); }

    FloatImage oOutput_{1, 2, 3, 4, 1, 0.0f, PixelExtentInWorldSpace(2.0f, 0.5f)};
    FilterPtr spGenerator_ = makeFilter<GeneratorNode>();
    SinkPtr spSink_ = makeSink(oOutput_);
    std::unique_ptr<GraphExecutable> pExecutable_;
};

TEST_F(AdapterExecutablesTest, ASourceIsGivenImageExtentAndRegion) {
    FloatImage image(3, 4, 2, 2, 1, 0.0f, PixelExtentInWorldSpace(0.5f, 2.0f));
    SourcePtr const spSource = makeSource(image);
    auto const spExecutable = adapter(spSource).buildFilterExecutable(ORVO_TARGET_CPU, *pExecutable_);
    auto& executable = dynamic_cast<InputAdapterExecutableCPU&>(*spExecutable);
    auto& node = dynamic_cast<ImageCPUInput&>(*executable.getImageFlowFilter());
    EXPECT_FALSE(node.isReady()) << "nothing was emitted";
    executable.forwardStuff();
    ASSERT_TRUE(node.getImageCPU());
    EXPECT_EQ(node.getImageCPU()->pixels(), reinterpret_cast<unsigned char*>(image.pixels().data()));
    EXPECT_TRUE(node.isReady());
    EXPECT_EQ(extentOf(node), PixelExtentInWorldSpace(0.5f, 2.0f));
    EXPECT_EQ(node.generated({}), world(1.5f, 8.0f, 1.0f, 4.0f));
    node.setRegionOfInterest(world(1.0f, 2.0f, 3.0f, 4.0f));
    executable.returnStuff();
    EXPECT_EQ(spSource->getRegionOfInterest(), world(1.0f, 2.0f, 3.0f, 4.0f));
}

TEST_F(AdapterExecutablesTest, TheExecutableFollowsTheImageWhateverTheTarget) {
    FloatImage image(1, 1);
    SourcePtr const spSource = makeSource(image);
    for (TargetPlatform const target : {ORVO_TARGET_GL, ORVO_TARGET_CPU}) {
        auto const spExecutable = adapter(spSource).buildFilterExecutable(target, *pExecutable_);
        EXPECT_TRUE(dynamic_cast<InputAdapterExecutableCPU*>(spExecutable.get()));
        EXPECT_EQ(spExecutable->getOutputTargetPlatform(), ORVO_TARGET_CPU);
    }
}

TEST_F(AdapterExecutablesTest, ASourceWithoutAnImageStillForwardsItsRegion) {
    FloatImage image(1, 1);
    SourcePtr const spSource = makeSource(image, IAdapter::REGION_SYNC_EXPLICIT);
    auto const spExecutable = adapter(spSource).buildFilterExecutable(ORVO_TARGET_CPU, *pExecutable_);
    ImageFilter& node = *dynamic_cast<ImageFlowFilterExecutable&>(*spExecutable).getImageFlowFilter();
    spSource->setImage(nullptr);
    spSource->setDomainOfDefinition(world(5.0f, 5.0f, 1.0f, 1.0f));
    spExecutable->forwardStuff();
    EXPECT_EQ(node.generated({}), world(5.0f, 5.0f, 1.0f, 1.0f));
    EXPECT_FALSE(node.isReady());
}

TEST_F(AdapterExecutablesTest, RegionsOfImagesNeedImages) {
    FloatImage image(1, 1);
    SourcePtr const spSource = makeSource(image);
    auto const spExecutable = adapter(spSource).buildFilterExecutable(ORVO_TARGET_CPU, *pExecutable_);
    spSource->setImage(nullptr);
    ORVO_EXPECT_INTERNAL(spExecutable->forwardStuff(), "Enforce image_ != NULL");

    GeneratorNode sink;
    OutputAdapterExecutable executable(*pExecutable_, sinkAdapter());
    executable.bind(&sink);
    spSink_->setImage(nullptr);
    ORVO_EXPECT_INTERNAL(executable.forwardStuff(), "Enforce image_ != NULL");
    ORVO_EXPECT_INTERNAL(executable.getInputTargetPlatform(), "Enforce image_ != NULL");
}

TEST_F(AdapterExecutablesTest, TheEndOfTheGraphHasNoConnectors) {
    OutputAdapterExecutable executable(*pExecutable_, sinkAdapter());
    EXPECT_EQ(executable.getImageFlowInputConnector("InputImage"), nullptr);
    EXPECT_EQ(executable.getImageFlowOutputConnector(), nullptr);
    EXPECT_EQ(executable.cloneImageFlowOutputConnector(), nullptr);
    EXPECT_EQ(executable.getClonedImageFlowOutputConnector(0), nullptr);
    EXPECT_EQ(executable.getInputTargetPlatform(), ORVO_TARGET_CPU);
    EXPECT_EQ(executable.getOutputTargetPlatform(), ORVO_TARGET_UNSET);
    EXPECT_FALSE(executable.hasSIMDInput());
    EXPECT_FALSE(executable.hasSIMDOutput());
    ORVO_EXPECT_INTERNAL(executable.forwardStuff(), "Enforce pSink_ != NULL");
    ORVO_EXPECT_INTERNAL(executable.returnStuff(), "Enforce pSink_ != NULL");
}

TEST_F(AdapterExecutablesTest, TheSinkIsBoundToTheImageAndItsGeometry) {
    GeneratorNode sink;
    OutputAdapterExecutable executable(*pExecutable_, sinkAdapter());
    executable.bind(&sink);
    executable.forwardStuff();
    EXPECT_TRUE(sink.imageOutput()->bound());
    EXPECT_EQ(static_cast<ORVO::ImageCPU const*>(sink.imageOutput()->data())->pixels(),
              reinterpret_cast<unsigned char*>(oOutput_.pixels().data()));
    EXPECT_EQ(sink.regionOfInterest(), world(2.0f, 1.0f, 6.0f, 2.0f));
    EXPECT_EQ(extentOf(sink), PixelExtentInWorldSpace(2.0f, 0.5f));
    sink.setDomainOfDefinition(world(1.0f, 1.0f, 1.0f, 1.0f));
    executable.returnStuff();
    EXPECT_EQ(spSink_->getDomainOfDefinition(), world(1.0f, 1.0f, 1.0f, 1.0f));

    FilterGraph::ImageCPU const* const pBound = oOutput_.handle();
    FilterGraph::ImageCPU empty(
        ImageDescriptorCPU({1, ImageDescriptor::CHANNEL_TYPE_FLOAT32}, PixelExtentInWorldSpace()),
        pBound->rect(), nullptr, 0);
    spSink_->setImage(&empty);
    executable.forwardStuff();
    EXPECT_FALSE(sink.imageOutput()->hasData()) << "an image without pixels unbinds the one before";
}

struct HintRow {
    ImageDescriptor::eChannelType eType;
    ImageFilter::teOutputPrecisionHint eHint;
};

class OutputPrecisionTest : public AdapterExecutablesTest, public testing::WithParamInterface<HintRow> {};

TEST_P(OutputPrecisionTest, FollowsTheChannelType) {
    // A descriptor is enough: no pixels, no format of the runtime.
    FilterGraph::ImageCPU image(ImageDescriptorCPU({1, GetParam().eType}, PixelExtentInWorldSpace()));
    spSink_->setImage(&image);
    GeneratorNode sink;
    OutputAdapterExecutable executable(*pExecutable_, sinkAdapter());
    executable.bind(&sink);
    executable.forwardStuff();
    EXPECT_EQ(sink.outputPrecisionHintParameter().value(), GetParam().eHint);
}

INSTANTIATE_TEST_SUITE_P(
    AllTypes, OutputPrecisionTest,
    testing::Values(
        HintRow{ImageDescriptor::CHANNEL_TYPE_UINT8, ImageFilter::OUTPUT_PRECISION_8_BIT_INT},
        HintRow{ImageDescriptor::CHANNEL_TYPE_RESERVED8, ImageFilter::OUTPUT_PRECISION_DEFAULT},
        HintRow{ImageDescriptor::CHANNEL_TYPE_UINT15_1, ImageFilter::OUTPUT_PRECISION_16_BIT_INT},
        HintRow{ImageDescriptor::CHANNEL_TYPE_UINT16, ImageFilter::OUTPUT_PRECISION_16_BIT_INT},
        HintRow{ImageDescriptor::CHANNEL_TYPE_FLOAT16, ImageFilter::OUTPUT_PRECISION_16_BIT_FLOAT},
        HintRow{ImageDescriptor::CHANNEL_TYPE_INT32, ImageFilter::OUTPUT_PRECISION_DEFAULT},
        HintRow{ImageDescriptor::CHANNEL_TYPE_FLOAT32, ImageFilter::OUTPUT_PRECISION_32_BIT_FLOAT},
        HintRow{static_cast<ImageDescriptor::eChannelType>(7), ImageFilter::OUTPUT_PRECISION_DEFAULT}));

/// Whether the source became dirty by the last note.
class ClientImageSourceTest : public FrameTest {
protected:
    bool changesWith(ORVO::ImageCPU const* pImage, std::uint64_t stamp) {
        oSource_.noteContent(pImage, stamp);
        oSource_.updateDirtyState();
        return oSource_.isDirty();
    }

    static std::unique_ptr<ORVO::ImageCPU> wrap(std::vector<float>& pixels, int x) {
        return std::make_unique<ORVO::ImageCPU>(
            ORVO::ImageCPU::PIXEL_FORMAT_LUMINANCE32F, reinterpret_cast<unsigned char*>(pixels.data()),
            PositionExtentInPixelSpace(PositionInPixelSpace(x, 0), ExtentInPixelSpace(2, 2)),
            PixelExtentInWorldSpace(), ExtentInPixelSpace());
    }

    ClientImageSource oSource_;
};

TEST_F(ClientImageSourceTest, CountsAsChangedWithoutAStamp) {
    std::vector<float> pixels(4);
    auto const pImage = wrap(pixels, 0);
    for (int frame = 0; frame < 3; ++frame) {
        EXPECT_TRUE(changesWith(pImage.get(), 0));
    }
}

TEST_F(ClientImageSourceTest, IsCleanOnlyWhileImagePixelsRectangleAndStampStay) {
    std::vector<float> pixels(4);
    std::vector<float> others(4);
    auto const pImage = wrap(pixels, 0);
    auto const pOther = wrap(others, 0);
    EXPECT_TRUE(changesWith(pImage.get(), 7));
    EXPECT_FALSE(changesWith(pImage.get(), 7));
    EXPECT_TRUE(changesWith(pImage.get(), 8));
    EXPECT_TRUE(changesWith(pOther.get(), 8));
    EXPECT_FALSE(changesWith(pOther.get(), 8));
    EXPECT_TRUE(changesWith(nullptr, 8));
    EXPECT_TRUE(changesWith(pOther.get(), 8));
    EXPECT_TRUE(changesWith(pOther.get(), 0));
    EXPECT_TRUE(changesWith(pOther.get(), 8));
    // The same handle in the same place, around other pixels and another rectangle.
    *pOther = ORVO::ImageCPU(*wrap(pixels, 0));
    EXPECT_TRUE(changesWith(pOther.get(), 8));
    *pImage = ORVO::ImageCPU(*wrap(pixels, 5));
    EXPECT_TRUE(changesWith(pImage.get(), 8));
    EXPECT_FALSE(changesWith(pImage.get(), 8));
}

} // namespace
} // namespace ORVO::FilterGraph::Internal
