#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/math/Float.h"
#include "orvo/data_flow/parameters/IntervalParameter.h"
#include "orvo/data_flow/parameters/Parameter.h"
#include "orvo/image_flow/filters/DisplayFilterGPU.h"

namespace ORVO {

/// Brings the luminance of an image with a high dynamic range into the range of a screen, and clamps all
/// channels to 0..1.
///
/// Parameters: "exposureGammaOrHDRCompression" (bool, default true), "exposure" (float, in stops, -20 to 20,
/// default 0), "gamma" (float, 0.1 to 9.99, default 1), "luminanceFactor" (float3, 0 to 1 each, default
/// (0.3, 0.59, 0.11)). The bounds inform.
///
///     luminance = |dot(rgb, luminanceFactor)|
///     scaled    = pow(luminance * 2^exposure, gamma)       with exposureGammaOrHDRCompression
///               = luminance / (1 + luminance)              without
///     rgb       = rgb * scaled / luminance
///
/// A pixel without luminance divides 0 by 0: what the clamp makes of that is the driver's.
///
/// Threads: as DisplayFilterGPU.
class ORVO_API MirelToneMappingGPU : public DisplayFilterGPU {
public:
    MirelToneMappingGPU();
    ~MirelToneMappingGPU() override;

    DataFlow::Parameter<bool>& exposureGammaOrHDRCompression();
    DataFlow::IntervalParameter<float>& exposure();
    DataFlow::IntervalParameter<float>& gamma();
    DataFlow::IntervalParameter<float3>& luminanceFactor();

protected:
    void setUniforms(OGL::Program& program) override;

private:
    void compilePrograms();

    DataFlow::Parameter<bool> oExposureGammaOrHDRCompression_;
    DataFlow::IntervalParameter<float> oExposure_;
    DataFlow::IntervalParameter<float> oGamma_;
    DataFlow::IntervalParameter<float3> oLuminanceFactor_;
};

} // namespace ORVO
