#pragma once

#include "orvo/core/Export.h"
#include "orvo/data_flow/connectors/Inputs.h"
#include "orvo/data_flow/connectors/Outputs.h"
#include "orvo/data_flow/parameters/Parameter.h"
#include "orvo/image_flow/nodes/ImageFilter.h"
#include "orvo/image_runtime/images/ImageCPU.h"

#include <cstddef>
#include <memory>

namespace ORVO {

struct _t_Vantle_PackingSpec;

/// A colour transform of the colour engine on the CPU: input "InputImage", output "OutputImage", both on the
/// CPU, in 8-bit or 16-bit integers (0..255, 0..32768), RGB or luminance, with or without alpha. Input and
/// output may differ in format: the engine converts.
///
/// The parameter "Transform" holds the `VantleTransform*`, which stays the host's and must live as long as
/// frames run; "Vantle Options" the value that the engine gets as its options. What the engine answers is not
/// looked at. Where there is no engine no colour is written.
///
/// Alpha is not transformed. From an input with alpha it is copied, byte for byte, into the last channel of
/// the output, provided that both have the same bytes a channel: an output without alpha gets its last colour
/// sample overwritten by it. Into an output of other bytes nothing is copied: its alpha is not written.
///
/// Input and output are matched by their pixel-space positions; where the output lies outside the input it
/// becomes transparent black.
///
/// Threads: as ImageFilter; processSlice() runs on several threads at once, for different rows, and all of
/// them share the transform.
class ORVO_API VantleFilterCPU : public ImageFilter {
public:
    /// A filter without a transform.
    VantleFilterCPU();
    ~VantleFilterCPU() override;

    /// The parameter "Transform". Throws InternalException "Enforce vantleTransform_.get() != NULL".
    std::shared_ptr<DataFlow::Parameter<void*>> transform() const;
    /// The parameter "Vantle Options". Throws InternalException "Enforce vantleOptions_.get() != NULL".
    std::shared_ptr<DataFlow::Parameter<void*>> options() const;

    /// Rows first up to, but not including, last of the output.
    /// @throws InternalException "Enforce spData_.get() != NULL" without an input or output image, "Invalid
    ///         input image type" for any other format of either.
    void processSlice(std::size_t first, std::size_t last) override;

protected:
    std::shared_ptr<DataFlow::Parameter<void*>> vantleTransform_;
    std::shared_ptr<DataFlow::Parameter<void*>> vantleOptions_;

private:
    /// Space, channels and bytes of a format, also as numbers; the rest of the record becomes 0.
    static void getImageInfo(ImageCPU::tePixelFormat format, unsigned& channels, unsigned& bytesPerChannel,
                             _t_Vantle_PackingSpec& record);
    DataFlow::ConstInput<ImageCPU> oInputImage_;
    DataFlow::ConstOutput<ImageCPU> oOutputImage_;
};

} // namespace ORVO
