#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/math/Float.h"
#include "orvo/data_flow/connectors/Inputs.h"
#include "orvo/data_flow/connectors/Outputs.h"
#include "orvo/data_flow/parameters/IntervalParameter.h"
#include "orvo/data_flow/parameters/Parameter.h"
#include "orvo/image_flow/filters/FastBilateralCPUFilter.h"
#include "orvo/image_flow/nodes/ImageFilter.h"

#include <cstddef>
#include <functional>
#include <string>

namespace ORVO {

/// The image node around FastBilateralCPUFilter: input "InputImage", output "OutputImage", both on the CPU.
///
/// Parameters: "spatialSigma" (float2, in pixels, 0.1 to 100, default 10), "rangeSigma" (float, in units of
/// intensity, 0.01 to 1, default 0.15), "colorize" (bool, default false). The bounds inform; a value beyond
/// them runs too.
///
/// Rows are worked on in slices of the controller, phase by phase; a frame that is cancelled between them
/// leaves the output empty.
///
/// Threads: as ImageFilter.
class ORVO_API FastBilateralFilterCPUNode : public ImageFilter {
public:
    FastBilateralFilterCPUNode();
    ~FastBilateralFilterCPUNode() override;

    DataFlow::IntervalParameter<float2>& spatialSigma();
    DataFlow::IntervalParameter<float>& rangeSigma();
    DataFlow::Parameter<bool>& colorize();

    /// The region outset by ceil(2.146 spatialSigma) in each direction; a sigma of NaN, which smooths
    /// nothing, outsets by 0.
    PositionExtentInWorldSpace needed(PositionExtentInWorldSpace const& outputRegion, std::string inputName,
                                      RegionMap const& inputDODs) override;
    /// As needed().
    PositionExtentInWorldSpace changed(PositionExtentInWorldSpace const& inputRegion, std::string inputName,
                                       RegionMap const& inputDODs) override;

    /// While a phase runs its bands, else what ImageFilter says.
    BlockedRange rangeToProcess() override;
    /// Runs bands of the phase in progress. @throws InternalException "0" as Node does while there is none.
    void processSlice(std::size_t begin, std::size_t end) override;

protected:
    /// @throws InternalException "Enforce spData_.get() != NULL" without an input image, "Enforce pOutput !=
    /// NULL" without an output image, and what FastBilateralCPUFilter::applyFilter() throws.
    void internalProcess() override;

private:
    class SliceRunner;
    struct Phase {
        std::size_t nUnits;
        std::size_t nBands;
        std::function<void(std::size_t, std::size_t)> const* pBody;
    };

    DataFlow::ConstInput<ImageCPU> oInputImage_;
    DataFlow::ConstOutput<ImageCPU> oOutputImage_;
    DataFlow::IntervalParameter<float2> oSpatialSigma_;
    DataFlow::IntervalParameter<float> oRangeSigma_;
    DataFlow::Parameter<bool> oColorize_;
    FastBilateralCPUFilter oFilter_;
    /// The phase whose bands the controller is slicing; null between phases.
    Phase const* pPhase_;
};

} // namespace ORVO
