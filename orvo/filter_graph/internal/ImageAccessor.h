#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/impl/ImageBase.h"
#include "orvo/filter_graph/impl/ImageDescriptor.h"
#include "orvo/image_runtime/images/ImageCPU.h"
#include "orvo/image_runtime/images/ImageGPU.h"

#include <cstddef>
#include <memory>

namespace ORVO::FilterGraph::Internal {

/// Translates between client images and the images of the runtime: descriptors, pixel formats, and the images
/// themselves.
///
/// Threads: no state of its own; as the images that it is given.
class ORVO_API ImageAccessor {
public:
    ImageAccessor() = delete;

    /// The runtime image that a client image wraps, as a `T`; null if there is no client image, if it has no
    /// storage, or if what it wraps is no `T`. Still owned by the client image.
    template <class T>
    static T* getImpl(FilterGraph::ImageBase const* pImage) {
        return pImage ? dynamic_cast<T*>(pImage->wrappedImage()) : nullptr;
    }

    /// The pixel format of images in host memory with these channels. Formats in BGR order are never the
    /// answer.
    /// @throws InternalException with a text that begins with "Not implemented: " if there is none.
    static ORVO::ImageCPU::tePixelFormat
    mapDescriptorToCPUPixelFormat(std::size_t nChannel, ImageDescriptor::eChannelType channelType);

    /// The pixel format of textures with these channels.
    /// @throws InternalException with a text that begins with "Not implemented: " if there is none.
    static ORVO::ImageGPU::tePixelFormat
    mapDescriptorToGPUPixelFormat(std::size_t nChannel, ImageDescriptor::eChannelType channelType);

    /// Channels and channel type of a pixel format. 16-bit integers are `CHANNEL_TYPE_UINT15_1`.
    /// @throws InternalException "Pixel format not supported by ORVO in CPU mode" for half-float and
    /// undefined formats, "Not implemented: ePixelFormat in mapPixelFormatToDescriptorFormat" for what is no
    /// format.
    static ImageDescriptor::Format
    mapPixelFormatToDescriptorFormat(ORVO::ImageCPU::tePixelFormat ePixelFormat);

    /// Channels and channel type of a texture's pixel format. 16-bit integers are `CHANNEL_TYPE_UINT16`.
    /// @throws InternalException "Pixel format not supported by ORVO in GPU mode" for `PIXEL_FORMAT_RGBA16`,
    /// `PIXEL_FORMAT_RGB16`, `PIXEL_FORMAT_LUMINANCE16F`, `PIXEL_FORMAT_LUMINANCE_ALPHA16` and undefined
    /// formats, "Not implemented: ePixelFormat in mapPixelFormatToDescriptorFormat" for
    /// `PIXEL_FORMAT_RGBA32F`.
    static ImageDescriptor::Format
    mapPixelFormatToDescriptorFormat(ORVO::ImageGPU::tePixelFormat ePixelFormat);

    /// A new client image around the pixels, or the texture, of a runtime image, which must outlive it. An
    /// image in host memory must have no padding.
    /// @throws InternalException "Enforce pImage != NULL" for null, "Not implemented: ePixelFormat in
    /// wrapImageFlowImage" for an image on another target than these two, and as the mapping of the format.
    static std::shared_ptr<FilterGraph::ImageBase> wrapImageFlowImage(ORVO::ImageBase* pImage);
};

} // namespace ORVO::FilterGraph::Internal
