#pragma once

#include "orvo/core/Export.h"
#include "orvo/data_flow/connectors/Inputs.h"
#include "orvo/data_flow/connectors/Outputs.h"
#include "orvo/image_flow/nodes/ImageFilter.h"

#include <cstddef>

namespace ORVO {

/// Converts an image from the scaled Lab space to sRGB (see lab/LabTransform.h): input "InputImage", output
/// "OutputImage", both on the CPU. Alpha passes; nothing is premultiplied.
///
/// Results are clamped to 0..1 in every format, float included, and truncated in 8-bit formats. Values
/// outside 0..1 are lost: values stand as stored, without an offset into range. Input and output are matched
/// by their pixel-space positions; where the output lies outside the input, it converts transparent black.
///
/// Threads: as ImageFilter; processSlice() runs on several threads at once, for different rows.
class ORVO_API LABToRGBCPU : public ImageFilter {
public:
    LABToRGBCPU();
    ~LABToRGBCPU() override;

    /// Rows begin up to, but not including, end of the output.
    /// @throws InternalException "Enforce spData_.get() != NULL" without an input or output image, "Invalid
    /// input image
    ///         type" for a format that ImageCPUReadAccessor does not serve.
    void processSlice(std::size_t begin, std::size_t end) override;

private:
    DataFlow::ConstInput<ImageCPU> oInputImage_;
    DataFlow::ConstOutput<ImageCPU> oOutputImage_;
};

} // namespace ORVO
