// Formats of GPU images, how images are made, and what becomes of their textures.
#include <epoxy/gl.h>

#include <climits>
#include <memory>
#include <sstream>

#include "orvo/core/memory/TrackedNew.h"
#include "orvo/image_runtime/TexturePool.h"
#include "orvo/image_runtime/images/ImageGPU.h"
#include "orvo/ogl/Texture2D.h"
#include "tests/image_runtime/support/GLRuntimeTest.h"
#include "tests/support/gl/ExpectOGL.h"

namespace {

using namespace ORVO;

constexpr char const* pInvalid = "invalid pixel format";
constexpr char const* pRefused = "Pixel format not supported by ORVO in GPU mode";
constexpr char const* pNoCopy = "Not implemented: no copying of ImageGPU allowed";
constexpr unsigned nNone = 0;

struct FormatRow {
    int nValue;
    char const* pName;
    unsigned nToken;    ///< 0: refused
    unsigned nChannels; ///< 0: refused
};

constexpr FormatRow aRows[] = {
    {0, "PIXEL_FORMAT_RGBA8", 32856, 4},
    {1, "PIXEL_FORMAT_RGBA16", 32859, nNone},
    {2, "PIXEL_FORMAT_RGBA16F", 34842, 4},
    {3, "PIXEL_FORMAT_RGBA32F", 34836, 4},
    {4, "PIXEL_FORMAT_RGB8", 32849, 3},
    {5, "PIXEL_FORMAT_RGB16", 32852, nNone},
    {6, "PIXEL_FORMAT_RGB16F", 34843, 3},
    {7, "PIXEL_FORMAT_RGB32F", 34837, 3},
    {8, "PIXEL_FORMAT_LUMINANCE8", 6409, 1},
    {9, "PIXEL_FORMAT_LUMINANCE16", 32834, 1},
    {10, "PIXEL_FORMAT_LUMINANCE16F", 34846, nNone},
    {11, "PIXEL_FORMAT_LUMINANCE32F", 34840, 1},
    {12, "PIXEL_FORMAT_LUMINANCE_ALPHA8", 6410, 2},
    {13, "PIXEL_FORMAT_LUMINANCE_ALPHA16", nNone, nNone},
    {14, "PIXEL_FORMAT_LUMINANCE_ALPHA16F", 34847, 2},
    {15, "PIXEL_FORMAT_LUMINANCE_ALPHA32F", 34841, 2},
    {16, "PIXEL_FORMAT_UNDEFINED", nNone, nNone},
};

std::string textOf(int nValue) {
    std::ostringstream text;
    text << static_cast<ImageGPU::tePixelFormat>(nValue);
    return text.str();
}

class ImageGPUFormat : public testing::TestWithParam<FormatRow> {};

TEST_P(ImageGPUFormat, HasItsNameTokenAndChannels) {
    FormatRow const& row = GetParam();
    auto const eFormat = static_cast<ImageGPU::tePixelFormat>(row.nValue);
    EXPECT_EQ(row.pName, textOf(row.nValue));
    if (row.nToken != nNone) {
        EXPECT_EQ(row.nToken, ImageGPU::PixelFormatORVO2GL(eFormat));
        EXPECT_EQ(eFormat, ImageGPU::PixelFormatGL2ORVO(row.nToken));
    } else {
        ORVO_EXPECT_PARAMETER(ImageGPU::PixelFormatORVO2GL(eFormat), pInvalid);
    }
    if (row.nChannels != nNone)
        EXPECT_EQ(row.nChannels, nChannels(eFormat));
    else
        ORVO_EXPECT_INTERNAL(nChannels(eFormat), pRefused);
}

std::string rowName(testing::TestParamInfo<FormatRow> const& row) { return row.param.pName; }

INSTANTIATE_TEST_SUITE_P(, ImageGPUFormat, testing::ValuesIn(aRows), rowName);

TEST(ImageGPUFormats, AreNamedAsTheyAreNumbered) {
    EXPECT_EQ(0, ImageGPU::PIXEL_FORMAT_RGBA8);
    EXPECT_EQ(7, ImageGPU::PIXEL_FORMAT_RGB32F);
    EXPECT_EQ(9, ImageGPU::PIXEL_FORMAT_LUMINANCE16);
    EXPECT_EQ(14, ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA16F);
    EXPECT_EQ(16, ImageGPU::PIXEL_FORMAT_UNDEFINED);
}

TEST(ImageGPUFormats, RefuseOtherNumbersAndTokens) {
    for (int const nValue : {-1, 17, INT_MAX, INT_MIN}) {
        auto const eFormat = static_cast<ImageGPU::tePixelFormat>(nValue);
        EXPECT_EQ("UNKNOWN", textOf(nValue));
        ORVO_EXPECT_PARAMETER(ImageGPU::PixelFormatORVO2GL(eFormat), pInvalid);
        ORVO_EXPECT_INTERNAL(nChannels(eFormat), pRefused);
    }
    // 0, GL_ALPHA8, GL_LUMINANCE8_ALPHA8, GL_RGBA4
    for (unsigned const nToken : {0U, 32828U, 32837U, 32854U, UINT_MAX})
        ORVO_EXPECT_PARAMETER(ImageGPU::PixelFormatGL2ORVO(nToken), pInvalid);
}

TEST(ImageGPUFormats, TakeTheSizedLuminanceToo) {
    EXPECT_EQ(ImageGPU::PIXEL_FORMAT_LUMINANCE8, ImageGPU::PixelFormatGL2ORVO(32832));
}

PositionExtentInPixelSpace rectangle(int width, int height) { return {{-5, 7}, {width, height}}; }

class ImageGPUTest : public ORVO::Test::GLRuntimeTest {
protected:
    static constexpr auto eRGBA8 = ImageGPU::PIXEL_FORMAT_RGBA8;
    PixelExtentInWorldSpace const oUnit_{1.0F, 1.0F};

