// Wrappers and tiles in textures: storage from the pool, copies both ways in every format, the memory limit
// in textures, and failures of the driver.
#include "orvo/filter_graph/utility/ImageWrapper.h"
#include "orvo/filter_graph/utility/Tiles.h"

#include <epoxy/gl.h>

#include "orvo/filter_graph/impl/ImageDescriptorCPU.h"
#include "orvo/filter_graph/impl/ImageDescriptorGL.h"
#include "orvo/filter_graph/impl/Parameter.h"
#include "orvo/image_runtime/TexturePool.h"
#include "orvo/ogl/TextureUnit.h"
#include "tests/support/Expect.h"
#include "tests/support/gl/FailEveryCall.h"
#include "tests/support/gl/GLFrameTest.h"

#include <cstring>

namespace ORVO::FilterGraph::Utility {
namespace {

using namespace ORVO::Test;
using Texture = OGL::Texture;

constexpr ImageDescriptor::Format rgba8 = {4, ImageDescriptor::CHANNEL_TYPE_UINT8};

PositionExtentInPixelSpace rectangle(int x, int y, int width, int height) {
    return {PositionInPixelSpace(x, y), ExtentInPixelSpace(width, height)};
}

class TilesGLTest : public GLFrameTest {
protected:
    static ImageDescriptorGL descriptor(ImageDescriptor::Format const& format = rgba8) {
        return {format, PixelExtentInWorldSpace()};
    }

    /// A wrapper with memory and a texture, and the image in the texture.
    static std::unique_ptr<ImageWrapper> bothStorages(ImageDescriptor::Format const& format, int width,
                                                      int height) {
        auto pWrapper = std::make_unique<ImageWrapper>(format, PixelExtentInWorldSpace(), ORVO_TARGET_GL,
                                                       rectangle(0, 0, width, height));
        pWrapper->allocateStorageCPU();
        pWrapper->initializeStorage();
        return pWrapper;
    }

    static long textures() {
        ObjectCounts const objects = GLHooks::objects();
        auto const found = objects.find("texture");
        return found == objects.end() ? 0 : found->second;
    }

