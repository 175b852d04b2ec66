#pragma once

#include "orvo/core/Export.h"
#include "orvo/data_flow/connectors/Inputs.h"
#include "orvo/data_flow/connectors/Outputs.h"
#include "orvo/image_flow/nodes/ImageFilter.h"
#include "orvo/image_runtime/images/ImageGPU.h"

namespace ORVO {

/// Hands one image in a texture to two consumers. Input "InputImage"; two outputs, both named "OutputImageA":
/// the true output and a clone of it. Both have to be connected.
///
/// Nothing is copied: consumers that only read share the texture. A consumer that wants an image of its own
/// fails, since images in textures are not copied, as does an ImageGPUOutput. Where an image is bound to the
/// outputs, the compute region is copied into it.
///
/// Throws `InternalException` "Enforce pImage != NULL" without an input image; with a bound image
/// as ImageGPUInput.
///
/// Threads: as ImageFilter; a run into a bound output needs a current context.
class ORVO_API ConstTeeJointGPU : public ImageFilter {
public:
    ConstTeeJointGPU();
    ~ConstTeeJointGPU() override;

    /// True.
    bool willRunInHardware() override;
    /// The region as it is.
    PositionExtentInWorldSpace needed(PositionExtentInWorldSpace const& outputRegion, std::string inputName,
                                      RegionMap const& inputDODs) override;
    /// The region as it is.
    PositionExtentInWorldSpace changed(PositionExtentInWorldSpace const& inputRegion, std::string inputName,
                                       RegionMap const& inputDODs) override;

protected:
    void internalProcess() override;

private:
    DataFlow::ConstInput<ImageGPU> oInputImage_;
    DataFlow::ConstOutput<ImageGPU> oOutputImageA_;
    DataFlow::OutputConnector* pOutputImageB_;
};

} // namespace ORVO
