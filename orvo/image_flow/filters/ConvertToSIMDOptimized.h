#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_flow/nodes/ImageFilter.h"

namespace ORVO {

/// Converts any CPU image of 8-bit, 16-bit integer or 32-bit float channels into the SIMD-optimised layout,
/// row by row: input "input", output "output". Scales: 8-bit integers 0..255 and 16-bit integers 0..32768 for
/// 0.0 to 1.0. The channels and their order pass through.
///
/// Throws `InternalException` with the texts of `ImageFilter` and of `ImageRuntime`'s conversions.
///
/// Threads: as `ImageFilter`; slices touch only their own rows.
class ORVO_API ConvertToSIMDOptimized : public ImageFilter {
public:
    ConvertToSIMDOptimized();
    ~ConvertToSIMDOptimized() override;

    /// As the base, but a new image is always 32-bit float in the SIMD-optimised layout and starts
    /// transparent black; the format that the base would choose gives its channel count alone.
    void allocateOutputImage() override;
    /// Rows `begin` to `end` (exclusive), counted from the top of the output region.
    void processSlice(std::size_t begin, std::size_t end) override;

private:
    void createOutputImage();
    /// Makes the storage beyond the pixels transparent black; the pixels will all be written.
    void clearPadding();

    int nBeginX_;
    int nEndX_;
    DataFlow::ConstInput<ImageCPU> oInput_;
    DataFlow::ConstOutput<ImageCPU> oOutput_;
};

} // namespace ORVO
