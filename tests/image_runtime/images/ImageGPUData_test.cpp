// Pixels into GPU images: from memory, from buffers, from the framebuffer, and none.
#include <epoxy/gl.h>

#include <array>
#include <climits>
#include <numeric>
#include <vector>

#include "orvo/image_runtime/images/ImageGPU.h"
#include "orvo/ogl/Buffer.h"
#include "orvo/ogl/Framebuffer.h"
#include "orvo/ogl/Texture2D.h"
#include "tests/image_runtime/support/GLRuntimeTest.h"
#include "tests/support/gl/ExpectOGL.h"
#include "tests/support/gl/FailEveryCall.h"

namespace {

using namespace ORVO;
using Bytes = std::vector<unsigned char>;

constexpr char const* pBefore = "position().x() <= targetPositionExtent.position().x() && position().y() <= "
                                "targetPositionExtent.position().y()";
constexpr char const* pBehind =
    "targetPositionExtent.position().x() + targetPositionExtent.extent().width() <= position().x() + "
    "extent().width() && targetPositionExtent.position().y() + targetPositionExtent.extent().height() <= "
    "position().y() + extent().height()";
constexpr char const* pNoTexture = "No Texture Object specified";

Bytes counting(std::size_t n, unsigned char first = 1) {
    Bytes aBytes(n);
    std::iota(aBytes.begin(), aBytes.end(), first);
    return aBytes;
}

class ImageGPUData : public ORVO::Test::GLRuntimeTest {
protected:
    PixelExtentInWorldSpace const oUnit_{1.0F, 1.0F};
    PixelExtentInWorldSpace const oOther_{2.0F, 0.5F};

    /// A grey image of 4 by 3 pixels at (-5, 7), all 0.
    ImageGPU make() const {
        ImageGPU image({{-5, 7}, {4, 3}}, ImageGPU::PIXEL_FORMAT_LUMINANCE8, oUnit_, true);
        Bytes const aZero(12, 0);
        image.copyImageData(image.positionExtent(), GL_LUMINANCE, GL_UNSIGNED_BYTE, aZero.data(), oUnit_);
        return ImageGPU(image.positionExtent(), image.release(), oUnit_);
    }