    /// Without what the pool keeps for later.
    static long texturesInUse() {
        TexturePool::Instance()->clearAll();
        return textures();
    }
};

TEST_F(TilesGLTest, GivesItsImageATextureOfJustItsSize) {
    long const nBefore = texturesInUse();
    {
        ImageWrapper wrapper(descriptor(), rectangle(3, -4, 37, 21));
        wrapper.initializeStorage();
        EXPECT_TRUE(wrapper.imageHasPixelStorage());
        ASSERT_NE(wrapper.storageGL(), nullptr);
        EXPECT_EQ(wrapper.storageGL()->width(0), 37U);
        EXPECT_EQ(wrapper.storageGL()->height(0), 21U);
        EXPECT_EQ(wrapper.storageGL()->format(), Texture::INTERNAL_FORMAT_RGBA8);
        EXPECT_EQ(dynamic_cast<ImageGL&>(wrapper.image()).getPixelStorage(), wrapper.storageGL());
        OGL::Texture2D const* const pTexture = wrapper.storageGL();
        wrapper.initializeStorage();
        EXPECT_EQ(wrapper.storageGL(), pTexture);
        EXPECT_EQ(texturesInUse(), nBefore + 1);

        wrapper.allocateStorageGL(); // the old one goes back, and the image follows
        EXPECT_TRUE(wrapper.imageHasPixelStorage());
        EXPECT_EQ(texturesInUse(), nBefore + 1);

        wrapper.deallocateStorageGL();
        EXPECT_FALSE(wrapper.imageHasPixelStorage());
        EXPECT_EQ(dynamic_cast<ImageGL&>(wrapper.image()).getPixelStorage(), nullptr);
        EXPECT_EQ(texturesInUse(), nBefore);
        wrapper.deallocateStorageGL();
        wrapper.initializeStorage();
        wrapper.releaseStorage();
        EXPECT_EQ(wrapper.storageGL(), nullptr);
        EXPECT_EQ(texturesInUse(), nBefore);
        wrapper.initializeStorage();
    }
    EXPECT_EQ(texturesInUse(), nBefore);
}

TEST_F(TilesGLTest, DoesNotTakeAForeignTextureForItsOwn) {
    OGL::Texture2D texture(Texture::INTERNAL_FORMAT_RGBA8, 8, 8, false, nullptr);
    ImageWrapper wrapper(descriptor(), rectangle(0, 0, 8, 8));
    auto& image = dynamic_cast<ImageGL&>(wrapper.image());
    image.setPixelStorage(&texture);
    EXPECT_FALSE(wrapper.imageHasPixelStorage());
    wrapper.allocateStorageGL();
    EXPECT_FALSE(wrapper.imageHasPixelStorage());
    wrapper.deallocateStorageGL();
    EXPECT_EQ(image.getPixelStorage(), &texture);
    wrapper.releaseStorage();
    EXPECT_EQ(image.getPixelStorage(), nullptr);
}

TEST_F(TilesGLTest, CopiesEveryFormatBothWays) {
    struct Row {
        std::size_t nChannel;
        ImageDescriptor::eChannelType type;
    };
    using D = ImageDescriptor;
    for (Row const& row :
         {Row{1, D::CHANNEL_TYPE_UINT8}, Row{2, D::CHANNEL_TYPE_UINT8}, Row{3, D::CHANNEL_TYPE_UINT8},
          Row{4, D::CHANNEL_TYPE_UINT8}, Row{1, D::CHANNEL_TYPE_UINT15_1}, Row{3, D::CHANNEL_TYPE_UINT15_1},
          Row{4, D::CHANNEL_TYPE_UINT15_1}, Row{1, D::CHANNEL_TYPE_FLOAT32}, Row{2, D::CHANNEL_TYPE_FLOAT32},
          Row{3, D::CHANNEL_TYPE_FLOAT32}, Row{4, D::CHANNEL_TYPE_FLOAT32}}) {
        auto const pWrapper = bothStorages({row.nChannel, row.type}, 5, 3); // rows of odd lengths
        std::size_t const nValues = 15 * row.nChannel;
        std::vector<unsigned char> aBytes(pWrapper->storageSize());
        auto* const pFloats = reinterpret_cast<float*>(aBytes.data());
        for (std::size_t i = 0; i < nValues; ++i) {
            if (row.type == D::CHANNEL_TYPE_FLOAT32) {
                pFloats[i] = static_cast<float>(i) * 0.37F - 3.0F;
            } else {
                std::size_t const nStep = aBytes.size() / nValues;
                aBytes[i * nStep] = static_cast<unsigned char>(7 * i + 1);
                aBytes[i * nStep + nStep - 1] = static_cast<unsigned char>(3 * i);
            }
        }
        std::memcpy(pWrapper->storageCPU(), aBytes.data(), aBytes.size());
        pWrapper->storageCPU2GL();
        std::memset(pWrapper->storageCPU(), 0xcd, aBytes.size());
        pWrapper->storageGL2CPU();
        EXPECT_EQ(std::memcmp(pWrapper->storageCPU(), aBytes.data(), aBytes.size()), 0)
            << row.nChannel << " channels of type " << row.type;
    }
}

TEST_F(TilesGLTest, CopiesIntoForeignStorage) {
    auto const pWrapper = bothStorages(rgba8, 6, 4);
    std::vector<std::uint8_t> const aBytes = pattern(6, 4);
    OGL::Texture2D larger(Texture::INTERNAL_FORMAT_RGBA8, 8, 8, false, nullptr);
    pWrapper->storageCPU2GL(aBytes.data(), &larger);
    std::vector<std::uint8_t> aBack(aBytes.size());
    pWrapper->storageGL2CPU(&larger, aBack.data());
    EXPECT_EQ(aBack, aBytes);

    OGL::Texture2D smaller(Texture::INTERNAL_FORMAT_RGBA8, 6, 3, false, nullptr);
    ORVO_EXPECT_PARAMETER(pWrapper->storageCPU2GL(aBytes.data(), &smaller),
                          "The rectangle lies outside the texture");
    ORVO_EXPECT_PARAMETER(pWrapper->storageGL2CPU(&smaller, aBack.data()),
                          "The rectangle lies outside the texture");
}

TEST_F(TilesGLTest, CopiesChannelsWithoutATypeOfTheirOwnAsBytes) {
    for (auto const type : {ImageDescriptor::CHANNEL_TYPE_UINT16, ImageDescriptor::CHANNEL_TYPE_FLOAT16}) {
        for (std::size_t const nChannel : {std::size_t(1), std::size_t(3), std::size_t(4)}) {
            auto const pWrapper = bothStorages({nChannel, type}, 5, 3);
            std::size_t const nBytes = 15 * nChannel; // half of the storage
            ASSERT_EQ(pWrapper->storageSize(), 2 * nBytes);
            OGL::Texture2D larger(pWrapper->textureInternalFormatToUse(), 8, 8, false, nullptr);
            std::vector<unsigned char> aBytes(2 * nBytes, 0xab);
            for (std::size_t i = 0; i < nBytes; ++i) {
                aBytes[i] = static_cast<unsigned char>(4 * i + 1);
            }
            for (OGL::Texture2D* const pTexture : {pWrapper->storageGL(), &larger}) {
                pWrapper->storageCPU2GL(aBytes.data(), pTexture);
                std::vector<unsigned char> aBack(2 * nBytes, 0xab);
                pWrapper->storageGL2CPU(pTexture, aBack.data());
                EXPECT_EQ(aBack, aBytes) << nChannel << " channels of type " << type;
            }
        }
    }
}

TEST_F(TilesGLTest, CopiesNothingOfAnImageWithoutPixels) {
    auto const pWrapper = bothStorages(rgba8, 0, 5);
    pWrapper->storageCPU2GL();
    pWrapper->storageGL2CPU();
    EXPECT_EQ(pWrapper->storageSize(), 0U);
}

TEST_F(TilesGLTest, WantsBothStorages) {
    ImageWrapper wrapper(descriptor(), rectangle(0, 0, 4, 4));
    wrapper.initializeStorage();
    ORVO_EXPECT_INTERNAL(wrapper.storageCPU2GL(), "storageCPU_ != 0");
    ORVO_EXPECT_INTERNAL(wrapper.storageGL2CPU(), "storageCPU_ != 0");
}

TEST_F(TilesGLTest, LeavesUnitZeroActiveAndUnbound) {
    auto const pWrapper = bothStorages(rgba8, 4, 4);
    OGL::TextureUnit::Unit(1).bind(pWrapper->storageGL());
    pWrapper->storageCPU2GL();
    GLint nActive = 0;
    glGetIntegerv(GL_ACTIVE_TEXTURE, &nActive);
    EXPECT_EQ(nActive, GL_TEXTURE1);
    EXPECT_EQ(pWrapper->storageGL()->getBoundID(), pWrapper->storageGL()->objectID());
    pWrapper->storageGL2CPU();
    glGetIntegerv(GL_ACTIVE_TEXTURE, &nActive);
    EXPECT_EQ(nActive, GL_TEXTURE0);
    EXPECT_EQ(pWrapper->storageGL()->getBoundID(), 0U);
    OGL::TextureUnit::Unit(1).bind2DDefault();
    OGL::TextureUnit::Unit(0).bind2DDefault();
}

TEST_F(TilesGLTest, MovesATileThereAndBack) {
    std::vector<std::uint8_t> const aBytes = pattern(20, 10);
    ImageWrapper wrapper(rgba8, PixelExtentInWorldSpace(), ORVO_TARGET_CPU, rectangle(0, 0, 20, 10));
    wrapper.initializeStorage();
    std::memcpy(wrapper.storageCPU(), aBytes.data(), aBytes.size());
    wrapper.imageCPU2GL();
    wrapper.initializeStorage();
    wrapper.storageCPU2GL();
    wrapper.deallocateStorageCPU();
    EXPECT_TRUE(wrapper.imageHasPixelStorage());

    // A frame in between: every channel plus 51.
    ByteImage result(0, 0, 20, 10);
    SourcePtr const spSource = makeGLSource(&wrapper.image());
    SinkPtr const spSink = makeGLSink(result.handle());
    FilterPtr const spFilter = makeAddShader();
    spFilter->parameter("value")->as<float>().setValue(0.2F);
    FilterGraph::Connect(spSource, spFilter);
    FilterGraph::Connect(spFilter, spSink);
    FilterGraph::createProcessor(spSink, context())->processFrame(glOptions());
    EXPECT_EQ(result.bytes(), plus(aBytes, 51));

    wrapper.imageGL2CPU();
    wrapper.initializeStorage();
    wrapper.storageGL2CPU();
    EXPECT_EQ(std::vector<std::uint8_t>(wrapper.storageCPU(), wrapper.storageCPU() + wrapper.storageSize()),
              aBytes);
}

TEST_F(TilesGLTest, KeepsNoMoreTexturesThanTheLimitAllows) {
    long const nBefore = texturesInUse();
    constexpr int nTileBytes = 16 * 16 * 4;
    auto const regions = Tiles::getRegions(rectangle(0, 0, 160, 16), ExtentInPixelSpace(16, 16));
    ASSERT_EQ(regions.size(), 10U);
    for (bool const bReverse : {false, true}) {
        Tiles tiles(descriptor(), rectangle(0, 0, 160, 16), regions.size());
        tiles.setReverseTraversal(bReverse);
        tiles.setGPUMemoryLimit(2 * nTileBytes);
        for (int i = 0; i < 30; ++i) { // three passes
            int const index = bReverse ? 9 - i % 10 : i % 10;
            tiles.createTileAt(index, regions[static_cast<std::size_t>(index)])->initializeStorage();
            // Those that stayed, and the new one.
            EXPECT_EQ(texturesInUse() - nBefore, std::min(i + 1, 3)) << i;
            EXPECT_EQ(tiles.memoryUseGPU(), std::min(i + 1, 3) * nTileBytes) << i;
            EXPECT_TRUE(tiles.tiles()[static_cast<std::size_t>(index)]->imageHasPixelStorage());
        }
        tiles.cleanupGPU(0);
        EXPECT_EQ(texturesInUse(), nBefore);
        EXPECT_EQ(tiles.memoryUseGPU(), 0);
    }
}

TEST_F(TilesGLTest, MakesATileForEachRegion) {
    Tiles tiles(descriptor(), rectangle(0, 0, 40, 20), ExtentInPixelSpace(20, 20));
    EXPECT_TRUE(tiles.descriptor().equals(descriptor()));
    ASSERT_EQ(tiles.tiles().size(), 2U);
    tiles.tiles()[1]->initializeStorage();
    EXPECT_NE(tiles.tiles()[1]->storageGL(), nullptr);
    tiles.reset();
}

TEST_F(TilesGLTest, StaysAsItWasWhenTheDriverFails) {
    ImageWrapper wrapper(descriptor(), rectangle(0, 0, 9, 9));
    texturesInUse();
    auto const everything = [&wrapper] {
        TexturePool::Instance()->clearAll();
        wrapper.allocateStorageCPU();
        wrapper.initializeStorage();
        wrapper.storageCPU2GL();
        wrapper.storageGL2CPU();
        wrapper.releaseStorage();
        TexturePool::Instance()->clearAll();
    };
    everything(); // what lives longer is made
    std::set<std::string> aFailed;
    for (std::uint64_t n = 1; n < 200; ++n) {
        ObjectCounts const before = GLHooks::objects();
        std::string sFailed;
        {
            GLCallFailure const failure(n);
            try {
                everything();
            } catch (OGL::ExceptionOGL const&) {
                EXPECT_EQ(wrapper.storageGL() != nullptr, wrapper.imageHasPixelStorage()) << failure.name();
            }
            if (failure.hasFired()) {
                sFailed = failure.name();
            }
        }
        // None is current where the driver did not give it back.
        host().makeCurrent();
        wrapper.releaseStorage();
        TexturePool::Instance()->clearAll();
        EXPECT_EQ(GLHooks::objects(), before) << sFailed;
        if (sFailed.empty()) {
            break;
        }
        aFailed.insert(sFailed);
    }
    EXPECT_EQ(aFailed.count("glTexImage2D"), 1U);
    EXPECT_EQ(aFailed.count("glGenTextures"), 1U);
    everything();
}

TEST_F(TilesGLTest, GivesATextureBackWithoutAContext) {
    long const nBefore = texturesInUse();
    auto pWrapper = std::make_unique<ImageWrapper>(descriptor(), rectangle(0, 0, 9, 9));
    pWrapper->initializeStorage();
    host().release();
    pWrapper.reset();
    host().makeCurrent();
    EXPECT_EQ(texturesInUse(), nBefore);
}

} // namespace
} // namespace ORVO::FilterGraph::Utility
