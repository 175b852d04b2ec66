#include "orvo/filter_graph/impl/ImageDescriptorCPU.h"

namespace ORVO::FilterGraph {

ImageDescriptorCPU::ImageDescriptorCPU(Format const& format, PixelExtentInWorldSpace const& pixelExtent)
    : ImageDescriptor(format, pixelExtent, ORVO_TARGET_CPU) {}

ImageDescriptorCPU::~ImageDescriptorCPU() = default;

} // namespace ORVO::FilterGraph
