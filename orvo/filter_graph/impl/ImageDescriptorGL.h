#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/impl/ImageDescriptor.h"

namespace ORVO::FilterGraph {

/// Describes an OpenGL texture (target `ORVO_TARGET_GL`).
///
/// Threads: as `ImageDescriptor`.
class ORVO_API ImageDescriptorGL : public ImageDescriptor {
public:
    /// Accepts every format; one that images of this kind cannot have is refused when storage is given to the
    /// image.
    ImageDescriptorGL(Format const& format, PixelExtentInWorldSpace const& pixelExtent);
    ~ImageDescriptorGL() override;
    ImageDescriptorGL(ImageDescriptorGL const&) = default;
    ImageDescriptorGL& operator=(ImageDescriptorGL const&) = default;
};

} // namespace ORVO::FilterGraph
