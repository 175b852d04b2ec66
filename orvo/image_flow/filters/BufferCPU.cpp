#include "orvo/image_flow/filters/BufferCPU.h"

#include "orvo/image_flow/sources/ImageRegionCopy.h"

namespace ORVO {

BufferCPU::BufferCPU() : BufferCPU("BufferCPU") {}

BufferCPU::BufferCPU(char const* name) : ImageBuffer(name, ORVO_TARGET_CPU) {}

BufferCPU::~BufferCPU() = default;

void BufferCPU::copyToBoundOutput(ImageCPU const& image) {
    ImageRegionCopy const copy(image, *spOutputImage_, oOutputRegionInPixels_);
    copy.copyRows(0, rangeToProcess().items);
    spOutputImage_.reset();
}

void BufferCPU::postProcess() { ImageFilter::postProcess(); }

} // namespace ORVO
