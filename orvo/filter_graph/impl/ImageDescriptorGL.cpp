#include "orvo/filter_graph/impl/ImageDescriptorGL.h"

namespace ORVO::FilterGraph {

ImageDescriptorGL::ImageDescriptorGL(Format const& format, PixelExtentInWorldSpace const& pixelExtent)
    : ImageDescriptor(format, pixelExtent, ORVO_TARGET_GL) {}

ImageDescriptorGL::~ImageDescriptorGL() = default;

} // namespace ORVO::FilterGraph
