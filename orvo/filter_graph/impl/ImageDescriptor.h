#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/TargetPlatform.h"
#include "orvo/core/spaces/PixelExtentInWorldSpace.h"

#include <cstddef>
#include <cstdint>

namespace ORVO::FilterGraph {

/// Says what an image is without holding one: channels, channel type, where it lives, and the world size of
/// one of its pixels. Made as an `ImageDescriptorCPU` or an `ImageDescriptorGL`.
///
/// Threads: a plain value; any thread, one at a time for each object.
class ORVO_API ImageDescriptor {
public:
    enum eChannelType : std::int32_t {
        CHANNEL_TYPE_UINT8 = 0,     ///< 8-bit unsigned
        CHANNEL_TYPE_RESERVED8 = 1, ///< a one-byte type that no image accepts
        CHANNEL_TYPE_UINT15_1 =
            2, ///< 16-bit unsigned, white at 32768: the scale of 16-bit images in host memory
        CHANNEL_TYPE_UINT16 = 3,  ///< 16-bit unsigned, white at 65535: the scale of 16-bit textures
        CHANNEL_TYPE_FLOAT16 = 4, ///< half float; textures only
        CHANNEL_TYPE_INT32 = 5,   ///< 32-bit integer; no image accepts it
        CHANNEL_TYPE_FLOAT32 = 6, ///< 32-bit float
    };

    struct Format {
        std::size_t nChannel;     ///< 1 grey, 2 grey and alpha, 3 RGB, 4 RGBA, in this order in memory
        eChannelType channelType; ///< how one channel is stored
    };

    virtual ~ImageDescriptor();
    ImageDescriptor(ImageDescriptor const&) = default;
    ImageDescriptor& operator=(ImageDescriptor const&) = default;

    Format const& format() const { return oFormat_; }

    /// Where the image lives.
    TargetPlatform type() const { return eType_; }

    /// The world size of one pixel.
    PixelExtentInWorldSpace const& pixelExtent() const { return oPixelExtent_; }

    /// 1, 2 or 4; 0 for a channel type that does not exist.
    std::uint32_t numBytesPerChannel() const { return nBytesPerChannel_; }

    std::size_t numBytesPerPixel() const { return nBytesPerChannel_ * oFormat_.nChannel; }

    /// Whether channel count, channel type, target and pixel extent are equal.
    bool equals(ImageDescriptor const& other) const;

protected:
    ImageDescriptor(Format const& format, PixelExtentInWorldSpace const& pixelExtent, TargetPlatform type);

private:
    Format oFormat_;
    TargetPlatform eType_;
    PixelExtentInWorldSpace oPixelExtent_;
    std::uint32_t nBytesPerChannel_;
};

} // namespace ORVO::FilterGraph
