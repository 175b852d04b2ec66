#include "orvo/image_flow/filters/GPU2CPU.h"

#include "orvo/image_runtime/TexturePool.h"
#include "tests/image_flow/support/GPURoads.h"

namespace ORVO {

namespace {

using Test::aTextureFormats;
using Test::Chain;
using Test::failEveryCall;
using Test::GLHooks;
using Test::HostImage;
using Test::ImageGPUPtr;
using Test::pixels;
using Test::texelsFor;
using Test::textureImage;
using Test::worldOf;
using Test::writeTexels;

using Bytes = std::vector<unsigned char>;

class GPU2CPUTest : public Test::GLFlowTest {};

/// A texture, its read-back and the sink that takes the host image out.
struct Road {
    Road(OGL::Context const& context, ImageGPU& image) : oChain_(context, {&oSource_, &oRead_, &oSink_}) {
        oSource_.setImageGPUWithNoOwnership(&image);
        oSource_.setOutputPixelExtent(image.pixelExtent());
    }
    ImageGPUInput oSource_;
    GPU2CPU oRead_;
    ImageCPUOutput oSink_;
    Chain oChain_;
};

/// The same into a bound host image.
struct BoundRoad {
    BoundRoad(OGL::Context const& context, ImageGPU& image, ImageCPU& bound)
        : oChain_(context, {&oSource_, &oRead_}) {
        oSource_.setImageGPUWithNoOwnership(&image);
        oSource_.setOutputPixelExtent(image.pixelExtent());
        oRead_.setBoundOutputImage(&bound);
    }
    ImageGPUInput oSource_;
    GPU2CPU oRead_;
    Chain oChain_;
};

/// The pixels of a rectangle of a host image, as tight rows.
Bytes tightRows(ImageCPU const& image, PositionExtentInPixelSpace const& part) {
    std::size_t const nPixel = pixelSizeBytes(image.pixelFormat());
    Bytes aBytes;
    for (int row = 0; row < part.extent().height(); ++row) {
        std::ptrdiff_t const nFirst = std::ptrdiff_t(part.position().y() - image.position().y() + row) *
                                          image.capacityExtent().width() +
                                      part.position().x() - image.position().x();
        unsigned char const* const pRow = image.pixels() + std::size_t(nFirst) * nPixel;
        aBytes.insert(aBytes.end(), pRow, pRow + std::size_t(part.extent().width()) * nPixel);
    }
    return aBytes;
}

TEST_F(GPU2CPUTest, isAConverterOffTheGPU) {
    GPU2CPU node;
    EXPECT_EQ("GPU2CPU", node.name());
    EXPECT_EQ(ORVO_TARGET_GL, node.getInputTargetPlatform());
    EXPECT_EQ(ORVO_TARGET_CPU, node.getOutputTargetPlatform());
    ASSERT_EQ(1u, node.numberOfImageInputs());
    EXPECT_EQ("InputImage", node.imageInput(0)->name());
    EXPECT_EQ("OutputImage", node.imageOutput()->name());
    EXPECT_TRUE(typeid(ImageGPU) == node.imageInput(0)->datatype());
    EXPECT_TRUE(typeid(ImageCPU) == node.imageOutput()->datatype());
}

struct Row {
    ImageGPU::tePixelFormat eTexture;
    ImageCPU::tePixelFormat eFormat;
};

constexpr Row aRows[] = {
    {ImageGPU::PIXEL_FORMAT_RGBA8, ImageCPU::PIXEL_FORMAT_RGBA8},
    {ImageGPU::PIXEL_FORMAT_RGBA16F, ImageCPU::PIXEL_FORMAT_RGBA16F},
    {ImageGPU::PIXEL_FORMAT_RGBA32F, ImageCPU::PIXEL_FORMAT_RGBA32F},
    {ImageGPU::PIXEL_FORMAT_RGB8, ImageCPU::PIXEL_FORMAT_RGB8},
    {ImageGPU::PIXEL_FORMAT_RGB16F, ImageCPU::PIXEL_FORMAT_RGB16F},
    {ImageGPU::PIXEL_FORMAT_RGB32F, ImageCPU::PIXEL_FORMAT_RGB32F},
    {ImageGPU::PIXEL_FORMAT_LUMINANCE8, ImageCPU::PIXEL_FORMAT_LUMINANCE8},
    {ImageGPU::PIXEL_FORMAT_LUMINANCE32F, ImageCPU::PIXEL_FORMAT_LUMINANCE32F},
    {ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8},
    {ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F, ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F}};

TEST_F(GPU2CPUTest, everyFormatComesDownBitForBit) {
    PixelExtentInWorldSpace const pixelExtent(2, 0.5f);
    for (Row const& row : aRows) {
        for (bool const bExact : {true, false}) {
            ImageGPUPtr const upImage = textureImage(pixels(-7, 5, 13, 9), row.eTexture, bExact);
            upImage->setPixelExtent(pixelExtent);
            Bytes const aTexels = texelsFor(*upImage);
            writeTexels(*upImage, aTexels);
            Road road(context(), *upImage);
            road.oChain_.run(worldOf(pixels(-7, 5, 13, 9), pixelExtent));
            ImageCPU const* const pResult = road.oSink_.getImageCPU();
            ASSERT_NE(nullptr, pResult) << row.eTexture;
            EXPECT_EQ(row.eFormat, pResult->pixelFormat()) << row.eTexture;
            EXPECT_EQ(pixels(-7, 5, 13, 9), pResult->positionExtent());
            EXPECT_EQ(pixelExtent, pResult->pixelExtent());
            EXPECT_EQ(upImage->capacityExtent(), pResult->capacityExtent());
            EXPECT_EQ(aTexels, tightRows(*pResult, pixels(-7, 5, 13, 9))) << row.eTexture << bExact;
        }
    }
}

TEST_F(GPU2CPUTest, onlyTheRegionIsRead) {
    ImageGPUPtr const upImage = textureImage(pixels(2, 3, 8, 6), ImageGPU::PIXEL_FORMAT_LUMINANCE8, false);
    writeTexels(*upImage, Bytes(48, 200));
    HostImage host(ImageCPU::PIXEL_FORMAT_LUMINANCE8, pixels(1, 1, 12, 12), 3, 77);
    BoundRoad road(context(), *upImage, host.image());
    Bytes aExpected = host.storage();
    road.oChain_.run(worldOf(pixels(4, 5, 3, 2)));
    for (std::size_t y = 4; y < 6; ++y)
        for (std::size_t x = 3; x < 6; ++x)
            aExpected[y * 15 + x] = 200;
    EXPECT_EQ(aExpected, host.storage());
}

TEST_F(GPU2CPUTest, aBoundImageAsWideAsTheRegionIsReadToo) {
    ImageGPUPtr const upImage = textureImage(pixels(0, 0, 5, 3), ImageGPU::PIXEL_FORMAT_RGB8);
    Bytes const aTexels = texelsFor(*upImage);
    writeTexels(*upImage, aTexels);
    HostImage host(ImageCPU::PIXEL_FORMAT_RGB8, pixels(0, 0, 5, 3));
    BoundRoad road(context(), *upImage, host.image());
    road.oChain_.run(worldOf(pixels(0, 0, 5, 3)));
    EXPECT_EQ(aTexels, host.get());
    Bytes const aStorage = host.storage();
    EXPECT_EQ(Bytes(15, 0xcd), Bytes(aStorage.end() - 15, aStorage.end())) << "the row beyond the image";
}

TEST_F(GPU2CPUTest, aRegionWithoutPixelsReadsNothing) {
    ImageGPUPtr const upImage = textureImage(pixels(5, 5, 4, 4), ImageGPU::PIXEL_FORMAT_RGBA8);
    HostImage host(ImageCPU::PIXEL_FORMAT_RGBA8, pixels(5, 5, 4, 4));
    std::uint64_t const nReads = GLHooks::calls("glReadPixels");
    {
        BoundRoad road(context(), *upImage, host.image());
        road.oChain_.run(worldOf(pixels(0, 0, 2, 2))); // beside the image
        road.oChain_.oController_.computeRegions(PositionExtentInWorldSpace());
        ORVO::Test::emitAll(road.oChain_.oController_);
        road.oChain_.oController_.process();
    }
    EXPECT_EQ(Bytes(host.storageBytes(), 0xcd), host.storage());
    ImageGPUPtr const upEmpty = textureImage(pixels(5, 5, 0, 4), ImageGPU::PIXEL_FORMAT_RGBA8);
    Road road(context(), *upEmpty);
    road.oChain_.run(worldOf(pixels(0, 0, 20, 20)));
    ASSERT_NE(nullptr, road.oSink_.getImageCPU());
    EXPECT_EQ(0u, road.oSink_.getImageCPU()->numberOfPixels());
    EXPECT_EQ(nReads, GLHooks::calls("glReadPixels"));
}

// Formats of bound images

/// The channels of a texel of any texture of a kind, as floats; (0.2, 0.4, 0.8, 1.0) in red, green, blue and
/// alpha, or in luminance and alpha.
Bytes texelOf(ImageGPU::tePixelFormat format) {
    float const aColour[] = {0.2f, 0.4f, 0.8f, 1.0f};
    switch (format / 4) {
    case 0:
        return ORVO::Test::bytesOf(std::vector<float>(aColour, aColour + 4));
    case 1:
        return ORVO::Test::bytesOf(std::vector<float>(aColour, aColour + 3));
    case 2:
        return ORVO::Test::bytesOf(std::vector<float>{0.2f});
    default:
        return ORVO::Test::bytesOf(std::vector<float>{0.2f, 0.6f});
    }
}

void expectChannels(HostImage& host, std::vector<float> const& aExpected, float tolerance) {
    ImageCPU::tePixelFormat const format = host.image().pixelFormat();
    std::size_t const nBits = channelSizeBits(format);
    for (std::size_t i = 0; i < aExpected.size(); ++i) {
        float const value = nBits == 8    ? float(host.channel<std::uint8_t>(0, 0, i)) / 255.0f
                            : nBits == 16 ? float(host.channel<half>(0, 0, i))
                                          : host.channel<float>(0, 0, i);
        EXPECT_NEAR(aExpected[i], value, tolerance) << format << ", channel " << i;
    }
}

TEST_F(GPU2CPUTest, everyTextureCanBeReadIntoEveryBoundFormat) {
    struct Bound {
        ImageCPU::tePixelFormat eFormat;
        std::size_t nChannels;
    };
    constexpr Bound aBound[] = {
        {ImageCPU::PIXEL_FORMAT_RGBA8, 4},        {ImageCPU::PIXEL_FORMAT_RGB8, 3},
        {ImageCPU::PIXEL_FORMAT_LUMINANCE8, 1},   {ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, 2},
        {ImageCPU::PIXEL_FORMAT_RGBA16F, 4},      {ImageCPU::PIXEL_FORMAT_RGB16F, 3},
        {ImageCPU::PIXEL_FORMAT_RGBA32F, 4},      {ImageCPU::PIXEL_FORMAT_RGB32F, 3},
        {ImageCPU::PIXEL_FORMAT_LUMINANCE32F, 1}, {ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F, 2}};
    for (ImageGPU::tePixelFormat const format : aTextureFormats) {
        ImageGPUPtr const upImage = textureImage(pixels(0, 0, 1, 1), format);
        Bytes const aTexel = texelOf(format);
        upImage->copyImageData(aTexel.data(), pixels(0, 0, 1, 1), PixelExtentInWorldSpace(),
                               ORVO::Test::TexelLayout(format).nFormat_, GL_FLOAT, 0);
        bool const bColour = format < ImageGPU::PIXEL_FORMAT_LUMINANCE8;
        bool const bGrey = format / 4 == 2;
        for (Bound const& bound : aBound) {
            HostImage host(bound.eFormat, pixels(0, 0, 1, 1));
            BoundRoad road(context(), *upImage, host.image());
            road.oChain_.run(worldOf(pixels(0, 0, 1, 1)));
            SCOPED_TRACE(testing::Message() << "texture " << format);
            float const tolerance = 1.0f / 255.0f;
            if (bound.nChannels == 1) // the red channel, not the sum of three
                expectChannels(host, {0.2f}, tolerance);
            else if (bound.nChannels == 2)
                expectChannels(host, {0.2f, bColour || bGrey ? 1.0f : 0.6f}, tolerance);
            else if (bColour)
                expectChannels(host, {0.2f, 0.4f, 0.8f}, tolerance);
        }
    }
}

TEST_F(GPU2CPUTest, numbersBeyondTheRangeAreClampedInBytesAlone) {
    ImageGPUPtr const upImage = textureImage(pixels(0, 0, 1, 1), ImageGPU::PIXEL_FORMAT_RGBA32F);
    writeTexels(*upImage, ORVO::Test::bytesOf(std::vector<float>{-1.5f, 2.5f, 0.5f, 1.0f}));
    HostImage bytes(ImageCPU::PIXEL_FORMAT_RGBA8, pixels(0, 0, 1, 1));
    HostImage floats(ImageCPU::PIXEL_FORMAT_RGBA32F, pixels(0, 0, 1, 1));
    HostImage halves(ImageCPU::PIXEL_FORMAT_RGBA16F, pixels(0, 0, 1, 1));
    for (HostImage* pHost : {&bytes, &floats, &halves}) {
        BoundRoad road(context(), *upImage, pHost->image());
        road.oChain_.run(worldOf(pixels(0, 0, 1, 1)));
    }
    EXPECT_EQ(0, bytes.channel<std::uint8_t>(0, 0, 0));
    EXPECT_EQ(255, bytes.channel<std::uint8_t>(0, 0, 1));
    EXPECT_NEAR(127.5, bytes.channel<std::uint8_t>(0, 0, 2), 0.5);
    EXPECT_EQ(-1.5f, floats.channel<float>(0, 0, 0));
    EXPECT_EQ(2.5f, floats.channel<float>(0, 0, 1));
    EXPECT_EQ(-1.5f, float(halves.channel<half>(0, 0, 0)));
    EXPECT_EQ(2.5f, float(halves.channel<half>(0, 0, 1)));
}

TEST_F(GPU2CPUTest, formatsThatDoNotComeDownAreRefused) {
    for (ImageGPU::tePixelFormat const format :
         {ImageGPU::PIXEL_FORMAT_RGBA16, ImageGPU::PIXEL_FORMAT_RGB16, ImageGPU::PIXEL_FORMAT_LUMINANCE16}) {
        ImageGPUPtr const upImage = textureImage(pixels(0, 0, 2, 2), format);
        Road road(context(), *upImage);
        ORVO_EXPECT_INTERNAL(road.oChain_.run(worldOf(pixels(0, 0, 2, 2))),
                             "Not implemented: pixelFormat in GPU2CPU::internalProcess()");
        EXPECT_EQ(nullptr, road.oSink_.getImageCPU());
    }
    // There are no host images of these.
    for (ImageGPU::tePixelFormat const format :
         {ImageGPU::PIXEL_FORMAT_LUMINANCE16F, ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA16F}) {
        ImageGPUPtr const upImage = textureImage(pixels(0, 0, 2, 2), format);
        Road road(context(), *upImage);
        ORVO_EXPECT_INTERNAL(road.oChain_.run(worldOf(pixels(0, 0, 2, 2))),
                             "Not implemented: ePixelFormat in pixelSizeBytes().");
    }
    ImageGPU undefined;
    Road road(context(), undefined);
    ORVO_EXPECT_INTERNAL(road.oChain_.run(worldOf(pixels(0, 0, 2, 2))), "!\"PIXEL_FORMAT_UNDEFINED\"");
}

TEST_F(GPU2CPUTest, boundImagesOfOtherFormatsAreRefusedAndStayAsTheyWere) {
    ImageGPUPtr const upImage = textureImage(pixels(0, 0, 2, 2), ImageGPU::PIXEL_FORMAT_RGBA8);
    for (ImageCPU::tePixelFormat const format :
         {ImageCPU::PIXEL_FORMAT_BGR8, ImageCPU::PIXEL_FORMAT_BGRA8, ImageCPU::PIXEL_FORMAT_RGB16,
          ImageCPU::PIXEL_FORMAT_RGBA16, ImageCPU::PIXEL_FORMAT_LUMINANCE16,
          ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA16}) {
        HostImage host(format, pixels(0, 0, 2, 2));
        BoundRoad road(context(), *upImage, host.image());
        ORVO_EXPECT_INTERNAL(road.oChain_.run(worldOf(pixels(0, 0, 2, 2))),
                             "Not implemented: pixelFormat in GPU2CPU::convert()");
        EXPECT_EQ(Bytes(host.storageBytes(), 0xcd), host.storage());
    }
}

// Geometry

TEST_F(GPU2CPUTest, aBoundImageOfAnotherPixelExtentIsRefused) {
    ImageGPUPtr const upImage = textureImage(pixels(0, 0, 2, 2), ImageGPU::PIXEL_FORMAT_RGBA8);
    HostImage host(ImageCPU::PIXEL_FORMAT_RGBA8, pixels(0, 0, 2, 2), 0, 0xcd, PixelExtentInWorldSpace(2, 1));
    BoundRoad road(context(), *upImage, host.image());
    ORVO_EXPECT_INTERNAL(road.oChain_.run(worldOf(pixels(0, 0, 2, 2))),
                         "resultCPU_->pixelExtent() == o_InputImage->pixelExtent()");
}

TEST_F(GPU2CPUTest, aRegionOutsideTheBoundImageIsRefused) {
    ImageGPUPtr const upImage = textureImage(pixels(0, 0, 4, 4), ImageGPU::PIXEL_FORMAT_RGBA8);
    for (auto const& bound :
         {pixels(1, 0, 3, 4), pixels(0, 1, 4, 3), pixels(0, 0, 3, 4), pixels(0, 0, 4, 3)}) {
        HostImage host(ImageCPU::PIXEL_FORMAT_RGBA8, bound);
        BoundRoad road(context(), *upImage, host.image());
        ORVO_EXPECT_INTERNAL(road.oChain_.run(worldOf(pixels(0, 0, 4, 4))),
                             "Compute region lies outside the bound output image");
        EXPECT_EQ(Bytes(host.storageBytes(), 0xcd), host.storage());
    }
}

TEST_F(GPU2CPUTest, aRegionThatANewImageDoesNotReachIsRefused) {
    // The source claims more than its image has.
    struct Case {
        PositionExtentInPixelSpace oClaim;
        char const* pText;
    };
    Case const aCases[] = {
        {pixels(-1, 0, 4, 4), "resultCPU_->position().x() <= computeRegion.position().x()"},
        {pixels(0, -1, 4, 4), "resultCPU_->position().y() <= computeRegion.position().y()"},
        {pixels(0, 0, 5, 4), "resultCPU_->extent().width() >= computeRegion.extent().width()"},
        {pixels(0, 0, 4, 5), "resultCPU_->extent().height() >= computeRegion.extent().height()"}};
    ImageGPUPtr const upImage = textureImage(pixels(0, 0, 4, 4), ImageGPU::PIXEL_FORMAT_RGBA8);
    for (Case const& one : aCases) {
        Road road(context(), *upImage);
        road.oSource_.setGeneratedRegion(worldOf(one.oClaim));
        ORVO_EXPECT_INTERNAL(road.oChain_.run(worldOf(one.oClaim)), one.pText);
        EXPECT_EQ(nullptr, road.oSink_.getImageCPU());
    }
}

TEST_F(GPU2CPUTest, whatTheTextureDoesNotHoldIsNotRead) {
    ImageGPUPtr const upImage = textureImage(pixels(0, 0, 4, 4), ImageGPU::PIXEL_FORMAT_LUMINANCE8, false);
    writeTexels(*upImage, Bytes(16, 200));
    HostImage host(ImageCPU::PIXEL_FORMAT_LUMINANCE8, pixels(-2, -2, 8, 8), 0, 77);
    BoundRoad road(context(), *upImage, host.image());
    road.oSource_.setGeneratedRegion(worldOf(pixels(-2, -2, 8, 8)));
    road.oChain_.run(worldOf(pixels(-2, -2, 8, 8)));
    for (int y = -2; y < 6; ++y)
        for (int x = -2; x < 6; ++x)
            EXPECT_EQ(x >= 0 && x < 4 && y >= 0 && y < 4 ? 200 : 77, *host.at(x, y)) << x << ", " << y;
}

TEST_F(GPU2CPUTest, theImageMayBeAskedForBeforeTheFrame) {
    ImageGPUPtr const upImage = textureImage(pixels(0, 0, 4, 4), ImageGPU::PIXEL_FORMAT_LUMINANCE8);
    writeTexels(*upImage, Bytes(16, 200));
    HostImage host(ImageCPU::PIXEL_FORMAT_LUMINANCE8, pixels(0, 0, 4, 4));
    BoundRoad road(context(), *upImage, host.image());
    road.oChain_.oController_.computeRegions(worldOf(pixels(0, 0, 4, 4)));
    road.oRead_.prepareForRender();
    ORVO::Test::emitAll(road.oChain_.oController_);
    road.oChain_.oController_.process();
    EXPECT_EQ(Bytes(16, 200), host.get());
}

// State and failures of OpenGL

TEST_F(GPU2CPUTest, theHostsStateDoesNotMatterAndStays) {
    ImageGPUPtr const upImage =
        textureImage(pixels(0, 0, 3, 2), ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, false);
    Bytes const aTexels = texelsFor(*upImage);
    writeTexels(*upImage, aTexels);
    Road road(context(), *upImage);
    GLuint nBuffer = 0;
    glGenBuffers(1, &nBuffer);
    glBindBuffer(GL_PIXEL_PACK_BUFFER, nBuffer);
    glBufferData(GL_PIXEL_PACK_BUFFER, 4096, nullptr, GL_STREAM_READ);
    GLuint aFramebuffers[2] = {};
    glGenFramebuffers(2, aFramebuffers);
    glBindFramebuffer(GL_DRAW_FRAMEBUFFER, aFramebuffers[0]);
    glBindFramebuffer(GL_READ_FRAMEBUFFER, aFramebuffers[1]);
    glPixelStorei(GL_PACK_ALIGNMENT, 8);
    glPixelStorei(GL_PACK_SWAP_BYTES, GL_TRUE);
    glPixelStorei(GL_PACK_SKIP_PIXELS, 2);
    glPixelTransferf(GL_GREEN_SCALE, 0.5f);
    ORVO::Test::GLState const before = ORVO::Test::GLState::capture();
    road.oChain_.run(worldOf(pixels(0, 0, 3, 2)));
    EXPECT_EQ("", before.differencesTo(ORVO::Test::GLState::capture()));
    GLfloat scale = 0;
    glGetFloatv(GL_GREEN_SCALE, &scale);
    EXPECT_EQ(0.5f, scale);
    glGetFloatv(GL_BLUE_SCALE, &scale);
    EXPECT_EQ(1.0f, scale);
    ASSERT_NE(nullptr, road.oSink_.getImageCPU());
    EXPECT_EQ(aTexels, tightRows(*road.oSink_.getImageCPU(), pixels(0, 0, 3, 2)));
    glPixelTransferf(GL_GREEN_SCALE, 1.0f);
    glPixelStorei(GL_PACK_ALIGNMENT, 4);
    glPixelStorei(GL_PACK_SWAP_BYTES, GL_FALSE);
    glPixelStorei(GL_PACK_SKIP_PIXELS, 0);
    glBindFramebuffer(GL_FRAMEBUFFER, 0);
    glDeleteFramebuffers(2, aFramebuffers);
    glBindBuffer(GL_PIXEL_PACK_BUFFER, 0);
    glDeleteBuffers(1, &nBuffer);
}

TEST_F(GPU2CPUTest, everyCallMayFail) {
    ImageGPUPtr const upImage = textureImage(pixels(0, 0, 3, 2), ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA8);
    Bytes const aTexels = texelsFor(*upImage);
    writeTexels(*upImage, aTexels);
    Road road(context(), *upImage);
    ORVO::Test::GLState const before = ORVO::Test::GLState::capture();
    auto const aFailed =
        failEveryCall([&] { road.oChain_.run(worldOf(pixels(0, 0, 3, 2))); },
                      [&] {
                          EXPECT_EQ("", before.differencesTo(ORVO::Test::GLState::capture()));
                          road.oChain_.oController_.flushGraph();
                          road.oChain_.run(worldOf(pixels(0, 0, 3, 2)));
                          ASSERT_NE(nullptr, road.oSink_.getImageCPU());
                          EXPECT_EQ(aTexels, tightRows(*road.oSink_.getImageCPU(), pixels(0, 0, 3, 2)));
                          road.oChain_.oController_.flushGraph();
                      });
    for (char const* pName :
         {"glGenFramebuffers", "glFramebufferTexture2D", "glCheckFramebufferStatus", "glReadPixels"})
        EXPECT_EQ(1u, aFailed.count(pName)) << pName;
}

TEST_F(GPU2CPUTest, needsACurrentContext) {
    ImageGPUPtr const upImage = textureImage(pixels(0, 0, 3, 2), ImageGPU::PIXEL_FORMAT_RGBA8);
    ImageGPUInput source;
    GPU2CPU read;
    source.setImageGPUWithNoOwnership(upImage.get());
    ORVO::Test::feed(read, 0, source);
    ImageFlowController controller;
    controller.addNode(&source);
    controller.addNode(&read);
    controller.setImageSink(read);
    controller.computeRegions(worldOf(pixels(0, 0, 3, 2)));
    ORVO::Test::emitAll(controller);
    host().release();
    ORVO_EXPECT_OGL(controller.process(), "No OpenGL context is current");
    host().makeCurrent();
    EXPECT_FALSE(read.imageOutput()->hasData());
    controller.flushGraph();
    ORVO::Test::emitAll(controller);
    controller.process(); // the host's own context does as well
    EXPECT_TRUE(read.imageOutput()->hasData());
    read.disconnect();
}

TEST_F(GPU2CPUTest, aTextureThatCannotBeReadIsReportedByItsStatus) {
    ImageGPUPtr const upImage = textureImage(pixels(0, 0, 3, 2), ImageGPU::PIXEL_FORMAT_RGBA8);
    Road road(context(), *upImage);
    ORVO::Test::GLCallFailure const failure("glCheckFramebufferStatus", 1);
    ORVO_EXPECT_OGL(road.oChain_.run(worldOf(pixels(0, 0, 3, 2))),
                    "Framebuffer attachment error: GL_FRAMEBUFFER_UNSUPPORTED");
}

} // namespace

} // namespace ORVO
