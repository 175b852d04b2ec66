#pragma once

#include "orvo/image_flow/filters/ImageBuffer.h"

namespace ORVO {

/// Keeps the last image in host memory that it passed, and can emit it again: see ImageBuffer.
///
/// Throws beside what ImageBuffer throws, on a bound output, as ImageCPUInput.
///
/// Threads: as ImageBuffer.
class ORVO_API BufferCPU : public ImageBuffer<ImageCPU> {
public:
    /// Node name "BufferCPU".
    BufferCPU();
    explicit BufferCPU(char const* name);
    ~BufferCPU() override;

protected:
    void postProcess() override;
    void copyToBoundOutput(ImageCPU const& image) override;
};

} // namespace ORVO
