// Client images in textures, and the mappings between descriptors and texture formats.
#include "orvo/filter_graph/impl/ImageGL.h"

#include <epoxy/gl.h>

#include "orvo/filter_graph/internal/ImageAccessor.h"
#include "orvo/image_runtime/images/ImageGPU.h"
#include "tests/support/Expect.h"
#include "tests/support/gl/FailEveryCall.h"
#include "tests/support/gl/GLFrameTest.h"

#include <set>

namespace ORVO::FilterGraph::Internal {
namespace {

using namespace ORVO::Test;
using GPU = ORVO::ImageGPU;
using Texture = OGL::Texture;

constexpr char const* channelsText = "Not implemented: pixelFormat in ImageGPU::mapDescriptorToImageGPU()";
constexpr char const* typeText =
    "Not implemented: Data type not supported in ImageGPU::mapDescriptorToImageGPU()";
constexpr char const* unsupportedText = "Pixel format not supported by ORVO in GPU mode";
constexpr char const* noFormatText = "Not implemented: ePixelFormat in mapPixelFormatToDescriptorFormat";

bool isAlive(OGL::Texture2D const& texture) { return glIsTexture(texture.objectID()) == GL_TRUE; }

GPU::tePixelFormat formatOf(std::size_t nChannel, int channelType) {
    return ImageAccessor::mapDescriptorToGPUPixelFormat(
        nChannel, static_cast<ImageDescriptor::eChannelType>(channelType));
}

TEST(ImageAccessorGPUTest, MapsDescriptorsToPixelFormats) {
    struct Row {
        std::size_t nChannel;
        int e8, e16, e16F, e32F; // the formats' fixed numbers
    };
    for (Row const& row :
         {Row{1, 8, 9, 10, 11}, Row{2, 12, 13, 14, 15}, Row{3, 4, 5, 6, 7}, Row{4, 0, 1, 2, 3}}) {
        SCOPED_TRACE(row.nChannel);
        EXPECT_EQ(formatOf(row.nChannel, 0), row.e8);
        EXPECT_EQ(formatOf(row.nChannel, 2), row.e16);
        EXPECT_EQ(formatOf(row.nChannel, 3), row.e16);
        EXPECT_EQ(formatOf(row.nChannel, 4), row.e16F);
        EXPECT_EQ(formatOf(row.nChannel, 6), row.e32F);
        for (int const type : {-1, 1, 5, 7}) {
            ORVO_EXPECT_INTERNAL(formatOf(row.nChannel, type), typeText);
        }
    }
    for (std::size_t const nChannel : {std::size_t(0), std::size_t(5)}) {
        ORVO_EXPECT_INTERNAL(formatOf(nChannel, 0), channelsText);
    }
}

TEST(ImageAccessorGPUTest, MapsPixelFormatsBackWithItsHoles) {
    struct Row {
        int format;
        std::size_t nChannel;
        int type;
    };
    for (Row const& row : {Row{0, 4, 0}, Row{2, 4, 4}, Row{4, 3, 0}, Row{6, 3, 4}, Row{7, 3, 6}, Row{8, 1, 0},
                           Row{9, 1, 3}, Row{11, 1, 6}, Row{12, 2, 0}, Row{14, 2, 4}, Row{15, 2, 6}}) {
        SCOPED_TRACE(row.format);
        ImageDescriptor::Format const format =
            ImageAccessor::mapPixelFormatToDescriptorFormat(static_cast<GPU::tePixelFormat>(row.format));
        EXPECT_EQ(format.nChannel, row.nChannel);
        EXPECT_EQ(static_cast<int>(format.channelType), row.type);
    }
    auto const map = [](int format) {
        return ImageAccessor::mapPixelFormatToDescriptorFormat(static_cast<GPU::tePixelFormat>(format));
    };
    for (int const format : {1, 5, 10, 13, 16}) {
        ORVO_EXPECT_INTERNAL(map(format), unsupportedText);
    }
    ORVO_EXPECT_INTERNAL(map(3), noFormatText);
}

class ImageGLTest : public GLFrameTest {
protected:
    static PositionExtentInPixelSpace rect(int x, int y, int width, int height) {
        return PositionExtentInPixelSpace(PositionInPixelSpace(x, y), ExtentInPixelSpace(width, height));
    }

