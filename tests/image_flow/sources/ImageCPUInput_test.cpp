#include "orvo/image_flow/sources/ImageCPUInput.h"

#include "tests/image_flow/support/TestNodes.h"
#include "tests/support/Expect.h"
#include "tests/support/ImageFlowLayers.h"
#include "tests/support/Slots.h"

#include <climits>

namespace ORVO {

namespace {

using Test::feed;
using Test::floatImage;
using Test::pixels;
using Test::plant;
using Test::TestFilter;
using Test::world;
using ImagePtr = std::unique_ptr<ImageCPU, ORVODeleter<ImageCPU>>;

class ImageCPUInputTest : public testing::Test {
protected:
    static ImagePtr image() {
        return floatImage(pixels(-2, 3, 4, 5), [](int, int) { return 1.0f; });
    }
    ORVO::Test::ImageFlowLayers oLayers_;
};

/// The source with what a subclass sees.
class OpenSource : public ImageCPUInput {
public:
    using ImageCPUInput::getNumChannelsOutput;
    using ImageCPUInput::internalProcess;
};

constexpr char const* pNoImage = "No ImageCPU set yet.";

TEST_F(ImageCPUInputTest, addsItsOperationsInOrder) {
    std::ptrdiff_t const last = ORVO::Test::slotOf(&TestFilter::outputPrecisionHint);
    EXPECT_EQ(last + 1, ORVO::Test::slotOf(&ImageCPUInput::setImageCPUWithRegularOwnership));
    EXPECT_EQ(last + 2, ORVO::Test::slotOf(&ImageCPUInput::setImageCPUWithNoOwnership));
    EXPECT_EQ(last + 3, ORVO::Test::slotOf(&ImageCPUInput::setImageCPU));
    EXPECT_EQ(last + 4, ORVO::Test::slotOf(&ImageCPUInput::releaseImageCPU));
    EXPECT_EQ(last + 5,
              ORVO::Test::slotOf(static_cast<ImageCPU* (ImageCPUInput::*)()>(&ImageCPUInput::getImageCPU)));
    EXPECT_EQ(last + 6, ORVO::Test::constSlotOf(static_cast<ImageCPU const* (ImageCPUInput::*)() const>(
                            &ImageCPUInput::getImageCPU)));
    EXPECT_EQ(last + 7, ORVO::Test::constSlotOf(&ImageCPUInput::operator->));
}

TEST_F(ImageCPUInputTest, hasNamesAndTargets) {
    ImageCPUInput source;
    EXPECT_EQ("ImageCPUInput", source.name());
    EXPECT_EQ("OutputImage", source.imageOutput()->name());
    EXPECT_EQ(0u, source.numberOfInputs());
    EXPECT_EQ(ORVO_TARGET_CPU, source.getInputTargetPlatform());
    EXPECT_EQ(ORVO_TARGET_CPU, source.getOutputTargetPlatform());
    EXPECT_EQ(ImageFilter::OUTPUT_PRECISION_DEFAULT, source.outputPrecisionHintParameter().value());
    EXPECT_TRUE(source.canEmit());
    EXPECT_FALSE(source.isReady());
    EXPECT_FALSE(source.hasBufferChanged());
}

TEST_F(ImageCPUInputTest, withoutAnImageThereIsNoGeometry) {
    OpenSource source;
    ORVO_EXPECT_INTERNAL(source.width(), pNoImage);
    ORVO_EXPECT_INTERNAL(source.height(), pNoImage);
    ORVO_EXPECT_INTERNAL(source.offsetX(), pNoImage);
    ORVO_EXPECT_INTERNAL(source.offsetY(), pNoImage);
    ORVO_EXPECT_INTERNAL(source.offset(), pNoImage);
    ORVO_EXPECT_INTERNAL(source.size(), pNoImage);
    ORVO_EXPECT_INTERNAL(source.getNumChannelsOutput(), pNoImage);
    EXPECT_EQ(nullptr, source.getImageCPU());
    EXPECT_EQ(nullptr, source.operator->());
    EXPECT_FALSE(source.generated({}).extent().isDefined());
    EXPECT_EQ(nullptr, source.releaseImageCPU());
}

TEST_F(ImageCPUInputTest, reportsTheGeometryOfItsImage) {
    OpenSource source;
    ImagePtr const upImage = image();
    upImage->setPixelExtent(PixelExtentInWorldSpace(2, 0.5f));
    source.setImageCPUWithNoOwnership(upImage.get());
    EXPECT_EQ(4, source.width());
    EXPECT_EQ(5, source.height());
    EXPECT_EQ(-2, source.offsetX());
    EXPECT_EQ(3, source.offsetY());
    EXPECT_EQ(-2, source.offset().x());
    EXPECT_EQ(3, source.offset().y());
    EXPECT_EQ(ExtentInPixelSpace(4, 5), source.size());
    EXPECT_EQ(upImage.get(), source.getImageCPU());
    EXPECT_EQ(upImage.get(), static_cast<ImageCPUInput const&>(source).getImageCPU());
    EXPECT_EQ(4, source->extent().width());
    EXPECT_EQ(1u, source.getNumChannelsOutput());
    EXPECT_EQ(world(-4, 1.5f, 8, 2.5f), source.generated({}));
    EXPECT_EQ(world(-4, 1.5f, 8, 2.5f), source.computeDomainOfDefinition());
}

TEST_F(ImageCPUInputTest, aGeneratedRegionThatWasSetStays) {
    ImageCPUInput source;
    ImagePtr const upImage = image();
    source.setImageCPUWithNoOwnership(upImage.get());
    source.setGeneratedRegion(world(1, 1, 2, 2));
    EXPECT_EQ(world(1, 1, 2, 2), source.generated({}));
    source.clear();
    EXPECT_EQ(nullptr, source.getImageCPU());
    EXPECT_EQ(world(1, 1, 2, 2), source.generated({}));
}

TEST_F(ImageCPUInputTest, aReleasableImageIsNotReplacedSilently) {
    constexpr char const* pText = "ImageCPU already set on input";
    ImageCPUInput source;
    source.setImageCPU(image().release());
    ImageCPU const* const pFirst = source.getImageCPU();
    ImagePtr const upSecond = image();
    ORVO_EXPECT_INTERNAL(source.setImageCPU(upSecond.get()), pText);
    ORVO_EXPECT_INTERNAL(source.setImageCPUWithNoOwnership(upSecond.get()), pText);
    ORVO_EXPECT_INTERNAL(source.setImageCPUWithRegularOwnership(upSecond.get()), pText);
    float const aPixels[4] = {};
    ORVO_EXPECT_INTERNAL(source.load32BitFloatImageData(aPixels, pixels(0, 0, 1, 1),
                                                        PixelExtentInWorldSpace(), PIXEL_LAYOUT_RGBA, 0),
                         pText);
    EXPECT_EQ(pFirst, source.getImageCPU());
    source.clear();
    source.setImageCPUWithNoOwnership(upSecond.get());
    EXPECT_EQ(upSecond.get(), source.getImageCPU());
}

TEST_F(ImageCPUInputTest, imagesOfOtherOwnershipAreReplaced) {
    ImageCPUInput source;
    ImagePtr const upFirst = image();
    ImagePtr const upSecond = image();
    source.setImageCPUWithNoOwnership(upFirst.get());
    source.setImageCPUWithNoOwnership(upSecond.get());
    source.setImageCPUWithRegularOwnership(image().release());
    source.setImageCPUWithRegularOwnership(image().release()); // the one before dies
    source.setImageCPU(image().release());
    EXPECT_NE(nullptr, source.getImageCPU());
}

TEST_F(ImageCPUInputTest, givesAReleasableImageBack) {
    ImageCPUInput source;
    ImageCPU* const pImage = image().release();
    source.setImageCPU(pImage);
    ImagePtr const upBack(source.releaseImageCPU());
    EXPECT_EQ(pImage, upBack.get());
    EXPECT_EQ(nullptr, source.getImageCPU());
    source.setImageCPU(image().release());
}

TEST_F(ImageCPUInputTest, keepsAnImageThatTheOutputShares) {
    OpenSource source;
    source.setImageCPU(image().release());
    ImageCPU const* const pImage = source.getImageCPU();
    source.internalProcess();
    EXPECT_EQ(pImage, source.imageOutput()->data());
    ORVO_EXPECT_INTERNAL(source.releaseImageCPU(), "wasReleased");
    EXPECT_EQ(pImage, source.getImageCPU());
    source.flush();
    ImagePtr const upBack(source.releaseImageCPU());
    EXPECT_EQ(pImage, upBack.get());
}

TEST_F(ImageCPUInputTest, cannotGiveBackWhatItDoesNotHoldForRelease) {
    ImageCPUInput source;
    ImagePtr const upImage = image();
    source.setImageCPUWithNoOwnership(upImage.get());
    ORVO_EXPECT_INTERNAL(source.releaseImageCPU(), "Enforce deleter != NULL");
    EXPECT_EQ(upImage.get(), source.getImageCPU());
    source.setImageCPUWithRegularOwnership(image().release());
    ORVO_EXPECT_INTERNAL(source.releaseImageCPU(), "Enforce deleter != NULL");
    EXPECT_NE(nullptr, source.getImageCPU());
}

TEST_F(ImageCPUInputTest, aChangedBufferIsReportedOnce) {
    ImageCPUInput source;
    ImagePtr const upImage = image();
    source.setImageCPUWithNoOwnership(upImage.get());
    EXPECT_TRUE(source.hasBufferChanged());
    EXPECT_FALSE(source.hasBufferChanged());
    source.setImageCPUWithRegularOwnership(image().release());
    EXPECT_TRUE(source.hasBufferChanged());
    source.setImageCPU(image().release());
    EXPECT_TRUE(source.hasBufferChanged());
    EXPECT_FALSE(source.hasBufferChanged());
}

TEST_F(ImageCPUInputTest, runsOnceForEachEmit) {
    OpenSource source;
    TestFilter consumer(1, false);
    feed(consumer, 0, source);
    ImagePtr const upImage = image();
    source.setImageCPUWithNoOwnership(upImage.get());
    EXPECT_FALSE(source.isReady());
    source.emit();
    EXPECT_TRUE(source.isReady());
    source.internalProcess();
    EXPECT_FALSE(source.isReady());
    source.flushOutputs();
    EXPECT_FALSE(source.isReady());
    source.emit();
    EXPECT_TRUE(source.isReady());
    source.internalProcess();
    source.emit();
    EXPECT_FALSE(source.isReady()); // the output is still full
}

TEST_F(ImageCPUInputTest, thePullStopsAtASourceThatHasNothingNew) {
    ImageCPUInput source;
    TestFilter sink(1, false);
    feed(sink, 0, source);
    ImageFlowController controller;
    plant(controller, {&source, &sink}, sink);
    ImagePtr const upImage = image();
    source.setImageCPUWithNoOwnership(upImage.get());
    controller.process();
    EXPECT_EQ(0, sink.nRuns_);
    source.emit();
    controller.process();
    EXPECT_EQ(1, sink.nRuns_);
    controller.process();
    EXPECT_EQ(1, sink.nRuns_);
}

TEST_F(ImageCPUInputTest, theImageSurvivesAFlush) {
    OpenSource source;
    ImagePtr const upImage = image();
    source.setImageCPUWithNoOwnership(upImage.get());
    source.internalProcess();
    source.setProcessing(true);
    source.flush();
    EXPECT_FALSE(source.isProcessing());
    EXPECT_FALSE(source.imageOutput()->hasData());
    EXPECT_EQ(upImage.get(), source.getImageCPU());
}

TEST_F(ImageCPUInputTest, allocatesNothing) {
    OpenSource source;
    ImagePtr const upImage = image();
    source.setImageCPUWithNoOwnership(upImage.get());
    source.computeRegionParameter().setValue(world(-2, 3, 4, 5));
    source.allocateOutputImage();
    EXPECT_EQ(4u, source.rangeToProcess().unitsPerItem);
    source.prepareForRender();
    source.internalProcess();
    EXPECT_EQ(upImage.get(), source.imageOutput()->data());
}

// Raw pixels

struct LayoutRow {
    int layout;
    ImageCPU::tePixelFormat format;
};

/// Loads 3 by 4 pixels at a pitch of 4 and compares what the source makes of each layout.
template <typename Channel, typename Load>
void expectLayouts(Load load, std::initializer_list<LayoutRow> rows) {
    Channel const aPixels[64] = {};
    for (LayoutRow const& row : rows) {
        SCOPED_TRACE(testing::Message() << "layout " << row.layout);
        ImageCPUInput source;
        (source.*load)(aPixels, pixels(-1, 2, 3, 4), PixelExtentInWorldSpace(2, 3),
                       static_cast<tePixelFormat>(row.layout), 4);
        EXPECT_EQ(row.format, source->pixelFormat());
        EXPECT_EQ(static_cast<void const*>(aPixels), source->pixels());
        EXPECT_EQ(pixels(-1, 2, 3, 4), source->positionExtent());
        EXPECT_EQ(PixelExtentInWorldSpace(2, 3), source->pixelExtent());
        EXPECT_EQ(ExtentInPixelSpace(4, 4), source->capacityExtent());
        EXPECT_TRUE(source.hasBufferChanged());
        ORVO_EXPECT_INTERNAL(source.releaseImageCPU(), "Enforce deleter != NULL"); // regular ownership
        (source.*load)(aPixels, pixels(0, 0, 1, 1), PixelExtentInWorldSpace(),
                       static_cast<tePixelFormat>(row.layout), 0);
        EXPECT_EQ(ExtentInPixelSpace(1, 1), source->capacityExtent());
    }
}

TEST_F(ImageCPUInputTest, loadsBytes) {
    expectLayouts<unsigned char>(&ImageCPUInput::load8BitUnsignedImageData,
                                 {{0, ImageCPU::PIXEL_FORMAT_BGRA8},
                                  {1, ImageCPU::PIXEL_FORMAT_RGBA8},
                                  {2, ImageCPU::PIXEL_FORMAT_BGRA8},
                                  {3, ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8},
                                  {4, ImageCPU::PIXEL_FORMAT_BGRA8}});
}

TEST_F(ImageCPUInputTest, loadsWords) {
    expectLayouts<unsigned short>(&ImageCPUInput::load16BitUnsignedImageData,
                                  {{0, ImageCPU::PIXEL_FORMAT_RGBA16},
                                   {1, ImageCPU::PIXEL_FORMAT_RGBA16},
                                   {2, ImageCPU::PIXEL_FORMAT_RGBA16},
                                   {3, ImageCPU::PIXEL_FORMAT_LUMINANCE16},
                                   {4, ImageCPU::PIXEL_FORMAT_RGBA16}});
}

TEST_F(ImageCPUInputTest, loadsFloats) {
    expectLayouts<float>(&ImageCPUInput::load32BitFloatImageData, {{0, ImageCPU::PIXEL_FORMAT_RGBA32F},
                                                                   {1, ImageCPU::PIXEL_FORMAT_RGBA32F},
                                                                   {2, ImageCPU::PIXEL_FORMAT_RGBA32F},
                                                                   {3, ImageCPU::PIXEL_FORMAT_LUMINANCE32F},
                                                                   {4, ImageCPU::PIXEL_FORMAT_RGBA32F}});
}

TEST_F(ImageCPUInputTest, loadsNoHalves) {
    ImageCPUInput source;
    unsigned short const aPixels[16] = {};
    ORVO_EXPECT_INTERNAL(source.load16BitFloatImageData(aPixels, pixels(0, 0, 2, 2),
                                                        PixelExtentInWorldSpace(), PIXEL_LAYOUT_RGBA, 0),
                         "load16BitFloatImageData not supported for the CPU input connector");
}

TEST_F(ImageCPUInputTest, refusesRawPixelsThatCannotBeAnImage) {
    ImageCPUInput source;
    ImagePtr const upImage = image();
    source.setImageCPUWithNoOwnership(upImage.get());
    unsigned char const aPixels[64] = {};
    auto const load = [&](unsigned char const* p, PositionExtentInPixelSpace const& region,
                          unsigned int rowLength) {
        source.load8BitUnsignedImageData(p, region, PixelExtentInWorldSpace(), PIXEL_LAYOUT_RGBA, rowLength);
    };
    ORVO_EXPECT_PARAMETER(load(nullptr, pixels(0, 0, 2, 2), 0), "Image has no pixels");
    ORVO_EXPECT_PARAMETER(load(aPixels, pixels(0, 0, -2, 2), 0), "Image extent must not be negative");
    ORVO_EXPECT_PARAMETER(load(aPixels, pixels(0, 0, 2, -2), 0), "Image extent must not be negative");
    ORVO_EXPECT_PARAMETER(load(aPixels, pixels(0, 0, 3, 2), 2),
                          "Row length does not fit the width of the image");
    ORVO_EXPECT_PARAMETER(load(aPixels, pixels(0, 0, 3, 2), unsigned(INT_MAX) + 1u),
                          "Row length does not fit the width of the image");
    ORVO_EXPECT_PARAMETER(load(aPixels, pixels(0, 0, 70000, 70000), 0),
                          "Image size exceeds 4294967295 bytes");
    ORVO_EXPECT_INTERNAL(source.load8BitUnsignedImageData(aPixels, pixels(0, 0, 2, 2),
                                                          PixelExtentInWorldSpace(0, 1), PIXEL_LAYOUT_RGBA,
                                                          0),
                         "pixelExtent.pixelExtent().extentAsFloat2().x > 0");
    EXPECT_EQ(upImage.get(), source.getImageCPU());
    load(nullptr, pixels(5, 6, 0, 0), 0);
    EXPECT_EQ(0u, source->numberOfPixels());
}

} // namespace

} // namespace ORVO