    /// Whether the texture is the next of its kind that the pool hands out. Leaves one of its kind there.
    static bool isInPool(OGL::Texture2D const* pTexture) {
        TexturePool& pool = *TexturePool::Instance();
        OGL::Texture2D* const pTaken =
            pool.getTexture2DFromPool(static_cast<unsigned>(pTexture->width(0)),
                                      static_cast<unsigned>(pTexture->height(0)), pTexture->format(), true);
        pool.returnTexture2DToPool(pTaken);
        return pTaken == pTexture;
    }
};

TEST_F(ImageGPUTest, StartsWithoutATexture) {
    ImageGPU image;
    EXPECT_EQ(ORVO_TARGET_GL, image.targetPlatform());
    EXPECT_EQ(ImageGPU::PIXEL_FORMAT_UNDEFINED, image.pixelFormat());
    EXPECT_EQ(nullptr, image.texture());
    EXPECT_EQ(-1, image.boundTexUnit());
    EXPECT_FALSE(image.extent().isDefined());
    EXPECT_FALSE(image.capacityExtent().isDefined());
    EXPECT_EQ(PixelExtentInWorldSpace(1.0F, 1.0F), image.pixelExtent());
    EXPECT_EQ(nullptr, image.release());
}

TEST_F(ImageGPUTest, TakesATextureOfASizeClass) {
    ImageGPU const image(rectangle(300, 200), eRGBA8, {2.0F, 0.5F}, false);
    EXPECT_EQ(rectangle(300, 200), image.positionExtent());
    EXPECT_EQ(ExtentInPixelSpace(512, 256), image.capacityExtent());
    EXPECT_EQ(PixelExtentInWorldSpace(2.0F, 0.5F), image.pixelExtent());
    EXPECT_EQ(eRGBA8, image.pixelFormat());
    EXPECT_EQ(ORVO_TARGET_GL, image.targetPlatform());
    EXPECT_EQ(-1, image.boundTexUnit());
}

TEST_F(ImageGPUTest, TakesATextureOfExactlyItsSize) {
    ImageGPU const image(rectangle(30, 20), eRGBA8, oUnit_, true);
    EXPECT_EQ(ExtentInPixelSpace(30, 20), image.capacityExtent());
}

TEST_F(ImageGPUTest, TakesATextureOfEachFormat) {
    for (FormatRow const& row : aRows) {
        if (row.nToken == nNone)
            continue;
        auto const eFormat = static_cast<ImageGPU::tePixelFormat>(row.nValue);
        ImageGPU const image(rectangle(3, 2), eFormat, oUnit_, true);
        EXPECT_EQ(row.nToken, OGL::Texture::InternalFormat2GL(image.texture()->format())) << row.pName;
        EXPECT_EQ(eFormat, image.pixelFormat()) << row.pName;
    }
}

TEST_F(ImageGPUTest, MayBeEmpty) {
    ImageGPU const empty(rectangle(0, 0), eRGBA8, oUnit_, false);
    EXPECT_EQ(ExtentInPixelSpace(0, 0), empty.capacityExtent());
    ImageGPU const undefined(PositionExtentInPixelSpace(), eRGBA8, oUnit_, true);
    EXPECT_EQ(ExtentInPixelSpace(0, 0), undefined.capacityExtent());
}

TEST_F(ImageGPUTest, RefusesWhatNoTextureCanBe) {
    for (auto const eFormat : {ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA16, ImageGPU::PIXEL_FORMAT_UNDEFINED})
        ORVO_EXPECT_PARAMETER(ImageGPU(rectangle(3, 2), eFormat, oUnit_, true), pInvalid);
    ORVO_EXPECT_PARAMETER(ImageGPU(rectangle(-1, 2), eRGBA8, oUnit_, true),
                          "Image extent must not be negative");
    ORVO_EXPECT_PARAMETER(ImageGPU(rectangle(2, -1), eRGBA8, oUnit_, true),
                          "Image extent must not be negative");
    // 2^30 pixels of 4 bytes are 2^32 bytes, one more than the limit.
    ORVO_EXPECT_PARAMETER(ImageGPU(rectangle(1 << 15, 1 << 15), eRGBA8, oUnit_, true),
                          "Image size exceeds 4294967295 bytes");
    ORVO_EXPECT_PARAMETER(ImageGPU(rectangle(INT_MAX, INT_MAX), eRGBA8, oUnit_, false),
                          "Image size exceeds 4294967295 bytes");
    ORVO_EXPECT_INTERNAL(ImageGPU(rectangle(3, 2), eRGBA8, {0.0F, 1.0F}, true),
                         "pixelExtent.pixelExtent().extentAsFloat2().x > 0");
}

TEST_F(ImageGPUTest, GivesItsTextureBackToThePool) {
    OGL::Texture2D const* pTexture = nullptr;
    {
        ImageGPU const image(rectangle(30, 20), eRGBA8, oUnit_, true);
        pTexture = image.texture();
    }
    EXPECT_TRUE(isInPool(pTexture));
}

TEST_F(ImageGPUTest, TakesOverATexture) {
    struct Row {
        OGL::Texture::InternalFormat eTexture;
        ImageGPU::tePixelFormat eImage;
    };
    for (Row const& row : {Row{OGL::Texture::INTERNAL_FORMAT_LUMINANCE8, ImageGPU::PIXEL_FORMAT_LUMINANCE8},
                           Row{OGL::Texture::INTERNAL_FORMAT_LUMINANCE, ImageGPU::PIXEL_FORMAT_LUMINANCE8},
                           Row{OGL::Texture::INTERNAL_FORMAT_RGB16, ImageGPU::PIXEL_FORMAT_RGB16}}) {
        auto* const pTexture = ORVO_NEW OGL::Texture2D(row.eTexture, 8, 4, false, nullptr);
        {
            ImageGPU image(rectangle(5, 3), pTexture, {3.0F, 4.0F});
            EXPECT_EQ(pTexture, image.texture());
            EXPECT_EQ(row.eImage, image.pixelFormat());
            EXPECT_EQ(rectangle(5, 3), image.positionExtent());
            EXPECT_EQ(ExtentInPixelSpace(8, 4), image.capacityExtent());
            EXPECT_EQ(PixelExtentInWorldSpace(3.0F, 4.0F), image.pixelExtent());
            EXPECT_EQ(ORVO_TARGET_GL, image.targetPlatform());
        }
        EXPECT_TRUE(isInPool(pTexture));
    }
}

TEST_F(ImageGPUTest, RefusesTexturesThatAreNoImages) {
    ORVO_EXPECT_INTERNAL(ImageGPU(rectangle(5, 3), nullptr, oUnit_), "Enforce pTexture != NULL");
    OGL::Texture2D texture(OGL::Texture::INTERNAL_FORMAT_ALPHA8, 5, 3, false, nullptr);
    ORVO_EXPECT_PARAMETER(ImageGPU(rectangle(5, 3), &texture, oUnit_), pInvalid);
    OGL::Texture2D good(OGL::Texture::INTERNAL_FORMAT_RGBA8, 5, 3, false, nullptr);
    ORVO_EXPECT_INTERNAL(ImageGPU(rectangle(5, 3), &good, {1.0F, -1.0F}),
                         "pixelExtent.pixelExtent().extentAsFloat2().x > 0");
    host().release();
    EXPECT_THROW(ImageGPU(rectangle(5, 3), &good, oUnit_), InternalException);
    host().makeCurrent();
    EXPECT_TRUE(glIsTexture(good.objectID()));
}

TEST_F(ImageGPUTest, IsNotCopied) {
    ImageGPU const image(rectangle(3, 2), eRGBA8, oUnit_, true);
    ORVO_EXPECT_INTERNAL(ImageGPU copy(image), pNoCopy);
    ImageGPU other;
    ORVO_EXPECT_INTERNAL(other = image, pNoCopy);
    EXPECT_EQ(nullptr, other.texture());
    ORVO_EXPECT_INTERNAL(other = other, pNoCopy);
}

TEST_F(ImageGPUTest, ReleasesItsTexture) {
    OGL::Texture2D* pTexture = nullptr;
    {
        ImageGPU image(rectangle(30, 20), eRGBA8, oUnit_, true);
        pTexture = image.texture();
        EXPECT_EQ(pTexture, image.release());
        EXPECT_EQ(nullptr, image.texture());
        EXPECT_EQ(nullptr, image.release());
        EXPECT_EQ(eRGBA8, image.pixelFormat());
    }
    EXPECT_FALSE(isInPool(pTexture));
    TexturePool::Instance()->returnTexture2DToPool(pTexture);
}

TEST_F(ImageGPUTest, ForgetsATextureThatItsHolderKeeps) {
    OGL::Texture2D texture(OGL::Texture::INTERNAL_FORMAT_RGBA8, 30, 20, false, nullptr);
    {
        ImageGPU image(rectangle(30, 20), &texture, oUnit_);
        image.forgetTexture();
        EXPECT_EQ(nullptr, image.texture());
    }
    EXPECT_TRUE(glIsTexture(texture.objectID()));
    EXPECT_FALSE(isInPool(&texture));
}

TEST_F(ImageGPUTest, WritesADescription) {
    ImageGPU const image(rectangle(3, 2), ImageGPU::PIXEL_FORMAT_LUMINANCE32F, {2.0F, 0.5F}, true);
    std::ostringstream text, base;
    image.doWrite(text);
    image.ImageBase::doWrite(base);
    EXPECT_EQ(base.str() + "Pixel format : PIXEL_FORMAT_LUMINANCE32F\n", text.str());
    std::ostringstream capacity;
    capacity << "Image capacity : " << image.capacityExtent() << "\n";
    EXPECT_NE(std::string::npos, text.str().find(capacity.str()));
    std::ostringstream empty;
    ImageGPU().doWrite(empty);
    EXPECT_NE(std::string::npos, empty.str().find("Pixel format : PIXEL_FORMAT_UNDEFINED\n"));
}

// What becomes of textures whose images die at the wrong time.

TEST_F(ImageGPUTest, DiesWithoutAContext) {
    auto pImage = std::make_unique<ImageGPU>(rectangle(30, 20), eRGBA8, oUnit_, true);
    OGL::Texture2D const* const pTexture = pImage->texture();
    host().release();
    pImage.reset();
    host().makeCurrent();
    TexturePool::Instance()->clear1DPool(); // makes the pool's own context current
    EXPECT_TRUE(isInPool(pTexture));
}

TEST_F(ImageGPUTest, DiesBoundWithoutAContext) {
    auto pImage = std::make_unique<ImageGPU>(rectangle(30, 20), eRGBA8, oUnit_, true);
    pImage->bind(0);
    host().release();
    pImage.reset();
    host().makeCurrent();
    glBindTexture(GL_TEXTURE_2D, 0);
}

TEST_F(ImageGPUTest, DiesInAForeignContext) {
    auto const pForeign = host().another(false);
    auto pImage = std::make_unique<ImageGPU>(rectangle(30, 20), eRGBA8, oUnit_, true);
    OGL::Texture2D const* const pTexture = pImage->texture();
    pForeign->makeCurrent();
    pImage.reset();
    EXPECT_EQ(0U, drainErrors());
    host().makeCurrent();
    TexturePool::Instance()->clear1DPool();
    EXPECT_TRUE(isInPool(pTexture));
    EXPECT_TRUE(glIsTexture(pTexture->objectID()));
}

TEST_F(ImageGPUTest, DiesInASharingContext) {
    auto const pSharing = host().another(true);
    auto pImage = std::make_unique<ImageGPU>(rectangle(30, 20), eRGBA8, oUnit_, true);
    OGL::Texture2D const* const pTexture = pImage->texture();
    pSharing->makeCurrent();
    pImage.reset();
    EXPECT_TRUE(isInPool(pTexture));
    host().makeCurrent();
}

TEST_F(ImageGPUTest, OutlivesTheLibrary) {
    // The last object of a share group takes the group's sync object along, which needs a context.
    OGL::Texture2D const last(OGL::Texture::INTERNAL_FORMAT_RGBA8, 1, 1, false, nullptr);
    auto pWith = std::make_unique<ImageGPU>(rectangle(30, 20), eRGBA8, oUnit_, true);
    auto pWithout = std::make_unique<ImageGPU>(rectangle(31, 20), eRGBA8, oUnit_, true);
    stopLibrary();
    pWith.reset();
    // Without a context the object goes, and leaves its name until another one is made in the share group.
    GLuint const nName = pWithout->texture()->objectID();
    host().release();
    pWithout.reset();
    host().makeCurrent();
    EXPECT_TRUE(glIsTexture(nName));
    { OGL::Texture2D const next(OGL::Texture::INTERNAL_FORMAT_RGBA8, 1, 1, false, nullptr); }
    EXPECT_FALSE(glIsTexture(nName));
    ORVO_EXPECT_INTERNAL(ImageGPU(rectangle(3, 2), eRGBA8, oUnit_, true), "Enforce pvDeviceObject_ != NULL");
}

TEST_F(ImageGPUTest, IsNotMadeWithoutAContext) {
    host().release();
    ORVO_EXPECT_INTERNAL(
        ImageGPU(rectangle(3, 2), eRGBA8, oUnit_, true),
        "Current context of value 0 does not share with any context used to initialize image_runtime");
    host().makeCurrent();
}

TEST_F(ImageGPUTest, IsNotMadeWithoutAPool) {
    stopLibrary();
    ImageRuntime::AutoInitializer const cpuOnly(nullptr, VideoMemory::Configuration());
    ORVO_EXPECT_INTERNAL(ImageGPU(rectangle(3, 2), eRGBA8, oUnit_, true),
                         "Enforce TexturePool::Instance() != NULL");
    OGL::Texture2D texture(OGL::Texture::INTERNAL_FORMAT_RGBA8, 3, 2, false, nullptr);
    ImageGPU image(rectangle(3, 2), &texture, oUnit_);
    EXPECT_EQ(&texture, image.release());
}

TEST_F(ImageGPUTest, LeavesNothingWhereTheDriverFails) {
    auto const before = ORVO::Test::GLHooks::objects();
    for (char const* const pCall : {"glGenTextures", "glTexImage2D", "eglMakeCurrent"}) {
        ORVO::Test::GLCallFailure const failure(pCall, 1);
        EXPECT_THROW(ImageGPU(rectangle(30, 20), eRGBA8, oUnit_, true), OGL::ExceptionOGL) << pCall;
        EXPECT_TRUE(failure.hasFired()) << pCall;
        EXPECT_EQ(before, ORVO::Test::GLHooks::objects()) << pCall;
    }
    ImageGPU const next(rectangle(30, 20), eRGBA8, oUnit_, true);
    EXPECT_EQ(ExtentInPixelSpace(30, 20), next.capacityExtent());
}

} // namespace
