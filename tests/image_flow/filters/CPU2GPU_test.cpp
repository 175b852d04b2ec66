#include "orvo/image_flow/filters/CPU2GPU.h"

#include "orvo/image_runtime/TexturePool.h"
#include "tests/image_flow/support/GPURoads.h"
#include "tests/support/ImageFlowLayers.h"

namespace ORVO {

namespace {

using Test::aTextureFormats;
using Test::Chain;
using Test::GLCallFailure;
using Test::GLHooks;
using Test::HostImage;
using Test::ImageGPUPtr;
using Test::pixels;
using Test::readTexels;
using Test::TexelLayout;
using Test::textureImage;
using Test::worldOf;
using Test::writeTexels;

class CPU2GPUTest : public Test::GLFlowTest {};

/// A host image, its upload and the sink that takes the texture out.
struct Road {
    Road(OGL::Context const& context, ImageCPU& image) : oChain_(context, {&oSource_, &oUpload_, &oSink_}) {
        set(image);
    }
    void set(ImageCPU& image) {
        oSource_.setImageCPUWithNoOwnership(&image);
        oSource_.setOutputPixelExtent(image.pixelExtent());
    }
    ImageCPUInput oSource_;
    CPU2GPU oUpload_;
    ImageGPUOutput oSink_;
    Chain oChain_;
};

/// The same into a bound texture.
struct BoundRoad {
    BoundRoad(OGL::Context const& context, ImageCPU& image, ImageGPU& bound)
        : oChain_(context, {&oSource_, &oUpload_}) {
        oSource_.setImageCPUWithNoOwnership(&image);
        oSource_.setOutputPixelExtent(image.pixelExtent());
        oUpload_.setBoundOutputImage(&bound);
    }
    ImageCPUInput oSource_;
    CPU2GPU oUpload_;
    Chain oChain_;
};

TEST_F(CPU2GPUTest, isAConverterOntoTheGPU) {
    CPU2GPU node;
    EXPECT_EQ("CPU2GPU", node.name());
    EXPECT_EQ(ORVO_TARGET_CPU, node.getInputTargetPlatform());
    EXPECT_EQ(ORVO_TARGET_GL, node.getOutputTargetPlatform());
    ASSERT_EQ(1u, node.numberOfImageInputs());
    EXPECT_EQ("InputImage", node.imageInput(0)->name());
    EXPECT_EQ("OutputImage", node.imageOutput()->name());
    EXPECT_TRUE(typeid(ImageCPU) == node.imageInput(0)->datatype());
    EXPECT_TRUE(typeid(ImageGPU) == node.imageOutput()->datatype());
    EXPECT_EQ(ImageFilter::OUTPUT_PRECISION_DEFAULT, node.outputPrecisionHintParameter().value());
}

struct Row {
    ImageCPU::tePixelFormat eFormat;
    ImageGPU::tePixelFormat eTexture;
    bool bSwapped;
};

/// The formats that a host image can have and that go up.
constexpr Row aRows[] = {
    {ImageCPU::PIXEL_FORMAT_BGR8, ImageGPU::PIXEL_FORMAT_RGB8, true},
    {ImageCPU::PIXEL_FORMAT_BGRA8, ImageGPU::PIXEL_FORMAT_RGBA8, true},
    {ImageCPU::PIXEL_FORMAT_RGB8, ImageGPU::PIXEL_FORMAT_RGB8, false},
    {ImageCPU::PIXEL_FORMAT_RGBA8, ImageGPU::PIXEL_FORMAT_RGBA8, false},
    {ImageCPU::PIXEL_FORMAT_RGBA16, ImageGPU::PIXEL_FORMAT_RGBA16F, false},
    {ImageCPU::PIXEL_FORMAT_RGB32F, ImageGPU::PIXEL_FORMAT_RGB32F, false},
    {ImageCPU::PIXEL_FORMAT_RGBA32F, ImageGPU::PIXEL_FORMAT_RGBA32F, false},
    {ImageCPU::PIXEL_FORMAT_LUMINANCE8, ImageGPU::PIXEL_FORMAT_LUMINANCE8, false},
    {ImageCPU::PIXEL_FORMAT_LUMINANCE32F, ImageGPU::PIXEL_FORMAT_LUMINANCE32F, false},
    {ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, false},
    {ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F, ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F, false},
    {ImageCPU::PIXEL_FORMAT_RGB16F, ImageGPU::PIXEL_FORMAT_RGB16F, false},
    {ImageCPU::PIXEL_FORMAT_RGBA16F, ImageGPU::PIXEL_FORMAT_RGBA16F, false}};

std::vector<unsigned char> swapped(std::vector<unsigned char> aBytes, std::size_t nChannels) {
    for (std::size_t i = 0; i + 2 < aBytes.size(); i += nChannels)
        std::swap(aBytes[i], aBytes[i + 2]);
    return aBytes;
}

std::vector<unsigned char> contentFor(HostImage& host, Row const& row) {
    TexelLayout const layout(row.eTexture);
    EXPECT_EQ(host.pixelBytes(), layout.pixelBytes());
    return Test::channelBytes(layout.nType_, host.image().numberOfPixels() * layout.nChannels_);
}

TEST_F(CPU2GPUTest, everyFormatGoesUpBitForBit) {
    for (Row const& row : aRows) {
        for (int const nPadding : {0, 3}) {
            HostImage host(row.eFormat, pixels(-7, 5, 13, 9), nPadding, 0xcd,
                           PixelExtentInWorldSpace(2, 0.5f));
            std::vector<unsigned char> const aContent = contentFor(host, row);
            host.set(aContent);
            Road road(context(), host.image());
            road.oChain_.run(worldOf(pixels(-7, 5, 13, 9), PixelExtentInWorldSpace(2, 0.5f)));
            ImageGPUPtr const upImage(road.oSink_.releaseImageGPU());
            ASSERT_NE(nullptr, upImage) << row.eFormat;
            EXPECT_EQ(row.eTexture, upImage->pixelFormat()) << row.eFormat;
            EXPECT_EQ(pixels(-7, 5, 13, 9), upImage->positionExtent());
            EXPECT_EQ(ExtentInPixelSpace(13, 9), upImage->capacityExtent()) << "exactly as large";
            EXPECT_EQ(PixelExtentInWorldSpace(2, 0.5f), upImage->pixelExtent());
            TexelLayout const layout(row.eTexture);
            EXPECT_EQ(row.bSwapped ? swapped(aContent, layout.nChannels_) : aContent, readTexels(*upImage))
                << row.eFormat << " with padding of " << nPadding;
        }
    }
}

TEST_F(CPU2GPUTest, theWholeImageGoesUpWhateverTheRegion) {
    HostImage host(ImageCPU::PIXEL_FORMAT_LUMINANCE8, pixels(0, 0, 5, 4));
    std::vector<unsigned char> const aContent = contentFor(host, aRows[7]);
    host.set(aContent);
    Road road(context(), host.image());
    road.oChain_.run(worldOf(pixels(1, 1, 2, 1)));
    ImageGPUPtr const upImage(road.oSink_.releaseImageGPU());
    ASSERT_NE(nullptr, upImage);
    EXPECT_EQ(aContent, readTexels(*upImage));
}

TEST_F(CPU2GPUTest, anImageWithoutPixelsMakesATextureWithoutPixels) {
    for (auto const& region : {pixels(3, 4, 0, 0), pixels(3, 4, 0, 5),
                               PositionExtentInPixelSpace(PositionInPixelSpace(3, 4), {})}) {
        ImageCPU image(ImageCPU::PIXEL_FORMAT_RGBA8, region, PixelExtentInWorldSpace(),
                       ExtentInPixelSpace(1, 1));
        Road road(context(), image);
        std::uint64_t const nUploads = GLHooks::calls("glTexSubImage2D");
        road.oChain_.run(worldOf(pixels(0, 0, 4, 4)));
        ImageGPUPtr const upImage(road.oSink_.releaseImageGPU());
        ASSERT_NE(nullptr, upImage);
        EXPECT_EQ(0u, upImage->numberOfPixels());
        EXPECT_EQ(nUploads, GLHooks::calls("glTexSubImage2D"));
    }
}

TEST_F(CPU2GPUTest, storageThatIsSmallerThanTheImageEndsThePicture) {
    std::vector<unsigned char> aStorage(3 * 2, 9);
    ImageCPU image(ImageCPU::PIXEL_FORMAT_LUMINANCE8, aStorage.data(), pixels(0, 0, 5, 4),
                   PixelExtentInWorldSpace(), ExtentInPixelSpace(3, 2));
    Road road(context(), image);
    road.oChain_.run(worldOf(pixels(0, 0, 5, 4)));
    ImageGPUPtr const upImage(road.oSink_.releaseImageGPU());
    ASSERT_NE(nullptr, upImage);
    std::vector<unsigned char> const aTexels = readTexels(*upImage);
    for (std::size_t y = 0; y < 2; ++y)
        for (std::size_t x = 0; x < 3; ++x)
            EXPECT_EQ(9, aTexels[y * 5 + x]);
}

TEST_F(CPU2GPUTest, formatsThatDoNotGoUpAreRefusedAndTheNextFrameRuns) {
    HostImage good(ImageCPU::PIXEL_FORMAT_LUMINANCE8, pixels(0, 0, 2, 2), 0, 7);
    for (ImageCPU::tePixelFormat const format :
         {ImageCPU::PIXEL_FORMAT_RGB16, ImageCPU::PIXEL_FORMAT_LUMINANCE16,
          ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA16}) {
        HostImage host(format, pixels(0, 0, 2, 2));
        Road road(context(), host.image());
        ORVO_EXPECT_INTERNAL(road.oChain_.run(worldOf(pixels(0, 0, 2, 2))),
                             "Not implemented: pixelFormat in CPU2GPU::internaProcess()");
        EXPECT_EQ(nullptr, road.oSink_.getImageGPU());
        road.oChain_.oController_.flushGraph();
        road.set(good.image());
        road.oChain_.run(worldOf(pixels(0, 0, 2, 2)));
        ASSERT_NE(nullptr, road.oSink_.getImageGPU());
        EXPECT_EQ(std::vector<unsigned char>(4, 7), readTexels(*road.oSink_.getImageGPU()));
    }
}

// Bound outputs

TEST_F(CPU2GPUTest, aBoundTextureTakesTheRegionAtItsPlaceAndKeepsTheRest) {
    HostImage host(ImageCPU::PIXEL_FORMAT_LUMINANCE8, pixels(-2, 3, 8, 6), 5);
    std::vector<unsigned char> const aContent = contentFor(host, aRows[7]);
    host.set(aContent);
    // Larger than its rectangle, and elsewhere than the host's image.
    ImageGPUPtr const upBound = textureImage(pixels(-5, 1, 11, 9), ImageGPU::PIXEL_FORMAT_LUMINANCE8, false);
    writeTexels(*upBound, std::vector<unsigned char>(11 * 9, 200));
    BoundRoad road(context(), host.image(), *upBound);
    unsigned const nTexture = upBound->texture()->objectID();
    road.oChain_.run(worldOf(pixels(0, 4, 4, 3)));
    EXPECT_EQ(nTexture, upBound->texture()->objectID());
    std::vector<unsigned char> const aTexels = readTexels(*upBound);
    for (int y = 1; y < 10; ++y)
        for (int x = -5; x < 6; ++x) {
            bool const bInside = x >= 0 && x < 4 && y >= 4 && y < 7;
            int const nExpected = bInside ? aContent[std::size_t((y - 3) * 8 + x + 2)] : 200;
            EXPECT_EQ(nExpected, aTexels[std::size_t((y - 1) * 11 + x + 5)]) << x << ", " << y;
        }
}

TEST_F(CPU2GPUTest, aBoundTextureOfAnotherFormatIsConvertedTo) {
    HostImage host(ImageCPU::PIXEL_FORMAT_BGRA8, pixels(0, 0, 1, 1));
    host.set({51, 102, 204, 255}); // B, G, R, A
    float const aExpected[] = {0.8f, 0.4f, 0.2f, 1.0f};
    for (ImageGPU::tePixelFormat const format : aTextureFormats) {
        ImageGPUPtr const upBound = textureImage(pixels(0, 0, 1, 1), format);
        BoundRoad road(context(), host.image(), *upBound);
        road.oChain_.run(worldOf(pixels(0, 0, 1, 1)));
        std::vector<unsigned char> const aBytes = readTexels(*upBound, ImageGPU::PIXEL_FORMAT_RGBA32F);
        float aTexel[4];
        std::memcpy(aTexel, aBytes.data(), sizeof aTexel);
        bool const bLuminance = format >= ImageGPU::PIXEL_FORMAT_LUMINANCE8;
        EXPECT_NEAR(aExpected[0], aTexel[0], 0x1p-10) << format;
        if (!bLuminance) {
            EXPECT_NEAR(aExpected[1], aTexel[1], 0x1p-10) << format;
            EXPECT_NEAR(aExpected[2], aTexel[2], 0x1p-10) << format;
        }
    }
}

TEST_F(CPU2GPUTest, aRegionOutsideTheBoundTextureIsRefused) {
    HostImage host(ImageCPU::PIXEL_FORMAT_LUMINANCE8, pixels(0, 0, 4, 4), 0, 50);
    ImageGPUPtr const upBound = textureImage(pixels(0, 0, 3, 4), ImageGPU::PIXEL_FORMAT_LUMINANCE8, false);
    writeTexels(*upBound, std::vector<unsigned char>(12, 200));
    BoundRoad road(context(), host.image(), *upBound);
    ORVO_EXPECT_INTERNAL(road.oChain_.run(worldOf(pixels(0, 0, 4, 4))),
                         "Compute region lies outside the bound output image");
    EXPECT_EQ(std::vector<unsigned char>(12, 200), readTexels(*upBound));
    road.oChain_.oController_.flushGraph();
    road.oChain_.run(worldOf(pixels(0, 0, 3, 4)));
    EXPECT_EQ(std::vector<unsigned char>(12, 50), readTexels(*upBound));
}

TEST_F(CPU2GPUTest, anEmptyRegionTouchesNothingOfABoundTexture) {
    HostImage host(ImageCPU::PIXEL_FORMAT_LUMINANCE8, pixels(0, 0, 4, 4), 0, 50);
    ImageGPUPtr const upBound = textureImage(pixels(0, 0, 3, 4), ImageGPU::PIXEL_FORMAT_LUMINANCE8);
    writeTexels(*upBound, std::vector<unsigned char>(12, 200));
    BoundRoad road(context(), host.image(), *upBound);
    road.oChain_.run(worldOf(pixels(20, 20, 4, 4))); // beside the image
    EXPECT_EQ(std::vector<unsigned char>(12, 200), readTexels(*upBound));
}

TEST_F(CPU2GPUTest, anOutputBoundToNothingFails) {
    HostImage host(ImageCPU::PIXEL_FORMAT_LUMINANCE8, pixels(0, 0, 4, 4));
    ImageGPUPtr const upBound = textureImage(pixels(0, 0, 4, 4), ImageGPU::PIXEL_FORMAT_LUMINANCE8);
    BoundRoad road(context(), host.image(), *upBound);
    road.oUpload_.setBoundOutputImage(nullptr);
    ORVO_EXPECT_INTERNAL(road.oChain_.run(worldOf(pixels(0, 0, 4, 4))), "Enforce pBoundImage != NULL");
}

// Failures of OpenGL

TEST(CPU2GPUWithoutAContextTest, thereIsNoTextureToUploadInto) {
    ORVO::Test::ImageFlowLayers layers;
    HostImage host(ImageCPU::PIXEL_FORMAT_LUMINANCE8, pixels(0, 0, 4, 4));
    ImageCPUInput source;
    CPU2GPU up;
    source.setImageCPUWithNoOwnership(&host.image());
    ORVO::Test::feed(up, 0, source);
    ImageFlowController controller;
    controller.addNode(&source);
    controller.addNode(&up);
    controller.setImageSink(up);
    controller.computeRegions(worldOf(pixels(0, 0, 4, 4)));
    ORVO::Test::emitAll(controller);
    ORVO_EXPECT_INTERNAL(controller.process(), "Enforce TexturePool::Instance() != NULL");
    up.disconnect();
    ImageGPUInput textures;
    unsigned char const aPixel[4] = {};
    ORVO_EXPECT_INTERNAL(textures.load8BitUnsignedImageData(aPixel, pixels(0, 0, 1, 1),
                                                            PixelExtentInWorldSpace(), PIXEL_LAYOUT_RGBA, 0),
                         "Enforce TexturePool::Instance() != NULL");
}

TEST_F(CPU2GPUTest, everyCallMayFail) {
    HostImage host(ImageCPU::PIXEL_FORMAT_RGBA8, pixels(0, 0, 3, 2), 1, 77);
    Road road(context(), host.image());
    auto const run = [&] {
        TexturePool::Instance()->clear2DPool();
        road.oChain_.run(worldOf(pixels(0, 0, 3, 2)));
        ImageGPUPtr(road.oSink_.releaseImageGPU());
    };
    auto const check = [&] {
        this->host().makeCurrent();
        road.oChain_.oController_.flushGraph();
        road.oChain_.run(worldOf(pixels(0, 0, 3, 2)));
        ASSERT_NE(nullptr, road.oSink_.getImageGPU());
        EXPECT_EQ(std::vector<unsigned char>(24, 77), readTexels(*road.oSink_.getImageGPU()));
    };
    ORVO::Test::failEveryCallBeforeThePool(run, check,
                                           {"glGenTextures", "glTexImage2D", "glBeginQuery", "glMapBuffer",
                                            "glUnmapBuffer", "glTexSubImage2D", "eglMakeCurrent"});
}

} // namespace

} // namespace ORVO
