#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_flow/nodes/ImageFilter.h"

namespace ORVO {

/// Converts a CPU image in the SIMD-optimised layout into the format of the output: the bound image's, or
/// that of precision hint and channel count, row by row: input "input", output "output". Scales: 8-bit
/// integers 0..255 and 16-bit integers 0..32768 for 0.0 to 1.0. The channels and their order pass through.
///
/// Throws `InternalException` with the texts of `ImageFilter` and of `ImageRuntime`'s conversions.
///
/// Threads: as `ImageFilter`; slices touch only their own rows.
class ORVO_API ConvertFromSIMDOptimized : public ImageFilter {
public:
    /// An unconnected node with the default precision hint.
    ConvertFromSIMDOptimized();
    ~ConvertFromSIMDOptimized() override;

    /// As the base, and fixes the pixel columns of the work.
    void allocateOutputImage() override;
    /// As the base. Throws "pOutputImage_" where there is no output image then.
    void prepareForRender() override;
    /// Rows `begin` to `end` (exclusive), counted from the top of the output region. Any
    /// thread of the frame, each its own rows.
    void processSlice(std::size_t begin, std::size_t end) override;

private:
    int nBeginX_;
    int nEndX_;
    ImageCPU* pOutputImage_;
    DataFlow::ConstInput<ImageCPU> oInput_;
    DataFlow::ConstOutput<ImageCPU> oOutput_;
};

} // namespace ORVO