    static Bytes read(ImageGPU const& image, OGL::Texture::Format format = OGL::Texture::FORMAT_LUMINANCE) {
        OGL::Texture2D const& texture = *image.texture();
        Bytes aRead(texture.width(0) * texture.height(0) * OGL::Texture::Channels(format));
        glBindTexture(GL_TEXTURE_2D, texture.objectID());
        texture.getPixelData(aRead.data(), 0, format, OGL::Texture::TYPE_UNSIGNED_BYTE, 1);
        glBindTexture(GL_TEXTURE_2D, 0);
        return aRead;
    }
};

TEST_F(ImageGPUData, UploadsARectangleInPixelSpace) {
    ImageGPU image = make();
    Bytes const aPixels = counting(4);
    image.copyImageData({{-3, 8}, {2, 2}}, GL_LUMINANCE, GL_UNSIGNED_BYTE, aPixels.data(), oOther_);
    EXPECT_EQ((Bytes{0, 0, 0, 0, 0, 0, 1, 2, 0, 0, 3, 4}), read(image));
    EXPECT_EQ(oOther_, image.pixelExtent());
}

TEST_F(ImageGPUData, UploadsTheWholeOfIt) {
    ImageGPU image = make();
    Bytes const aPixels = counting(12);
    image.copyImageData(image.positionExtent(), GL_LUMINANCE, GL_UNSIGNED_BYTE, aPixels.data(), oUnit_);
    EXPECT_EQ(aPixels, read(image));
    image.copyImageData({{-1, 10}, {0, 0}}, GL_LUMINANCE, GL_UNSIGNED_BYTE, aPixels.data(), oOther_);
    EXPECT_EQ(aPixels, read(image));
    EXPECT_EQ(oOther_, image.pixelExtent());
}

TEST_F(ImageGPUData, HonoursTheRowLength) {
    ImageGPU image = make();
    Bytes const aPixels = counting(8);
    image.copyImageData(aPixels.data(), {{-5, 7}, {3, 2}}, oOther_, GL_LUMINANCE, GL_UNSIGNED_BYTE, 5);
    EXPECT_EQ((Bytes{1, 2, 3, 0, 6, 7, 8, 0, 0, 0, 0, 0}), read(image));
    EXPECT_EQ(oOther_, image.pixelExtent());
    image.copyImageData(aPixels.data(), {{-5, 7}, {3, 2}}, oUnit_, GL_LUMINANCE, GL_UNSIGNED_BYTE, 0);
    EXPECT_EQ((Bytes{1, 2, 3, 0, 4, 5, 6, 0, 0, 0, 0, 0}), read(image));
    EXPECT_EQ(oUnit_, image.pixelExtent());
}

TEST_F(ImageGPUData, UploadsFromAnUnpackBuffer) {
    ImageGPU image = make();
    Bytes const aPixels = counting(16);
    OGL::Buffer buffer(16, OGL::Buffer::TYPE_PIXEL_UNPACK, OGL::Buffer::USAGE_STREAM_DRAW, aPixels.data());
    buffer.bind();
    image.copyImageData(image.positionExtent(), GL_LUMINANCE, GL_UNSIGNED_BYTE,
                        reinterpret_cast<void const*>(std::uintptr_t{4}), oUnit_);
    EXPECT_TRUE(buffer.isBound());
    EXPECT_EQ(counting(12, 5), read(image));
    // An offset of 0 is a null pointer.
    image.copyImageData(image.positionExtent(), GL_LUMINANCE, GL_UNSIGNED_BYTE, nullptr, oUnit_);
    EXPECT_EQ(counting(12, 1), read(image));
    // With a row length the pixels are in memory.
    Bytes const aOther = counting(12, 100);
    image.copyImageData(aOther.data(), image.positionExtent(), oUnit_, GL_LUMINANCE, GL_UNSIGNED_BYTE, 4);
    EXPECT_TRUE(buffer.isBound());
    EXPECT_EQ(aOther, read(image));
    OGL::Buffer::bindDefaultUnpackBuffer();
}

TEST_F(ImageGPUData, RefusesRectanglesOutside) {
    ImageGPU image = make();
    Bytes const aPixels = counting(64);
    struct Row {
        PositionExtentInPixelSpace oTarget;
        char const* pText;
    };
    for (Row const& row :
         {Row{{{-6, 7}, {1, 1}}, pBefore}, Row{{{-5, 6}, {1, 1}}, pBefore},
          Row{{{INT_MIN, INT_MIN}, {INT_MAX, INT_MAX}}, pBefore}, Row{{{-5, 7}, {5, 1}}, pBehind},
          Row{{{-5, 7}, {1, 4}}, pBehind}, Row{{{-1, 7}, {1, 1}}, pBehind}, Row{{{-5, 10}, {1, 1}}, pBehind},
          Row{{{INT_MAX, INT_MAX}, {INT_MAX, INT_MAX}}, pBehind}}) {
        ORVO_EXPECT_PARAMETER(
            image.copyImageData(row.oTarget, GL_LUMINANCE, GL_UNSIGNED_BYTE, aPixels.data(), oOther_),
            row.pText);
        ORVO_EXPECT_PARAMETER(
            image.copyImageData(aPixels.data(), row.oTarget, oOther_, GL_LUMINANCE, GL_UNSIGNED_BYTE, 0),
            row.pText);
    }
    EXPECT_EQ(oUnit_, image.pixelExtent());
    EXPECT_EQ(Bytes(12, 0), read(image));
    ORVO_EXPECT_PARAMETER(
        image.copyImageData({{-5, 7}, {-1, 1}}, GL_LUMINANCE, GL_UNSIGNED_BYTE, aPixels.data(), oUnit_),
        "The rectangle lies outside the texture");
}

TEST_F(ImageGPUData, RefusesATextureThatIsSmallerThanTheImage) {
    OGL::Texture2D texture(OGL::Texture::INTERNAL_FORMAT_LUMINANCE8, 2, 2, false, nullptr);
    ImageGPU image({{0, 0}, {4, 4}}, &texture, oUnit_);
    Bytes const aPixels = counting(16);
    ORVO_EXPECT_PARAMETER(
        image.copyImageData(image.positionExtent(), GL_LUMINANCE, GL_UNSIGNED_BYTE, aPixels.data(), oUnit_),
        "The rectangle lies outside the texture");
    image.forgetTexture();
}

TEST_F(ImageGPUData, RefusesTokensAndMissingPixels) {
    ImageGPU image = make();
    Bytes const aPixels = counting(12);
    PositionExtentInPixelSpace const& all = image.positionExtent();
    EXPECT_THROW(image.copyImageData(all, GL_NEAREST, GL_UNSIGNED_BYTE, aPixels.data(), oOther_),
                 OGL::ExceptionOGL);
    EXPECT_THROW(image.copyImageData(all, GL_LUMINANCE, GL_NEAREST, aPixels.data(), oOther_),
                 OGL::ExceptionOGL);
    ORVO_EXPECT_INTERNAL(image.copyImageData(all, GL_LUMINANCE, GL_UNSIGNED_BYTE, nullptr, oOther_),
                         "Enforce pPixels != NULL");
    ORVO_EXPECT_INTERNAL(image.copyImageData(nullptr, all, oOther_, GL_LUMINANCE, GL_UNSIGNED_BYTE, 0),
                         "Enforce pPixels != NULL");
    EXPECT_EQ(oUnit_, image.pixelExtent());
    EXPECT_EQ(Bytes(12, 0), read(image));
}

TEST_F(ImageGPUData, NeedsATexture) {
    ImageGPU image = make();
    ImageGPU const owner(image.positionExtent(), image.release(), oUnit_);
    Bytes const aPixels = counting(12);
    PositionExtentInPixelSpace const& all = image.positionExtent();
    ORVO_EXPECT_INTERNAL(image.copyImageData(all, GL_LUMINANCE, GL_UNSIGNED_BYTE, aPixels.data(), oUnit_),
                         pNoTexture);
    ORVO_EXPECT_INTERNAL(image.copyImageData(aPixels.data(), all, oUnit_, GL_LUMINANCE, GL_UNSIGNED_BYTE, 0),
                         pNoTexture);
    ORVO_EXPECT_INTERNAL(image.copyFrameBufferData({0, 0}, {0, 0}, {1, 1}), pNoTexture);
    ORVO_EXPECT_INTERNAL(image.initializeToTransparentBlack(), pNoTexture);
    ImageGPU().initializeToTransparentBlack();
}

TEST_F(ImageGPUData, NeedsAContext) {
    ImageGPU image = make();
    Bytes const aPixels = counting(12);
    host().release();
    char const* const pNoContext = "No OpenGL context is current";
    ORVO_EXPECT_OGL(
        image.copyImageData(image.positionExtent(), GL_LUMINANCE, GL_UNSIGNED_BYTE, aPixels.data(), oOther_),
        pNoContext);
    ORVO_EXPECT_OGL(image.copyImageData(aPixels.data(), image.positionExtent(), oOther_, GL_LUMINANCE,
                                        GL_UNSIGNED_BYTE, 0),
                    pNoContext);
    ORVO_EXPECT_OGL(image.copyFrameBufferData({0, 0}, {0, 0}, {1, 1}), pNoContext);
    EXPECT_EQ(oUnit_, image.pixelExtent());
    host().makeCurrent();
}

TEST_F(ImageGPUData, SetsThePixelExtentAfterOrBeforeTheUpload) {
    ImageGPU image = make();
    Bytes const aPixels = counting(12);
    char const* const pFailed = "The image could not be uploaded (GL_OUT_OF_MEMORY)";
    {
        ORVO::Test::GLCallFailure const failure("glTexSubImage2D", 1);
        ORVO_EXPECT_OGL(image.copyImageData(image.positionExtent(), GL_LUMINANCE, GL_UNSIGNED_BYTE,
                                            aPixels.data(), oOther_),
                        pFailed);
    }
    EXPECT_EQ(oUnit_, image.pixelExtent());
    {
        ORVO::Test::GLCallFailure const failure("glTexSubImage2D", 1);
        ORVO_EXPECT_OGL(image.copyImageData(aPixels.data(), image.positionExtent(), oOther_, GL_LUMINANCE,
                                            GL_UNSIGNED_BYTE, 0),
                        pFailed);
    }
    EXPECT_EQ(oOther_, image.pixelExtent());
    EXPECT_EQ(Bytes(12, 0), read(image));
}

TEST_F(ImageGPUData, CopiesFromTheFramebuffer) {
    Bytes aSource = counting(3 * 2 * 4);
    OGL::Texture2D source(OGL::Texture::INTERNAL_FORMAT_RGBA8, 3, 2, false, aSource.data());
    ImageGPU image({{9, 9}, {2, 2}}, ImageGPU::PIXEL_FORMAT_RGBA8, oUnit_, true);
    Bytes const aZero(16, 0);
    image.copyImageData(image.positionExtent(), GL_RGBA, GL_UNSIGNED_BYTE, aZero.data(), oUnit_);
    OGL::Framebuffer framebuffer;
    framebuffer.bind();
    framebuffer.attach(&source, 0, 0);
    image.copyFrameBufferData({1, 0}, {2, 0}, {1, 2});
    Bytes aExpected(16, 0);
    for (std::size_t i = 0; i < 4; ++i) {
        aExpected[4 + i] = aSource[8 + i];
        aExpected[12 + i] = aSource[20 + i];
    }
    EXPECT_EQ(aExpected, read(image, OGL::Texture::FORMAT_RGBA));
    ORVO_EXPECT_PARAMETER(image.copyFrameBufferData({1, 0}, {0, 0}, {2, 1}),
                          "The rectangle lies outside the texture");
    {
        ORVO::Test::GLCallFailure const failure("glCopyTexSubImage2D", 1);
        ORVO_EXPECT_OGL(image.copyFrameBufferData({0, 0}, {0, 0}, {1, 1}),
                        "The framebuffer could not be copied (GL_OUT_OF_MEMORY)");
    }
    EXPECT_EQ(aExpected, read(image, OGL::Texture::FORMAT_RGBA));
    framebuffer.detach(&source, 0);
    framebuffer.unbind();
}

// Transparent black.

class ImageGPUBlack : public ImageGPUData {
protected:
    /// Draws to the image's texture for a scope.
    class Attached {
    public:
        explicit Attached(ImageGPU& image) : pTexture_(image.texture()) {
            oFramebuffer_.bind();
            oFramebuffer_.attach(pTexture_, 0, 0);
        }
        ~Attached() {
            oFramebuffer_.detach(pTexture_, 0);
            oFramebuffer_.unbind();
        }
        Attached(Attached const&) = delete;
        Attached& operator=(Attached const&) = delete;

