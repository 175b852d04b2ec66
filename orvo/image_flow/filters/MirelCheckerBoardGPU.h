#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/math/Float.h"
#include "orvo/core/utility/ScopedPtr.h"
#include "orvo/data_flow/parameters/IntervalParameter.h"
#include "orvo/data_flow/parameters/Parameter.h"
#include "orvo/image_flow/filters/DisplayFilterGPU.h"

namespace ORVO {

/// Lays a premultiplied image over a checkerboard, to show what is transparent.
///
/// Parameters: "colorA" and "colorB" (float4, default (1, 1, 1, 1) and (0.8, 0.8, 0.8, 1)), "checkerSize"
/// (float2, width and height of a cell in pixels, counted from the corner of the input image, default 16 by
/// 16), "compositeGamma" (float, 0.1 to 9.99, default 1; the bounds inform).
///
/// With a gamma of exactly 1.0:
///
///     rgb = source.rgb + (1 - source.a) * checker.rgb
///     a   = checker.a + (1 - checker.a) * source.a
///
/// With any other, colours are divided by their alpha (0 where that is 0), raised to the power of gamma,
/// mixed in the proportion
///
///     blend = (checker.a - checker.a * source.a) / (checker.a + source.a - checker.a * source.a)
///     rgb   = mix(source.rgb, checker.rgb, blend)
///     a     = source.a + (1 - source.a) * checker.a
///
/// and brought back as a * pow(rgb, 1 / gamma). Negative colours have no power: the driver decides.
///
/// Threads: as DisplayFilterGPU.
class ORVO_API MirelCheckerBoardGPU : public DisplayFilterGPU {
public:
    MirelCheckerBoardGPU();
    ~MirelCheckerBoardGPU() override;

    DataFlow::Parameter<float4>& colorA() const;
    DataFlow::Parameter<float4>& colorB() const;
    DataFlow::Parameter<float2>& checkerSize() const;
    DataFlow::IntervalParameter<float>& compositeGamma();

protected:
    /// For subclasses with parameters of their own, which the filter takes over. Throws "apColorA.get() !=
    /// NULL", "apColorB.get() != NULL", "apCheckerSize.get() != NULL".
    MirelCheckerBoardGPU(ScopedPtr<DataFlow::Parameter<float4>> apColorA,
                         ScopedPtr<DataFlow::Parameter<float4>> apColorB,
                         ScopedPtr<DataFlow::Parameter<float2>> apCheckerSize);

    ShaderProgramProxyOGL& programOfPass() override;
    void setUniforms(OGL::Program& program) override;

    ShaderProgramProxyOGL oGammaProgram_;

private:
    void compilePrograms();
    bool isLinear() const;

    ScopedPtr<DataFlow::Parameter<float4>> apColorA_;
    ScopedPtr<DataFlow::Parameter<float4>> apColorB_;
    ScopedPtr<DataFlow::Parameter<float2>> apCheckerSize_;
    DataFlow::IntervalParameter<float> oCompositeGamma_;
};

} // namespace ORVO
