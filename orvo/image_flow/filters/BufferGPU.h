#pragma once

#include "orvo/image_flow/filters/ImageBuffer.h"

namespace ORVO {

/// Keeps the last image in a texture that it passed, and can emit it again: see ImageBuffer.
///
/// The image is shared with the consumer, so that one that wants an image of its own fails, as does an
/// ImageGPUOutput.
///
/// Throws beside what ImageBuffer throws, on a bound output, as ImageGPUInput.
///
/// Threads: as ImageBuffer. Runs into a bound output, and the death of images, need a current context that
/// shares with one of the image runtime's.
class ORVO_API BufferGPU : public ImageBuffer<ImageGPU> {
public:
    /// Node name "BufferGPU".
    BufferGPU();
    ~BufferGPU() override;

    /// True.
    bool willRunInHardware() override;

protected:
    void copyToBoundOutput(ImageGPU const& image) override;
};

} // namespace ORVO