    private:
        OGL::Texture2D* pTexture_;
        OGL::Framebuffer oFramebuffer_;
    };

    static void fill(OGL::Texture2D& texture, unsigned char n) {
        Bytes const aPixels(texture.width(0) * texture.height(0) * 4, n);
        glBindTexture(GL_TEXTURE_2D, texture.objectID());
        texture.subImage(0, 0, 0, texture.width(0), texture.height(0), OGL::Texture::FORMAT_RGBA,
                         OGL::Texture::TYPE_UNSIGNED_BYTE, aPixels.data(), {});
        glBindTexture(GL_TEXTURE_2D, 0);
    }
};

TEST_F(ImageGPUBlack, ClearsATextureThatIsLarger) {
    ImageGPU image({{-5, 7}, {5, 3}}, ImageGPU::PIXEL_FORMAT_RGBA8, oUnit_, false);
    ASSERT_EQ(ExtentInPixelSpace(8, 4), image.capacityExtent());
    fill(*image.texture(), 77);
    Attached const attached(image);
    glClearColor(0.25F, 0.5F, 0.75F, 1.0F);
    glViewport(1, 2, 3, 4);
    glEnable(GL_SCISSOR_TEST);
    glScissor(0, 0, 1, 1);
    glColorMask(GL_TRUE, GL_FALSE, GL_TRUE, GL_FALSE);
    auto const before = ORVO::Test::GLState::capture();
    image.initializeToTransparentBlack();
    EXPECT_EQ("", before.differencesTo(ORVO::Test::GLState::capture()));
    EXPECT_EQ(Bytes(8 * 4 * 4, 0), read(image, OGL::Texture::FORMAT_RGBA));
    glColorMask(GL_TRUE, GL_TRUE, GL_TRUE, GL_TRUE);
    glDisable(GL_SCISSOR_TEST);
    glScissor(0, 0, 0, 0);
    glViewport(0, 0, 0, 0);
    glClearColor(0, 0, 0, 0);
}

TEST_F(ImageGPUBlack, ClearsEachFormatThatIsDrawnTo) {
    for (auto const eFormat :
         {ImageGPU::PIXEL_FORMAT_RGBA8, ImageGPU::PIXEL_FORMAT_RGBA16, ImageGPU::PIXEL_FORMAT_RGBA16F,
          ImageGPU::PIXEL_FORMAT_RGBA32F, ImageGPU::PIXEL_FORMAT_RGB8, ImageGPU::PIXEL_FORMAT_RGB16F}) {
        ImageGPU image({{0, 0}, {3, 2}}, eFormat, oUnit_, false);
        fill(*image.texture(), 200);
        Attached const attached(image);
        image.initializeToTransparentBlack();
        Bytes const aRead = read(image, OGL::Texture::FORMAT_RGBA);
        for (std::size_t i = 0; i < aRead.size(); ++i) {
            bool const bAlphaOfRGB = i % 4 == 3 && eFormat >= ImageGPU::PIXEL_FORMAT_RGB8;
            EXPECT_EQ(bAlphaOfRGB ? 255 : 0, aRead[i]) << eFormat << ' ' << i;
        }
    }
}

TEST_F(ImageGPUBlack, LeavesATextureOfJustItsSize) {
    ImageGPU image({{-5, 7}, {8, 4}}, ImageGPU::PIXEL_FORMAT_RGBA8, oUnit_, false);
    ASSERT_EQ(image.extent(), image.capacityExtent());
    fill(*image.texture(), 77);
    {
        Attached const attached(image);
        image.initializeToTransparentBlack();
    }
    EXPECT_EQ(Bytes(8 * 4 * 4, 77), read(image, OGL::Texture::FORMAT_RGBA));
    // No call to OpenGL is made: none is possible here.
    host().release();
    image.initializeToTransparentBlack();
    host().makeCurrent();
}

TEST_F(ImageGPUBlack, LeavesATextureWithoutPixels) {
    ImageGPU undefined(PositionExtentInPixelSpace(), ImageGPU::PIXEL_FORMAT_RGBA8, oUnit_, true);
    undefined.initializeToTransparentBlack();
    ImageGPU flat({{0, 0}, {3, 0}}, ImageGPU::PIXEL_FORMAT_RGBA8, oUnit_, false);
    flat.initializeToTransparentBlack();
}

TEST_F(ImageGPUBlack, NeedsAContext) {
    ImageGPU image({{-5, 7}, {5, 3}}, ImageGPU::PIXEL_FORMAT_RGBA8, oUnit_, false);
    host().release();
    ORVO_EXPECT_OGL(image.initializeToTransparentBlack(), "No OpenGL context is current");
    host().makeCurrent();
}

} // namespace
