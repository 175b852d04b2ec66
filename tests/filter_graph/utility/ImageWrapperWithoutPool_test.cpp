// Textures of wrappers where the library has no pool of textures: it was started for the CPU alone, while the
// host has a context.
#include "orvo/filter_graph/utility/ImageWrapper.h"

#include "orvo/core/memory/AllocationFailure.h"
#include "orvo/core/memory/MemoryStatistics.h"
#include "orvo/filter_graph/impl/ImageDescriptorGL.h"
#include "orvo/filter_graph/impl/ImageGL.h"
#include "orvo/image_runtime/ImageRuntimeLibrary.h"
#include "orvo/image_runtime/TexturePool.h"
#include "orvo/image_runtime/VideoMemoryConfiguration.h"
#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/Texture2D.h"
#include "tests/support/gl/FailEveryCall.h"
#include "tests/support/gl/GLTest.h"

#include <new>

namespace ORVO::FilterGraph::Utility {
namespace {

using ORVO::Test::GLHooks;
using ORVO::Test::ObjectCounts;

class ImageWrapperWithoutPoolTest : public ORVO::Test::GLTest {
protected:
    void SetUp() override {
        GLTest::SetUp();
        pRuntime_ = std::make_unique<ImageRuntime::AutoInitializer>(nullptr, VideoMemory::Configuration());
        ASSERT_EQ(TexturePool::Instance(), nullptr);
    }

    void TearDown() override {
        OGL::ExtensionManager::Instance()->clearOverrides();
        pRuntime_.reset();
        GLTest::TearDown();
    }

    /// 37 by 21 pixels of R, G, B and A.
    static std::unique_ptr<ImageWrapper> makeWrapper() {
        return std::make_unique<ImageWrapper>(
            ImageDescriptorGL({4, ImageDescriptor::CHANNEL_TYPE_UINT8}, PixelExtentInWorldSpace()),
            PositionExtentInPixelSpace(PositionInPixelSpace(3, -4), ExtentInPixelSpace(37, 21)));
    }

    static long textures() { return GLHooks::objects()["texture"]; }

private:
    std::unique_ptr<ImageRuntime::AutoInitializer> pRuntime_;
};

TEST_F(ImageWrapperWithoutPoolTest, MakesATextureOfASizeThatTheDriverHas) {
    struct Row {
        bool bAnySize;
        bool bRectangles;
        std::size_t nWidth;
        std::size_t nHeight;
    };
    OGL::ExtensionManager& manager = *OGL::ExtensionManager::Instance();
    for (Row const& row : {Row{true, true, 37, 21}, Row{true, false, 37, 21}, Row{false, true, 37, 21},
                           Row{false, false, 64, 32}}) {
        manager.overrideSupport(OGL::EXTENSION_ARB_TEXTURE_NON_POWER_OF_TWO, row.bAnySize);
        manager.overrideSupport(OGL::EXTENSION_ARB_TEXTURE_RECTANGLE, row.bRectangles);
        long const nBefore = textures();
        {
            auto const pWrapper = makeWrapper();
            pWrapper->initializeStorage();
            ASSERT_NE(pWrapper->storageGL(), nullptr);
            EXPECT_EQ(pWrapper->storageGL()->width(0), row.nWidth);
            EXPECT_EQ(pWrapper->storageGL()->height(0), row.nHeight);
            EXPECT_EQ(pWrapper->storageGL()->format(), OGL::Texture::INTERNAL_FORMAT_RGBA8);
            EXPECT_TRUE(pWrapper->imageHasPixelStorage());
            EXPECT_EQ((*pWrapper)->rect().extent(), ExtentInPixelSpace(37, 21));
            EXPECT_EQ(textures(), nBefore + 1);

            pWrapper->allocateStorageGL(); // the old one is deleted, and the image follows
            EXPECT_TRUE(pWrapper->imageHasPixelStorage());
            EXPECT_EQ(textures(), nBefore + 1);

            pWrapper->deallocateStorageGL();
            EXPECT_FALSE(pWrapper->imageHasPixelStorage());
            EXPECT_EQ(textures(), nBefore);
            pWrapper->allocateStorageGL(); // a texture alone
            EXPECT_FALSE(pWrapper->imageHasPixelStorage());
            pWrapper->releaseStorage();
            EXPECT_EQ(textures(), nBefore);
            pWrapper->initializeStorage();
        }
        EXPECT_EQ(textures(), nBefore);
    }
}

TEST_F(ImageWrapperWithoutPoolTest, StaysAsItWasWhenTheDriverFails) {
    auto const pWrapper = makeWrapper();
    pWrapper->initializeStorage();
    OGL::Texture2D const* const pTexture = pWrapper->storageGL();
    std::set<std::string> const aFailed =
        ORVO::Test::failEveryCall([&] { pWrapper->allocateStorageGL(); },
                                  [&] {
                                      EXPECT_EQ(pWrapper->storageGL(), pTexture);
                                      EXPECT_TRUE(pWrapper->imageHasPixelStorage());
                                      drainErrors();
                                  });
    EXPECT_EQ(aFailed.count("glTexImage2D"), 1U);
}

TEST_F(ImageWrapperWithoutPoolTest, StaysAsItWasWithoutMemory) {
    auto const pWrapper = makeWrapper();
    pWrapper->initializeStorage();
    OGL::Texture2D const* const pTexture = pWrapper->storageGL();
    ObjectCounts const objects = GLHooks::objects();
    std::size_t const nBlocks = Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT);
    std::uint64_t nFailed = 0;
    for (;; ++nFailed) {
        Core::AllocationFailure const failure(nFailed + 1);
        try {
            pWrapper->allocateStorageGL();
            break;
        } catch (std::bad_alloc const&) {
            EXPECT_EQ(pWrapper->storageGL(), pTexture);
            EXPECT_TRUE(pWrapper->imageHasPixelStorage());
        }
        EXPECT_EQ(GLHooks::objects(), objects);
        EXPECT_EQ(Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT), nBlocks);
    }
    EXPECT_GE(nFailed, 2U); // the texture, and the image around it
    EXPECT_EQ(GLHooks::objects(), objects);
}

} // namespace
} // namespace ORVO::FilterGraph::Utility
