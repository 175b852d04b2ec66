#pragma once

#include "orvo/core/Export.h"
#include "orvo/data_flow/connectors/Inputs.h"
#include "orvo/data_flow/connectors/Outputs.h"
#include "orvo/data_flow/parameters/IntervalParameter.h"
#include "orvo/data_flow/parameters/Parameter.h"
#include "orvo/image_flow/nodes/ImageFilter.h"

#include <cstddef>
#include <string>

namespace ORVO {

/// The direct bilateral filter, pixel by pixel: input "InputImage", output "OutputImage", both on the CPU.
///
/// Parameters: "spatialSigma" (float, in pixels, 0 to 100, default 0.1), "rangeSigma" (float, in units of
/// intensity, 0 to 1, default 0.1), "colorize" (bool, default false: grey result). The window reaches
/// trunc(ceil(2.146 spatialSigma)) / 2 pixels from its centre, and never further than 4096. The alpha of the
/// result is 0.
///
/// Results are those of the formulas in single precision; with vector instructions (see
/// ImageRuntime::activeInstructionSet()) they differ from those by at most 1e-6 times the largest neighbour,
/// before they are clamped and truncated to the format of the output. Outside the input, where all weights
/// may be tiny, they agree less closely.
///
/// Neighbours: a coordinate that is negative, or not below the width (height), counts as the width (height)
/// itself, and the pixel is then found by y * width + x among the pixels of the image in row order: beyond
/// the right edge stands the first pixel of the next row, and all that lies past the last pixel reads the
/// last pixel. Padding is never read. Input and output are matched by their pixel-space positions; where the
/// output lies outside the input its centre pixel is transparent black. An input without pixels reads as
/// transparent black throughout.
///
/// Threads: as ImageFilter; processSlice() runs on several threads at once, for different rows.
class ORVO_API SimpleBilateralFilterCPU : public ImageFilter {
public:
    SimpleBilateralFilterCPU();
    ~SimpleBilateralFilterCPU() override;

    DataFlow::IntervalParameter<float>& spatialSigma();
    DataFlow::IntervalParameter<float>& rangeSigma();
    DataFlow::Parameter<bool>& colorize();

    /// The region outset by spatialSigma in each direction; a sigma of NaN outsets by 0.
    PositionExtentInWorldSpace needed(PositionExtentInWorldSpace const& outputRegion, std::string inputName,
                                      RegionMap const& inputDODs) override;
    /// As needed().
    PositionExtentInWorldSpace changed(PositionExtentInWorldSpace const& inputRegion, std::string inputName,
                                       RegionMap const& inputDODs) override;

    /// Rows begin up to, but not including, end of the output.
    /// @throws InternalException "Enforce spData_.get() != NULL" without an input or output image, "Invalid
    /// input image
    ///         type" for a format that ImageCPUReadAccessor does not serve.
    void processSlice(std::size_t begin, std::size_t end) override;

private:
    DataFlow::ConstInput<ImageCPU> oInputImage_;
    DataFlow::ConstOutput<ImageCPU> oOutputImage_;
    DataFlow::IntervalParameter<float> oSpatialSigma_;
    DataFlow::IntervalParameter<float> oRangeSigma_;
    DataFlow::Parameter<bool> oColorize_;
};

} // namespace ORVO
