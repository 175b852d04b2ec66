#include "orvo/image_flow/filters/BufferGPU.h"

#include "orvo/image_flow/sources/TextureRegionCopy.h"

namespace ORVO {

BufferGPU::BufferGPU() : ImageBuffer("BufferGPU", ORVO_TARGET_GL) {}

BufferGPU::~BufferGPU() = default;

bool BufferGPU::willRunInHardware() { return true; }

void BufferGPU::copyToBoundOutput(ImageGPU const& image) {
    copyTextureRegion(image, *boundOutputImageGPU(), oOutputRegionInPixels_);
}

} // namespace ORVO
