// A wrapper's image and its storage in host memory, without OpenGL.
#include "orvo/filter_graph/utility/ImageWrapper.h"

#include "orvo/core/memory/AllocationFailure.h"
#include "orvo/core/memory/MemoryStatistics.h"
#include "orvo/core/utility/Integers.h"
#include "orvo/filter_graph/impl/ImageCPU.h"
#include "orvo/filter_graph/impl/ImageDescriptorCPU.h"
#include "orvo/filter_graph/impl/ImageDescriptorGL.h"
#include "orvo/filter_graph/impl/ImageGL.h"
#include "tests/support/CoreLayer.h"
#include "tests/support/Expect.h"

#include <cstring>
#include <new>

namespace ORVO::FilterGraph::Utility {
namespace {

using Texture = OGL::Texture;

constexpr ImageDescriptor::Format rgb8 = {3, ImageDescriptor::CHANNEL_TYPE_UINT8};

PositionExtentInPixelSpace rectangle(int x, int y, int width, int height) {
    return {PositionInPixelSpace(x, y), ExtentInPixelSpace(width, height)};
}

ImageDescriptor::Format formatOf(std::size_t nChannel, int type) {
    return {nChannel, static_cast<ImageDescriptor::eChannelType>(type)};
}

std::size_t imageBlocks() { return Core::MemoryStatistics::blocks(MEMORY_TYPE_IMAGE); }

class ImageWrapperTest : public testing::Test {
protected:
    ORVO::Test::CoreLayer oCore_;
    PixelExtentInWorldSpace oPixel_{2.0F, 0.5F};
    PositionExtentInPixelSpace oRect_ = rectangle(-3, 4, 7, 5);
};

TEST_F(ImageWrapperTest, StandsWithAnImageAndWithoutPixels) {
    ImageWrapper fromParts(rgb8, oPixel_, ORVO_TARGET_CPU, oRect_);
    ImageWrapper fromDescriptor(ImageDescriptorCPU(rgb8, oPixel_), oRect_);
    for (ImageWrapper* const pWrapper : {&fromParts, &fromDescriptor}) {
        ImageWrapper const& constant = *pWrapper;
        EXPECT_TRUE(dynamic_cast<ImageCPU*>(&pWrapper->image()));
        EXPECT_EQ(&constant.image(), &pWrapper->image());
        EXPECT_EQ(constant.operator->(), &constant.image());
        EXPECT_EQ((*pWrapper)->rect(), oRect_);
        EXPECT_TRUE(constant->imageDescriptor().equals(ImageDescriptorCPU(rgb8, oPixel_)));
        EXPECT_EQ(constant.position(), oRect_.position());
        EXPECT_EQ(constant.extent(), oRect_.extent());
        EXPECT_EQ(pWrapper->storageCPU(), nullptr);
        EXPECT_EQ(constant.storageCPU(), nullptr);
        EXPECT_EQ(pWrapper->storageGL(), nullptr);
        EXPECT_EQ(constant.storageGL(), nullptr);
        EXPECT_FALSE(constant.imageHasPixelStorage());
        EXPECT_EQ(constant.storageSize(), 105U);
    }
    ImageWrapper const texture(ImageDescriptorGL(rgb8, oPixel_), oRect_);
    EXPECT_TRUE(dynamic_cast<ImageGL const*>(&texture.image()));
    EXPECT_FALSE(texture.imageHasPixelStorage());
}

TEST_F(ImageWrapperTest, HasNoImageOnOtherPlatforms) {
    for (TargetPlatform const platform :
         {ORVO_TARGET_RESERVED_2, ORVO_TARGET_RESERVED_3, ORVO_TARGET_UNSET}) {
        ImageWrapper wrapper(rgb8, oPixel_, platform, oRect_);
        ImageWrapper const& constant = wrapper;
        EXPECT_EQ(wrapper.extent(), oRect_.extent());
        ORVO_EXPECT_INTERNAL(wrapper.imageHasPixelStorage(), "Unknown image type");
        ORVO_EXPECT_INTERNAL(wrapper.initializeStorage(), "Unknown image type");
        ORVO_EXPECT_INTERNAL(wrapper.image(), "Enforce spImage_ != NULL");
        ORVO_EXPECT_INTERNAL(constant.image(), "Enforce spImage_ != NULL");
        ORVO_EXPECT_INTERNAL(wrapper.allocateStorageCPU(), "Enforce spImage_ != NULL");
        ORVO_EXPECT_INTERNAL(wrapper.allocateStorageGL(), "Enforce spImage_ != NULL");
        ORVO_EXPECT_INTERNAL(wrapper.imageCPU2GL(), "Enforce spImage_ != NULL");
        ORVO_EXPECT_INTERNAL(wrapper.imageGL2CPU(), "Enforce spImage_ != NULL");
        ORVO_EXPECT_INTERNAL(wrapper.storageSize(), "Enforce spImage_ != NULL");
        wrapper.releaseStorage();
    }
}

TEST_F(ImageWrapperTest, RefusesImagesThatCannotBe) {
    ORVO_EXPECT_PARAMETER(ImageWrapper(rgb8, oPixel_, ORVO_TARGET_CPU, rectangle(0, 0, -1, 1)),
                          "Image extent must not be negative");
    ORVO_EXPECT_INTERNAL(ImageWrapper(formatOf(5, 0), oPixel_, ORVO_TARGET_CPU, oRect_),
                         "Not implemented: pixelFormat in ImageCPU::mapDescriptorToImageCPU()");
    ORVO_EXPECT_INTERNAL(
        ImageWrapper(formatOf(3, 4), oPixel_, ORVO_TARGET_CPU, oRect_),
        "Not implemented: Only 8uint/16uint/32f supported in ImageCPU::mapDescriptorToImageCPU()");
}

TEST_F(ImageWrapperTest, GivesItsImageMemoryAndTakesItAway) {
    std::size_t const nBlocks = imageBlocks();
    {
        ImageWrapper wrapper(rgb8, oPixel_, ORVO_TARGET_CPU, oRect_);
        wrapper.initializeStorage();
        auto& image = dynamic_cast<ImageCPU&>(wrapper.image());
        EXPECT_TRUE(wrapper.imageHasPixelStorage());
        ASSERT_NE(wrapper.storageCPU(), nullptr);
        EXPECT_TRUE(isAligned(wrapper.storageCPU(), 64));
        EXPECT_EQ(image.getPixelStorage(), wrapper.storageCPU());
        EXPECT_EQ(image.paddedWidthInBytes(), 21U);
        EXPECT_EQ(imageBlocks(), nBlocks + 1);
        std::memset(wrapper.storageCPU(), 7, wrapper.storageSize());
        unsigned char const* const pBefore = wrapper.storageCPU();
        wrapper.initializeStorage();
        EXPECT_EQ(wrapper.storageCPU(), pBefore);
        EXPECT_EQ(wrapper.storageCPU()[104], 7);

        wrapper.releaseStorage();
        EXPECT_FALSE(wrapper.imageHasPixelStorage());
        EXPECT_EQ(wrapper.storageCPU(), nullptr);
        EXPECT_EQ(image.getPixelStorage(), nullptr);
        EXPECT_EQ(imageBlocks(), nBlocks);
        wrapper.releaseStorage();
        wrapper.initializeStorage();
    }
    EXPECT_EQ(imageBlocks(), nBlocks);
}

TEST_F(ImageWrapperTest, AllocatesAgainWithoutLosingTheFirst) {
    std::size_t const nBlocks = imageBlocks();
    ImageWrapper wrapper(rgb8, oPixel_, ORVO_TARGET_CPU, oRect_);
    wrapper.allocateStorageCPU();
    EXPECT_FALSE(wrapper.imageHasPixelStorage()); // memory alone
    wrapper.allocateStorageCPU();
    EXPECT_EQ(imageBlocks(), nBlocks + 1);
    wrapper.initializeStorage();
    EXPECT_EQ(imageBlocks(), nBlocks + 1);
    wrapper.allocateStorageCPU();
    EXPECT_EQ(imageBlocks(), nBlocks + 1);
    EXPECT_TRUE(wrapper.imageHasPixelStorage()); // the image follows
    wrapper.deallocateStorageCPU();
    EXPECT_EQ(imageBlocks(), nBlocks);
    EXPECT_EQ(dynamic_cast<ImageCPU&>(wrapper.image()).getPixelStorage(), nullptr);
    wrapper.deallocateStorageCPU();
    EXPECT_EQ(wrapper.storageCPU(), nullptr);
}

TEST_F(ImageWrapperTest, AllocatesForTheImagesPresentRectangle) {
    ImageWrapper wrapper(rgb8, oPixel_, ORVO_TARGET_CPU, oRect_);
    wrapper.initializeStorage();
    wrapper->setRect(rectangle(0, 0, 100, 10));
    EXPECT_EQ(wrapper.storageSize(), 3000U);
    EXPECT_EQ(wrapper.extent(), oRect_.extent());
    wrapper.allocateStorageCPU();
    EXPECT_EQ(dynamic_cast<ImageCPU&>(wrapper.image()).paddedWidthInBytes(), 300U);
    std::memset(wrapper.storageCPU(), 1, 3000);
}

TEST_F(ImageWrapperTest, DoesNotTakeForeignPixelsForItsOwn) {
    std::vector<unsigned char> aPixels(105);
    ImageWrapper wrapper(rgb8, oPixel_, ORVO_TARGET_CPU, oRect_);
    auto& image = dynamic_cast<ImageCPU&>(wrapper.image());
    image.setPixelStorage(aPixels.data(), 0);
    EXPECT_FALSE(wrapper.imageHasPixelStorage());
    wrapper.allocateStorageCPU();
    EXPECT_FALSE(wrapper.imageHasPixelStorage());
    wrapper.deallocateStorageCPU();
    EXPECT_EQ(image.getPixelStorage(), aPixels.data());
    wrapper.releaseStorage();
    EXPECT_EQ(image.getPixelStorage(), nullptr);
}

TEST_F(ImageWrapperTest, CountsPixelsInThirtyTwoBits) {
    ImageWrapper const wrapper(rgb8, oPixel_, ORVO_TARGET_CPU, rectangle(0, 0, 65536, 65537));
    EXPECT_EQ(wrapper.storageSize(), 3U * 65536);
}

TEST_F(ImageWrapperTest, RefusesImagesBeyondFourGigabytes) {
    // The last one that passes would need the memory: 3 * 1431655765 bytes are 2^32 - 1.
    for (auto const& rect : {rectangle(0, 0, 65536, 65537), rectangle(0, 0, 1431655766, 1)}) {
        ImageWrapper wrapper(rgb8, oPixel_, ORVO_TARGET_CPU, rect);
        ORVO_EXPECT_PARAMETER(wrapper.allocateStorageCPU(), "Image size exceeds 4294967295 bytes");
        ORVO_EXPECT_PARAMETER(wrapper.initializeStorage(), "Image size exceeds 4294967295 bytes");
        ORVO_EXPECT_PARAMETER(wrapper.allocateStorageGL(), "Image size exceeds 4294967295 bytes");
        EXPECT_EQ(wrapper.storageCPU(), nullptr);
    }
}

TEST_F(ImageWrapperTest, StaysAsItWasWithoutMemory) {
    ImageWrapper wrapper(rgb8, oPixel_, ORVO_TARGET_CPU, oRect_);
    wrapper.initializeStorage();
    unsigned char const* const pBefore = wrapper.storageCPU();
    std::uint64_t nFailed = 0;
    for (;; ++nFailed) {
        Core::AllocationFailure const failure(nFailed + 1);
        try {
            wrapper.allocateStorageCPU();
            break;
        } catch (std::bad_alloc const&) {
            EXPECT_EQ(wrapper.storageCPU(), pBefore);
            EXPECT_TRUE(wrapper.imageHasPixelStorage());
        }
    }
    EXPECT_GE(nFailed, 2U); // the memory, and the image around it
}

TEST_F(ImageWrapperTest, ChangesTheKindOfTheImage) {
    ImageWrapper wrapper(rgb8, oPixel_, ORVO_TARGET_CPU, oRect_);
    wrapper.initializeStorage();
    unsigned char const* const pStorage = wrapper.storageCPU();
    ORVO_EXPECT_INTERNAL(wrapper.imageGL2CPU(), "image().imageDescriptor().type() == ORVO_TARGET_GL");
    wrapper.imageCPU2GL();
    EXPECT_TRUE(dynamic_cast<ImageGL*>(&wrapper.image()));
    EXPECT_TRUE(wrapper->imageDescriptor().equals(ImageDescriptorGL(rgb8, oPixel_)));
    EXPECT_EQ(wrapper->rect(), oRect_);
    EXPECT_FALSE(wrapper.imageHasPixelStorage());
    EXPECT_EQ(wrapper.storageCPU(), pStorage);
    ORVO_EXPECT_INTERNAL(wrapper.imageCPU2GL(), "image().imageDescriptor().type() == ORVO_TARGET_CPU");
    wrapper.imageGL2CPU();
    EXPECT_TRUE(wrapper->imageDescriptor().equals(ImageDescriptorCPU(rgb8, oPixel_)));
    EXPECT_FALSE(wrapper.imageHasPixelStorage());
    EXPECT_EQ(wrapper.storageCPU(), pStorage);
    // The new image takes the wrapper's memory anew.
    wrapper.initializeStorage();
    EXPECT_TRUE(wrapper.imageHasPixelStorage());
}

TEST_F(ImageWrapperTest, StaysWithATextureWhereMemoryCannotHaveTheFormat) {
    ImageWrapper wrapper(formatOf(3, 4), oPixel_, ORVO_TARGET_GL, oRect_);
    ORVO_EXPECT_INTERNAL(
        wrapper.imageGL2CPU(),
        "Not implemented: Only 8uint/16uint/32f supported in ImageCPU::mapDescriptorToImageCPU()");
    EXPECT_TRUE(dynamic_cast<ImageGL*>(&wrapper.image()));
}

TEST_F(ImageWrapperTest, CopiesNothingWithoutBothStorages) {
    ImageWrapper wrapper(rgb8, oPixel_, ORVO_TARGET_CPU, oRect_);
    ORVO_EXPECT_INTERNAL(wrapper.storageCPU2GL(), "storageGL_ != 0");
    ORVO_EXPECT_INTERNAL(wrapper.storageGL2CPU(), "storageGL_ != 0");
    unsigned char aPixels[105] = {};
    ORVO_EXPECT_INTERNAL(wrapper.storageCPU2GL(aPixels, nullptr), "storageGL != 0");
    ORVO_EXPECT_INTERNAL(wrapper.storageGL2CPU(nullptr, aPixels), "storageGL != 0");
}

TEST_F(ImageWrapperTest, SaysWhatItsTexturesAre) {
    Texture::Format const aFormats[] = {Texture::FORMAT_LUMINANCE, Texture::FORMAT_RGBA, Texture::FORMAT_RGB,
                                        Texture::FORMAT_RGBA, Texture::FORMAT_RGBA};
    for (std::size_t nChannel = 1; nChannel <= 5; ++nChannel) {
        ImageWrapper const wrapper(formatOf(nChannel, 0), oPixel_, ORVO_TARGET_GL, oRect_);
        EXPECT_EQ(wrapper.textureFormatToUse(), aFormats[nChannel - 1]) << nChannel;
    }
    Texture::Type const aTypes[] = {Texture::TYPE_UNSIGNED_BYTE,  Texture::TYPE_UNSIGNED_SHORT,
                                    Texture::TYPE_UNSIGNED_SHORT, Texture::TYPE_UNSIGNED_BYTE,
                                    Texture::TYPE_UNSIGNED_BYTE,  Texture::TYPE_INT,
                                    Texture::TYPE_FLOAT,          Texture::TYPE_UNSIGNED_BYTE};
    for (int type = 0; type < 8; ++type) {
        ImageWrapper const wrapper(formatOf(4, type), oPixel_, ORVO_TARGET_GL, oRect_);
        EXPECT_EQ(wrapper.textureTypeToUse(), aTypes[type]) << type;
    }
}

TEST_F(ImageWrapperTest, SaysTheInternalFormat) {
    struct Row {
        std::size_t nChannel;
        int type;
        Texture::InternalFormat eFormat;
    };
    for (Row const& row :
         {Row{1, 0, Texture::INTERNAL_FORMAT_LUMINANCE}, Row{2, 0, Texture::INTERNAL_FORMAT_LUMINANCE_ALPHA},
          Row{3, 0, Texture::INTERNAL_FORMAT_RGB8}, Row{4, 0, Texture::INTERNAL_FORMAT_RGBA8},
          Row{3, 2, Texture::INTERNAL_FORMAT_RGB16}, Row{4, 3, Texture::INTERNAL_FORMAT_RGBA16},
          Row{4, 4, Texture::INTERNAL_FORMAT_RGBA16F}, Row{3, 6, Texture::INTERNAL_FORMAT_RGB32F}}) {
        ImageWrapper const wrapper(formatOf(row.nChannel, row.type), oPixel_, ORVO_TARGET_GL, oRect_);
        EXPECT_EQ(wrapper.textureInternalFormatToUse(), row.eFormat) << row.nChannel << ' ' << row.type;
    }
    ORVO_EXPECT_INTERNAL(
        ImageWrapper(formatOf(3, 5), oPixel_, ORVO_TARGET_GL, oRect_).textureInternalFormatToUse(),
        "Not implemented: Data type not supported in ImageGPU::mapDescriptorToImageGPU()");
    ORVO_EXPECT_INTERNAL(
        ImageWrapper(formatOf(5, 0), oPixel_, ORVO_TARGET_GL, oRect_).textureInternalFormatToUse(),
        "Not implemented: pixelFormat in ImageGPU::mapDescriptorToImageGPU()");
    ORVO_EXPECT_PARAMETER(
        ImageWrapper(formatOf(2, 2), oPixel_, ORVO_TARGET_GL, oRect_).textureInternalFormatToUse(),
        "invalid pixel format");
}

} // namespace
} // namespace ORVO::FilterGraph::Utility
