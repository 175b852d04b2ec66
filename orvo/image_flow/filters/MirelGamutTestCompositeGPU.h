#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/math/Float.h"
#include "orvo/data_flow/connectors/Inputs.h"
#include "orvo/data_flow/parameters/IntervalParameter.h"
#include "orvo/image_flow/filters/DisplayFilterGPU.h"

namespace ORVO {

/// Marks with a colour where an image leaves a gamut: a second image input, "GamutTestResultInputImage",
/// holds 1 where the colour is inside and 0 where it is outside.
///
/// Parameters: "color" (float4, default (0, 0, 0, 0)) and "opacity" (float, default 0). Their bounds mean
/// nothing.
///
///     result = source * g + (1 - g) * (source * (1 - opacity) + color * opacity)
///
/// for all four channels alike, g being the second image's. Both images cover the rectangle that is drawn.
/// Each pixel is read with that at the same place in the world, wherever the images begin and however large
/// their textures are: what filters make has textures of the pool, with room to spare. The texture of the
/// second one is bound to unit 1.
///
/// Threads: as DisplayFilterGPU.
class ORVO_API MirelGamutTestCompositeGPU : public DisplayFilterGPU {
public:
    MirelGamutTestCompositeGPU();
    ~MirelGamutTestCompositeGPU() override;

    DataFlow::IntervalParameter<float4>& color();
    DataFlow::IntervalParameter<float>& opacity();

protected:
    void bindInputs() override;
    void setUniforms(OGL::Program& program) override;

private:
    void compilePrograms();

    DataFlow::ConstInput<ImageGPU> oGamutTestResult_;
    DataFlow::IntervalParameter<float4> oColor_;
    DataFlow::IntervalParameter<float> oOpacity_;
};

} // namespace ORVO
