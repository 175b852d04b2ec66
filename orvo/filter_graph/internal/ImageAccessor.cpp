#include "orvo/filter_graph/internal/ImageAccessor.h"

#include "orvo/core/Check.h"
#include "orvo/filter_graph/impl/ImageCPU.h"
#include "orvo/filter_graph/impl/ImageDescriptorCPU.h"

#include <memory>

namespace ORVO::FilterGraph::Internal {

namespace {

using CPU = ORVO::ImageCPU;

constexpr std::size_t nMaximumChannels = 4;

/// The formats of one channel type by the number of channels.
using FormatRow = CPU::tePixelFormat[nMaximumChannels];

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

std::shared_ptr<FilterGraph::ImageBase> ImageAccessor::wrapImageFlowImage(ORVO::ImageBase* pImage) {
    ORVO_ENFORCE(pImage);
    auto* pImageCPU = dynamic_cast<CPU*>(pImage);
    ORVO_CHECK(pImage->targetPlatform() == ORVO_TARGET_CPU && pImageCPU != nullptr,
               "Not implemented: ePixelFormat in wrapImageFlowImage");

    ImageDescriptorCPU const descriptor(mapPixelFormatToDescriptorFormat(pImageCPU->pixelFormat()),
                                        pImage->pixelExtent());
    auto handle = std::make_shared<FilterGraph::ImageCPU>(descriptor);
    handle->setRect(pImage->positionExtent());
    handle->setPixelStorage(pImageCPU->pixels(), 0);
    return handle;
}

} // namespace ORVO::FilterGraph::Internal