    ImageDescriptorGL oDescriptor_{{4, ImageDescriptor::CHANNEL_TYPE_UINT8}, PixelExtentInWorldSpace(2, 3)};
};

TEST_F(ImageGLTest, IsBornEmptyOrWithATexture) {
    ImageGL const empty(oDescriptor_);
    EXPECT_EQ(empty.getPixelStorage(), nullptr);
    EXPECT_EQ(empty.width(), 0u);
    OGL::Texture2D texture(Texture::INTERNAL_FORMAT_RGBA8, 4, 2, false, nullptr);
    ImageGL image(oDescriptor_, rect(-1, 5, 4, 2), &texture);
    EXPECT_EQ(image.getPixelStorage(), &texture);
    EXPECT_EQ(image.rect(), rect(-1, 5, 4, 2));
    auto const* const pImage = ImageAccessor::getImpl<GPU>(&image);
    ASSERT_NE(pImage, nullptr);
    EXPECT_EQ(pImage->pixelFormat(), GPU::PIXEL_FORMAT_RGBA8);
    EXPECT_EQ(pImage->positionExtent(), rect(-1, 5, 4, 2));
    EXPECT_EQ(pImage->pixelExtent(), PixelExtentInWorldSpace(2, 3));
    EXPECT_EQ(ImageAccessor::getImpl<ORVO::ImageCPU>(&image), nullptr);
}

TEST_F(ImageGLTest, TakesAndDropsTexturesThatStayTheHosts) {
    OGL::Texture2D first(Texture::INTERNAL_FORMAT_RGBA8, 4, 2, false, nullptr);
    OGL::Texture2D second(Texture::INTERNAL_FORMAT_RGBA16F, 4, 2, false, nullptr);
    ObjectCounts const before = GLHooks::objects();
    {
        ImageGL image(oDescriptor_, rect(0, 0, 4, 2), &first);
        image.setContentStamp(7);
        image.setPixelStorage(&second);
        EXPECT_EQ(image.getPixelStorage(), &second);
        EXPECT_EQ(image.contentStamp(), 0u);
        // The format is the texture's own, whatever the descriptor says.
        EXPECT_EQ(ImageAccessor::getImpl<GPU>(&image)->pixelFormat(), GPU::PIXEL_FORMAT_RGBA16F);
        ImageGL const copy(image);
        EXPECT_EQ(copy.getPixelStorage(), &second);
        image.setPixelStorage(nullptr);
        EXPECT_EQ(image.getPixelStorage(), nullptr);
        EXPECT_EQ(copy.getPixelStorage(), &second);
        image.clear();
    }
    EXPECT_EQ(GLHooks::objects(), before);
    EXPECT_TRUE(isAlive(first) && isAlive(second));
}

TEST_F(ImageGLTest, ARefusedTextureLeavesTheOldOne) {
    OGL::Texture2D texture(Texture::INTERNAL_FORMAT_RGBA8, 4, 2, false, nullptr);
    OGL::Texture2D odd(Texture::INTERNAL_FORMAT_INTENSITY8, 4, 2, false, nullptr);
    ImageGL image(oDescriptor_, rect(0, 0, 4, 2), &texture);
    ORVO_EXPECT_PARAMETER(image.setPixelStorage(&odd), "invalid pixel format");
    EXPECT_EQ(image.getPixelStorage(), &texture);
    ORVO_EXPECT_PARAMETER(ImageGL(oDescriptor_, rect(0, 0, 4, 2), &odd), "invalid pixel format");
    EXPECT_TRUE(isAlive(odd));
}

TEST_F(ImageGLTest, ClearBlackensATextureThatIsLargerThanTheImageAlone) {
    std::vector<std::uint8_t> const aGrey(4 * 4 * 2, 9);
    TextureImage same(0, 0, 4, 2);
    same.write(aGrey);
    same.handle()->clear();
    EXPECT_EQ(same.read(), aGrey);
    TextureImage larger(0, 0, 4, 2);
    larger.write(aGrey);
    ImageGL part(oDescriptor_, rect(0, 0, 3, 2), &larger.texture());
    GLState const before = GLState::capture();
    part.clear();
    EXPECT_EQ(before.differencesTo(GLState::capture()), "");
    EXPECT_EQ(larger.read(), std::vector<std::uint8_t>(aGrey.size(), 0));
}

TEST_F(ImageGLTest, ClearDoesNotMindTheHostsStateAndKeepsIt) {
    TextureImage larger(0, 0, 4, 2);
    larger.write(std::vector<std::uint8_t>(4 * 4 * 2, 9));
    ImageGL part(oDescriptor_, rect(0, 0, 3, 2), &larger.texture());
    GLuint aFramebuffers[2] = {};
    glGenFramebuffers(2, aFramebuffers);
    glBindFramebuffer(GL_DRAW_FRAMEBUFFER, aFramebuffers[0]);
    glBindFramebuffer(GL_READ_FRAMEBUFFER, aFramebuffers[1]);
    glPushAttrib(GL_ALL_ATTRIB_BITS);
    glEnable(GL_SCISSOR_TEST);
    glScissor(1, 1, 1, 1);
    glColorMask(GL_TRUE, GL_FALSE, GL_TRUE, GL_FALSE);
    glClearColor(0.5f, 0.25f, 0.75f, 1.0f);
    glViewport(1, 2, 3, 4);
    GLState const before = GLState::capture();
    part.clear();
    EXPECT_EQ(before.differencesTo(GLState::capture()), "");
    EXPECT_EQ(larger.read(), std::vector<std::uint8_t>(4 * 4 * 2, 0));
    glPopAttrib();
    glBindFramebuffer(GL_FRAMEBUFFER, 0);
    glDeleteFramebuffers(2, aFramebuffers);
}

TEST_F(ImageGLTest, ClearReportsEveryCallThatFails) {
    std::vector<std::uint8_t> const aGrey(4 * 4 * 2, 9);
    TextureImage larger(0, 0, 4, 2);
    larger.write(aGrey);
    ImageGL part(oDescriptor_, rect(0, 0, 3, 2), &larger.texture());
    GLState const before = GLState::capture();
    std::set<std::string> const aFailed =
        failEveryCall([&] { part.clear(); },
                      [&] {
                          EXPECT_EQ(glGetError(), GL_NO_ERROR);
                          EXPECT_EQ(before.differencesTo(GLState::capture()), "");
                          EXPECT_EQ(larger.read(), aGrey);
                      });
    EXPECT_EQ(aFailed.count("glGenFramebuffers"), 1u);
    EXPECT_EQ(aFailed.count("glFramebufferTexture2D"), 1u);
    EXPECT_EQ(larger.read(), std::vector<std::uint8_t>(aGrey.size(), 0)) << "the run without a failure";
}

TEST_F(ImageGLTest, TakesHalvesOfThreeChannels) {
    OGL::Texture2D texture(Texture::INTERNAL_FORMAT_RGB16F, 4, 2, false, nullptr);
    ImageDescriptorGL const descriptor({3, ImageDescriptor::CHANNEL_TYPE_FLOAT16}, PixelExtentInWorldSpace());
    ImageGL const image(descriptor, rect(0, 0, 4, 2), &texture);
    EXPECT_EQ(ImageAccessor::getImpl<GPU>(&image)->pixelFormat(), GPU::PIXEL_FORMAT_RGB16F);
}

TEST_F(ImageGLTest, WrapsARuntimeImage) {
    GPU runtimeImage(rect(2, -3, 5, 4), GPU::PIXEL_FORMAT_LUMINANCE32F, PixelExtentInWorldSpace(0.5f, 1),
                     true);
    auto const spHandle = ImageAccessor::wrapImageFlowImage(&runtimeImage);
    auto* const pHandle = dynamic_cast<ImageGL*>(spHandle.get());
    ASSERT_NE(pHandle, nullptr);
    EXPECT_EQ(pHandle->getPixelStorage(), runtimeImage.texture());
    EXPECT_EQ(pHandle->rect(), rect(2, -3, 5, 4));
    EXPECT_EQ(pHandle->imageDescriptor().type(), ORVO_TARGET_GL);
    EXPECT_EQ(pHandle->imageDescriptor().format().nChannel, 1u);
    EXPECT_EQ(static_cast<int>(pHandle->imageDescriptor().format().channelType), 6);
    EXPECT_EQ(pHandle->imageDescriptor().pixelExtent(), PixelExtentInWorldSpace(0.5f, 1));
    GPU hole(rect(0, 0, 2, 2), GPU::PIXEL_FORMAT_RGBA32F, PixelExtentInWorldSpace(), true);
    ORVO_EXPECT_INTERNAL(ImageAccessor::wrapImageFlowImage(&hole), noFormatText);
}

} // namespace
} // namespace ORVO::FilterGraph::Internal
