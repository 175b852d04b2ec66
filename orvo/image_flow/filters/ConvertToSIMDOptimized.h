#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_flow/nodes/ImageFilter.h"

namespace ORVO {

/// Converts any CPU image of 8-bit, 16-bit integer or 32-bit float channels into the SIMD-optimised layout,
/// row by row: input "input", output "output". Scales: 8-bit integers 0..255 and 16-bit integers 0..32768 for
/// 0.0 to 1.0. The channels and their order pass through.
///
/// Columns of a new image that the input does not have stay transparent black. The input's rows must be those
/// of the compute region: a conversion that would leave the input or the output fails.
///
/// Throws `InternalException` with the texts of `ImageFilter` and of `ImageRuntime`'s conversions.
///
/// Threads: as `ImageFilter`; slices touch only their own rows.
class ORVO_API ConvertToSIMDOptimized : public ImageFilter {
public:
    /// An unconnected node with the default precision hint.
    ConvertToSIMDOptimized();
    ~ConvertToSIMDOptimized() override;

    /// As the base, but a new image is always 32-bit float in the SIMD-optimised layout and starts
    /// transparent black; input 0's format, where formats come from the source, or else that of hint and
    /// channel count gives its channel count alone. Throws as the base, and "Pixel format not supported by
    /// ORVO in CPU mode" for half formats. After a failure the node holds no image.
    void allocateOutputImage() override;
    /// Rows `begin` to `end` (exclusive), counted from the top of the output region. Any
    /// thread of the frame, each its own rows.
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
