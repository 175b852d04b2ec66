#include "orvo/filter_graph/internal/ImageAccessor.h"

#include "orvo/core/Check.h"
#include "orvo/filter_graph/impl/ImageCPU.h"
#include "orvo/filter_graph/impl/ImageDescriptorCPU.h"
#include "orvo/filter_graph/impl/ImageDescriptorGL.h"
#include "orvo/filter_graph/impl/ImageGL.h"

#include <memory>

namespace ORVO::FilterGraph::Internal {

namespace {

using CPU = ORVO::ImageCPU;
using GPU = ORVO::ImageGPU;

constexpr std::size_t nMaximumChannels = 4;

/// The formats of one channel type by the number of channels.
using FormatRow = CPU::tePixelFormat[nMaximumChannels];
using TextureFormatRow = GPU::tePixelFormat[nMaximumChannels];

constexpr FormatRow formats8 = {CPU::PIXEL_FORMAT_LUMINANCE8, CPU::PIXEL_FORMAT_LUMINANCE_ALPHA8,
                                CPU::PIXEL_FORMAT_RGB8, CPU::PIXEL_FORMAT_RGBA8};
constexpr FormatRow formats16 = {CPU::PIXEL_FORMAT_LUMINANCE16, CPU::PIXEL_FORMAT_LUMINANCE_ALPHA16,
                                 CPU::PIXEL_FORMAT_RGB16, CPU::PIXEL_FORMAT_RGBA16};
constexpr FormatRow formats32F = {CPU::PIXEL_FORMAT_LUMINANCE32F, CPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F,
                                  CPU::PIXEL_FORMAT_RGB32F, CPU::PIXEL_FORMAT_RGBA32F};

FormatRow const& formatsOf(ImageDescriptor::eChannelType channelType) {
    switch (channelType) {
    case ImageDescriptor::CHANNEL_TYPE_UINT8:
        return formats8;
    case ImageDescriptor::CHANNEL_TYPE_UINT15_1:
    case ImageDescriptor::CHANNEL_TYPE_UINT16:
        return formats16;
    case ImageDescriptor::CHANNEL_TYPE_FLOAT32:
        return formats32F;
    case ImageDescriptor::CHANNEL_TYPE_FLOAT16:
        ORVO_FAIL("Not implemented: Only 8uint/16uint/32f supported in ImageCPU::mapDescriptorToImageCPU()");
    case ImageDescriptor::CHANNEL_TYPE_RESERVED8:
    case ImageDescriptor::CHANNEL_TYPE_INT32:
        break;
    }
    ORVO_FAIL("Not implemented: Data type not supported in ImageCPU::mapDescriptorToImageCPU()");
}

ImageDescriptor::eChannelType channelTypeOf(CPU::tePixelFormat ePixelFormat) {
    bool const bInt = isInt(ePixelFormat);
    switch (channelSizeBits(ePixelFormat)) {
    case 8:
        return ImageDescriptor::CHANNEL_TYPE_UINT8;
    case 16:
        return bInt ? ImageDescriptor::CHANNEL_TYPE_UINT15_1 : ImageDescriptor::CHANNEL_TYPE_FLOAT16;
    default:
        return bInt ? ImageDescriptor::CHANNEL_TYPE_INT32 : ImageDescriptor::CHANNEL_TYPE_FLOAT32;
    }
}

constexpr TextureFormatRow textureFormats8 = {GPU::PIXEL_FORMAT_LUMINANCE8,
                                              GPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, GPU::PIXEL_FORMAT_RGB8,
                                              GPU::PIXEL_FORMAT_RGBA8};
constexpr TextureFormatRow textureFormats16 = {GPU::PIXEL_FORMAT_LUMINANCE16,
                                               GPU::PIXEL_FORMAT_LUMINANCE_ALPHA16, GPU::PIXEL_FORMAT_RGB16,
                                               GPU::PIXEL_FORMAT_RGBA16};
constexpr TextureFormatRow textureFormats16F = {GPU::PIXEL_FORMAT_LUMINANCE16F,
                                                GPU::PIXEL_FORMAT_LUMINANCE_ALPHA16F,
                                                GPU::PIXEL_FORMAT_RGB16F, GPU::PIXEL_FORMAT_RGBA16F};
constexpr TextureFormatRow textureFormats32F = {GPU::PIXEL_FORMAT_LUMINANCE32F,
                                                GPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F,
                                                GPU::PIXEL_FORMAT_RGB32F, GPU::PIXEL_FORMAT_RGBA32F};

TextureFormatRow const& textureFormatsOf(ImageDescriptor::eChannelType channelType) {
    switch (channelType) {
    case ImageDescriptor::CHANNEL_TYPE_UINT8:
        return textureFormats8;
    case ImageDescriptor::CHANNEL_TYPE_UINT15_1:
    case ImageDescriptor::CHANNEL_TYPE_UINT16:
        return textureFormats16;
    case ImageDescriptor::CHANNEL_TYPE_FLOAT16:
        return textureFormats16F;
    case ImageDescriptor::CHANNEL_TYPE_FLOAT32:
        return textureFormats32F;
    case ImageDescriptor::CHANNEL_TYPE_RESERVED8:
    case ImageDescriptor::CHANNEL_TYPE_INT32:
        break;
    }
    ORVO_FAIL("Not implemented: Data type not supported in ImageGPU::mapDescriptorToImageGPU()");
}

ImageDescriptor::eChannelType channelTypeOf(GPU::tePixelFormat ePixelFormat) {
    switch (ePixelFormat) {
    case GPU::PIXEL_FORMAT_RGBA8:
    case GPU::PIXEL_FORMAT_RGB8:
    case GPU::PIXEL_FORMAT_LUMINANCE8:
    case GPU::PIXEL_FORMAT_LUMINANCE_ALPHA8:
        return ImageDescriptor::CHANNEL_TYPE_UINT8;
    case GPU::PIXEL_FORMAT_LUMINANCE16:
        return ImageDescriptor::CHANNEL_TYPE_UINT16;
    case GPU::PIXEL_FORMAT_RGBA16F:
    case GPU::PIXEL_FORMAT_RGB16F:
    case GPU::PIXEL_FORMAT_LUMINANCE_ALPHA16F:
        return ImageDescriptor::CHANNEL_TYPE_FLOAT16;
    case GPU::PIXEL_FORMAT_RGB32F:
    case GPU::PIXEL_FORMAT_LUMINANCE32F:
    case GPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F:
        return ImageDescriptor::CHANNEL_TYPE_FLOAT32;
    case GPU::PIXEL_FORMAT_RGBA32F:
    case GPU::PIXEL_FORMAT_RGBA16:
    case GPU::PIXEL_FORMAT_RGB16:
    case GPU::PIXEL_FORMAT_LUMINANCE16F:
    case GPU::PIXEL_FORMAT_LUMINANCE_ALPHA16:
    case GPU::PIXEL_FORMAT_UNDEFINED:
        break;
    }
    ORVO_FAIL("Not implemented: ePixelFormat in mapPixelFormatToDescriptorFormat");
}

std::shared_ptr<FilterGraph::ImageBase> wrapPixels(CPU& image) {
    ImageDescriptorCPU const descriptor(ImageAccessor::mapPixelFormatToDescriptorFormat(image.pixelFormat()),
                                        image.pixelExtent());
    auto handle = std::make_shared<FilterGraph::ImageCPU>(descriptor);
    handle->setRect(image.positionExtent());
    handle->setPixelStorage(image.pixels(), 0);
    return handle;
}

std::shared_ptr<FilterGraph::ImageBase> wrapTexture(GPU& image) {
    ImageDescriptorGL const descriptor(ImageAccessor::mapPixelFormatToDescriptorFormat(image.pixelFormat()),
                                       image.pixelExtent());
    auto handle = std::make_shared<FilterGraph::ImageGL>(descriptor);
    handle->setRect(image.positionExtent());
    handle->setPixelStorage(image.texture());
    return handle;
}

} // namespace

CPU::tePixelFormat ImageAccessor::mapDescriptorToCPUPixelFormat(std::size_t nChannel,
                                                                ImageDescriptor::eChannelType channelType) {
    ORVO_CHECK(nChannel >= 1 && nChannel <= nMaximumChannels,
               "Not implemented: pixelFormat in ImageCPU::mapDescriptorToImageCPU()");
    return formatsOf(channelType)[nChannel - 1];
}

ImageDescriptor::Format ImageAccessor::mapPixelFormatToDescriptorFormat(CPU::tePixelFormat ePixelFormat) {
    ORVO_CHECK(ePixelFormat >= CPU::PIXEL_FORMAT_BGR8 && ePixelFormat <= CPU::PIXEL_FORMAT_UNDEFINED,
               "Not implemented: ePixelFormat in mapPixelFormatToDescriptorFormat");
    // The channels are asked for first: that is what refuses the half-float and undefined formats.
    std::size_t const nChannel = nChannels(ePixelFormat);
    return {nChannel, channelTypeOf(ePixelFormat)};
}

GPU::tePixelFormat ImageAccessor::mapDescriptorToGPUPixelFormat(std::size_t nChannel,
                                                                ImageDescriptor::eChannelType channelType) {
    ORVO_CHECK(nChannel >= 1 && nChannel <= nMaximumChannels,
               "Not implemented: pixelFormat in ImageGPU::mapDescriptorToImageGPU()");
    return textureFormatsOf(channelType)[nChannel - 1];
}

ImageDescriptor::Format ImageAccessor::mapPixelFormatToDescriptorFormat(GPU::tePixelFormat ePixelFormat) {
    // The channels are asked for first: that refuses some formats with a message of its own.
    std::size_t const nChannel = nChannels(ePixelFormat);
    return {nChannel, channelTypeOf(ePixelFormat)};
}

std::shared_ptr<FilterGraph::ImageBase> ImageAccessor::wrapImageFlowImage(ORVO::ImageBase* pImage) {
    ORVO_ENFORCE(pImage);
    if (pImage->targetPlatform() == ORVO_TARGET_CPU) {
        if (auto* const pImageCPU = dynamic_cast<CPU*>(pImage)) {
            return wrapPixels(*pImageCPU);
        }
    } else if (pImage->targetPlatform() == ORVO_TARGET_GL) {
        if (auto* const pImageGPU = dynamic_cast<GPU*>(pImage)) {
            return wrapTexture(*pImageGPU);
        }
    }
    ORVO_FAIL("Not implemented: ePixelFormat in wrapImageFlowImage");
}

} // namespace ORVO::FilterGraph::Internal
