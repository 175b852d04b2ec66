#include "orvo/image_flow/sources/ImageGPUInput.h"

#include "orvo/image_runtime/TexturePool.h"
#include "orvo/ogl/ExtensionManager.h"
#include "tests/image_flow/support/GPURoads.h"

namespace ORVO {

namespace {

using Test::aTextureFormats;
using Test::Chain;
using Test::failEveryCall;
using Test::GLHooks;
using Test::ImageGPUPtr;
using Test::pixels;
using Test::readTexels;
using Test::texelsFor;
using Test::textureImage;
using Test::TextureNode;
using Test::worldOf;
using Test::writeTexels;

using Bytes = std::vector<unsigned char>;

class ImageGPUInputTest : public Test::GLFlowTest {};

constexpr char const* pAlreadySet = "ImageGPU already set on input";

/// With what subclasses reach made public.
class Source : public ImageGPUInput {
public:
    using ImageGPUInput::ConvertToPixelFormatGL;
    using ImageGPUInput::getNumChannelsOutput;
    using ImageGPUInput::recommendedImageGPUPixelFormat;
};

TEST_F(ImageGPUInputTest, isASourceOnTheGPU) {
    ImageGPUInput source;
    EXPECT_EQ("ImageGPUInput", source.name());
    EXPECT_EQ(ORVO_TARGET_GL, source.getInputTargetPlatform());
    EXPECT_EQ(ORVO_TARGET_GL, source.getOutputTargetPlatform());
    EXPECT_EQ(0u, source.numberOfImageInputs());
    EXPECT_EQ("OutputImage", source.imageOutput()->name());
    EXPECT_TRUE(typeid(ImageGPU) == source.imageOutput()->datatype());
    EXPECT_EQ(ImageFilter::OUTPUT_PRECISION_DEFAULT, source.outputPrecisionHintParameter().value());
    EXPECT_TRUE(source.canEmit());
    EXPECT_EQ(nullptr, source.getImageGPU());
    EXPECT_EQ(nullptr, source.releaseImageGPU());
}

// Emitting and running

TEST_F(ImageGPUInputTest, runsOnceForEachEmitAndSharesItsImage) {
    ImageGPUPtr const upImage = textureImage(pixels(0, 0, 4, 4), ImageGPU::PIXEL_FORMAT_RGBA8);
    ImageGPUInput source;
    TextureNode sink(1, false);
    source.setImageGPUWithNoOwnership(upImage.get());
    Chain chain(context(), {&source, &sink});
    EXPECT_FALSE(source.isReady());
    source.emit();
    EXPECT_TRUE(source.isReady());
    chain.oController_.computeRegions(worldOf(pixels(0, 0, 4, 4)));
    chain.oController_.process();
    EXPECT_EQ(1, sink.nRuns_);
    EXPECT_EQ(upImage.get(), sink.pSeen_);
    chain.oController_.process();
    EXPECT_EQ(1, sink.nRuns_) << "there is nothing new";
    source.emit();
    chain.oController_.process();
    EXPECT_EQ(2, sink.nRuns_);
    chain.oController_.flushGraph();
    EXPECT_EQ(upImage.get(), source.getImageGPU()) << "a flush leaves the image";
}

TEST_F(ImageGPUInputTest, cannotRunWithoutAnImage) {
    ImageGPUInput source;
    TextureNode sink(1, false);
    Chain chain(context(), {&source, &sink});
    source.emit();
    ORVO_EXPECT_INTERNAL(chain.oController_.process(), "imageDataPtr_.hasData()");
}

// Setting and releasing

TEST_F(ImageGPUInputTest, anImageThatItOwnsIsNotReplacedSilently) {
    ImageGPUPtr upFirst = textureImage(pixels(0, 0, 4, 4), ImageGPU::PIXEL_FORMAT_RGBA8);
    ImageGPUPtr const upSecond = textureImage(pixels(0, 0, 4, 4), ImageGPU::PIXEL_FORMAT_RGBA8);
    ImageGPU* const pFirst = upFirst.get();
    ImageGPUInput source;
    source.setImageGPU(upFirst.release());
    ORVO_EXPECT_INTERNAL(source.setImageGPU(upSecond.get()), pAlreadySet);
    ORVO_EXPECT_INTERNAL(source.setImageGPUWithNoOwnership(upSecond.get()), pAlreadySet);
    EXPECT_EQ(pFirst, source.getImageGPU());
    ImageGPUPtr const upReleased(source.releaseImageGPU());
    EXPECT_EQ(pFirst, upReleased.get());
    EXPECT_EQ(nullptr, source.getImageGPU());
    source.setImageGPUWithNoOwnership(upSecond.get());
    source.setImageGPUWithNoOwnership(upReleased.get());
    EXPECT_EQ(upReleased.get(), source.getImageGPU());
    ORVO_EXPECT_INTERNAL(source.releaseImageGPU(), "Enforce deleter != NULL");
    EXPECT_EQ(upReleased.get(), source.getImageGPU());
    source.setImageGPU(textureImage(pixels(0, 0, 4, 4), ImageGPU::PIXEL_FORMAT_RGBA8).release());
    source.clear();
    EXPECT_EQ(nullptr, source.getImageGPU());
    source.setImageGPU(textureImage(pixels(0, 0, 4, 4), ImageGPU::PIXEL_FORMAT_RGBA8).release());
}

TEST_F(ImageGPUInputTest, anImageThatIsSharedIsNotReleased) {
    ImageGPUInput source;
    TextureNode middle(1, true);
    TextureNode sink(1, false);
    source.setImageGPU(textureImage(pixels(0, 0, 4, 4), ImageGPU::PIXEL_FORMAT_RGBA8).release());
    Chain chain(context(), {&source, &middle, &sink});
    middle.onRun_ = [&] { ORVO_EXPECT_INTERNAL(source.releaseImageGPU(), "wasReleased"); };
    chain.run(worldOf(pixels(0, 0, 4, 4)));
    EXPECT_EQ(1, middle.nRuns_);
    EXPECT_NE(nullptr, ImageGPUPtr(source.releaseImageGPU()));
}

TEST_F(ImageGPUInputTest, tellsOnceThatTheImageIsAnother) {
    ImageGPUPtr const upImage = textureImage(pixels(0, 0, 4, 4), ImageGPU::PIXEL_FORMAT_RGBA8);
    ImageGPUInput source;
    EXPECT_FALSE(source.hasBufferChanged());
    source.setImageGPUWithNoOwnership(upImage.get());
    EXPECT_TRUE(source.hasBufferChanged());
    EXPECT_FALSE(source.hasBufferChanged());
    source.setImageGPU(textureImage(pixels(0, 0, 4, 4), ImageGPU::PIXEL_FORMAT_RGBA8).release());
    EXPECT_TRUE(source.hasBufferChanged());
}

// Geometry and channels

TEST_F(ImageGPUInputTest, knowsTheGeometryOfItsImage) {
    ImageGPUInput source;
    constexpr char const* pNone = "No ImageGPU set yet.";
    ORVO_EXPECT_INTERNAL(source.width(), pNone);
    ORVO_EXPECT_INTERNAL(source.height(), pNone);
    ORVO_EXPECT_INTERNAL(source.offsetX(), pNone);
    ORVO_EXPECT_INTERNAL(source.offsetY(), pNone);
    ORVO_EXPECT_INTERNAL(source.offset(), pNone);
    ORVO_EXPECT_INTERNAL(source.size(), pNone);
    EXPECT_FALSE(source.generated({}).extent().isDefined());
    source.setImageGPU(textureImage(pixels(-3, 2, 7, 5), ImageGPU::PIXEL_FORMAT_RGBA8, false).release());
    EXPECT_EQ(7, source.width());
    EXPECT_EQ(5, source.height());
    EXPECT_EQ(-3, source.offsetX());
    EXPECT_EQ(2, source.offsetY());
    EXPECT_EQ(PositionInPixelSpace(-3, 2), source.offset());
    EXPECT_EQ(ExtentInPixelSpace(7, 5), source.size());
    EXPECT_EQ(ORVO::Test::world(-3, 2, 7, 5), source.generated({}));
    source.setGeneratedRegion(ORVO::Test::world(0, 0, 2, 2));
    EXPECT_EQ(ORVO::Test::world(0, 0, 2, 2), source.generated({}));
    source.clear();
    EXPECT_EQ(ORVO::Test::world(0, 0, 2, 2), source.generated({}));
    ORVO_EXPECT_INTERNAL(source.width(), pNone);
}

TEST_F(ImageGPUInputTest, reportsTheChannelsThatItsFormatStates) {
    std::size_t const aChannels[] = {4, 0, 4, 4, 3, 0, 3, 3, 1, 1, 0, 1, 2, 0, 2, 2};
    for (ImageGPU::tePixelFormat const format : aTextureFormats) {
        Source source;
        EXPECT_EQ(0u, source.getNumChannelsOutput());
        source.setImageGPU(textureImage(pixels(0, 0, 1, 1), format).release());
        EXPECT_EQ(aChannels[format], source.getNumChannelsOutput()) << format;
    }
}

// A source whose output is bound

TEST_F(ImageGPUInputTest, copiesItsRegionIntoABoundTexture) {
    for (ImageGPU::tePixelFormat const format : aTextureFormats) {
        ImageGPUPtr const upImage = textureImage(pixels(-2, 3, 9, 7), format, false);
        Bytes const aTexels = texelsFor(*upImage);
        writeTexels(*upImage, aTexels);
        ImageGPUPtr const upBound = textureImage(pixels(-4, 0, 13, 12), format, false);
        writeTexels(*upBound, Bytes(13 * 12 * ORVO::Test::TexelLayout(format).pixelBytes(), 0));
        ImageGPUInput source;
        source.setImageGPUWithNoOwnership(upImage.get());
        source.setBoundOutputImage(upBound.get());
        Chain chain(context(), {&source});
        chain.run(worldOf(pixels(0, 4, 4, 5)));
        std::size_t const nPixel = ORVO::Test::TexelLayout(format).pixelBytes();
        Bytes aExpected(13 * 12 * nPixel, 0);
        for (std::size_t row = 0; row < 5; ++row)
            std::memcpy(&aExpected[((row + 4) * 13 + 4) * nPixel], &aTexels[((row + 1) * 9 + 2) * nPixel],
                        4 * nPixel);
        EXPECT_EQ(aExpected, readTexels(*upBound)) << format;
        EXPECT_EQ(aTexels, readTexels(*upImage)) << format;
    }
}

TEST_F(ImageGPUInputTest, convertsTheChannelTypeIntoABoundTexture) {
    ImageGPUPtr const upImage = textureImage(pixels(0, 0, 1, 1), ImageGPU::PIXEL_FORMAT_RGBA32F);
    writeTexels(*upImage, ORVO::Test::bytesOf(std::vector<float>{-1.0f, 2.0f, 1.0f, 0.0f}));
    ImageGPUPtr const upBytes = textureImage(pixels(0, 0, 1, 1), ImageGPU::PIXEL_FORMAT_RGBA8);
    ImageGPUPtr const upHalves = textureImage(pixels(0, 0, 1, 1), ImageGPU::PIXEL_FORMAT_RGBA16F);
    for (ImageGPU* pBound : {upBytes.get(), upHalves.get()}) {
        ImageGPUInput source;
        source.setImageGPUWithNoOwnership(upImage.get());
        source.setBoundOutputImage(pBound);
        Chain chain(context(), {&source});
        chain.run(worldOf(pixels(0, 0, 1, 1)));
    }
    EXPECT_EQ((Bytes{0, 255, 255, 0}), readTexels(*upBytes));
    EXPECT_EQ(ORVO::Test::bytesOf(std::vector<float>{-1.0f, 2.0f, 1.0f, 0.0f}),
              readTexels(*upHalves, ImageGPU::PIXEL_FORMAT_RGBA32F));
}

TEST_F(ImageGPUInputTest, refusesABoundTextureOfOtherChannelsOrOfAnotherPlace) {
    ImageGPUPtr const upImage = textureImage(pixels(0, 0, 4, 4), ImageGPU::PIXEL_FORMAT_RGBA8);
    for (ImageGPU::tePixelFormat const format :
         {ImageGPU::PIXEL_FORMAT_RGB8, ImageGPU::PIXEL_FORMAT_LUMINANCE8,
          ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA8}) {
        ImageGPUPtr const upBound = textureImage(pixels(0, 0, 4, 4), format);
        ImageGPUInput source;
        source.setImageGPUWithNoOwnership(upImage.get());
        source.setBoundOutputImage(upBound.get());
        Chain chain(context(), {&source});
        ORVO_EXPECT_PARAMETER(chain.run(worldOf(pixels(0, 0, 4, 4))),
                              "Source and bound output image differ in their channels");
    }
    ImageGPUPtr const upBound = textureImage(pixels(0, 0, 4, 3), ImageGPU::PIXEL_FORMAT_RGBA8, false);
    ImageGPUInput source;
    source.setImageGPUWithNoOwnership(upImage.get());
    source.setBoundOutputImage(upBound.get());
    Chain chain(context(), {&source});
    ORVO_EXPECT_INTERNAL(chain.run(worldOf(pixels(0, 0, 4, 4))),
                         "Compute region lies outside the bound output image");
    chain.oController_.flushGraph();
    chain.run(worldOf(pixels(0, 0, 4, 3)));
}

TEST_F(ImageGPUInputTest, aSourceBoundToItsOwnImageLeavesIt) {
    ImageGPUPtr const upImage = textureImage(pixels(0, 0, 4, 4), ImageGPU::PIXEL_FORMAT_RGBA8);
    Bytes const aTexels = texelsFor(*upImage);
    writeTexels(*upImage, aTexels);
    ImageGPUInput source;
    source.setImageGPUWithNoOwnership(upImage.get());
    source.setBoundOutputImage(upImage.get());
    Chain chain(context(), {&source});
    chain.run(worldOf(pixels(0, 0, 4, 4)));
    EXPECT_EQ(aTexels, readTexels(*upImage));
}

TEST_F(ImageGPUInputTest, everyCallOfTheCopyMayFail) {
    ImageGPUPtr const upImage = textureImage(pixels(0, 0, 4, 4), ImageGPU::PIXEL_FORMAT_RGBA8);
    Bytes const aTexels = texelsFor(*upImage);
    writeTexels(*upImage, aTexels);
    ImageGPUPtr const upBound = textureImage(pixels(0, 0, 4, 4), ImageGPU::PIXEL_FORMAT_RGBA8);
    ImageGPUInput source;
    source.setImageGPUWithNoOwnership(upImage.get());
    source.setBoundOutputImage(upBound.get());
    Chain chain(context(), {&source});
    auto const before = ORVO::Test::GLState::capture();
    auto const aFailed =
        failEveryCall([&] { chain.run(worldOf(pixels(0, 0, 4, 4))); },
                      [&] {
                          EXPECT_EQ("", before.differencesTo(ORVO::Test::GLState::capture()));
                          chain.oController_.flushGraph();
                          chain.run(worldOf(pixels(0, 0, 4, 4)));
                          EXPECT_EQ(aTexels, readTexels(*upBound));
                      });
    for (char const* pName :
         {"glGenFramebuffers", "glFramebufferTexture2D", "glCheckFramebufferStatus", "glCopyTexSubImage2D"})
        EXPECT_EQ(1u, aFailed.count(pName)) << pName;
}

} // namespace

} // namespace ORVO
