#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/impl/ImageDescriptor.h"

namespace ORVO::FilterGraph {

/// Describes an image in host memory (target `ORVO_TARGET_CPU`).
///
/// Threads: as `ImageDescriptor`.
class ORVO_API ImageDescriptorCPU : public ImageDescriptor {
public:
    /// Accepts every format; one that images of this kind cannot have is refused when storage is given to the
    /// image.
    ImageDescriptorCPU(Format const& format, PixelExtentInWorldSpace const& pixelExtent);
    ~ImageDescriptorCPU() override;
    ImageDescriptorCPU(ImageDescriptorCPU const&) = default;
    ImageDescriptorCPU& operator=(ImageDescriptorCPU const&) = default;
};

} // namespace ORVO::FilterGraph
