#include "orvo/filter_graph/impl/ImageDescriptor.h"

namespace ORVO::FilterGraph {

namespace {

std::uint32_t bytesPerChannel(ImageDescriptor::eChannelType channelType) {
    switch (channelType) {
    case ImageDescriptor::CHANNEL_TYPE_UINT8:
    case ImageDescriptor::CHANNEL_TYPE_RESERVED8:
        return 1;
    case ImageDescriptor::CHANNEL_TYPE_UINT15_1:
    case ImageDescriptor::CHANNEL_TYPE_UINT16:
    case ImageDescriptor::CHANNEL_TYPE_FLOAT16:
        return 2;
    case ImageDescriptor::CHANNEL_TYPE_INT32:
    case ImageDescriptor::CHANNEL_TYPE_FLOAT32:
        return 4;
    }
    return 0;
}

} // namespace

ImageDescriptor::ImageDescriptor(Format const& format, PixelExtentInWorldSpace const& pixelExtent,
                                 TargetPlatform type)
    : oFormat_(format),
      eType_(type),
      oPixelExtent_(pixelExtent),
      nBytesPerChannel_(bytesPerChannel(format.channelType)) {}

ImageDescriptor::~ImageDescriptor() = default;

bool ImageDescriptor::equals(ImageDescriptor const& other) const {
    return oFormat_.nChannel == other.oFormat_.nChannel &&
           oFormat_.channelType == other.oFormat_.channelType && eType_ == other.eType_ &&
           oPixelExtent_ == other.oPixelExtent_;
}

} // namespace ORVO::FilterGraph
