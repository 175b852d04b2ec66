#include "orvo/image_flow/filters/bilateral/GridKernelTables.h"
#include "orvo/image_flow/filters/bilateral/GridKernels.h"

#include "orvo/image_flow/filters/vector/VectorAVX512.h"

#include "orvo/image_flow/filters/vector/VectorMath.h"

#include "orvo/image_flow/filters/lab/LabVector.h"

#include "orvo/image_flow/filters/bilateral/ConversionBody.h"

#include "orvo/image_flow/filters/bilateral/SplatBody.h"

#include "orvo/image_flow/filters/bilateral/SliceBody.h"

#include "orvo/image_flow/filters/bilateral/DirectBody.h"

namespace ORVO::ImageFlow::bilateral {

namespace {
GridKernels const kKernels = {luminanceFromRGBA, labFromRGBA, splat, blur, divide, slice, direct,
                              greyFromLuminance, rgbaFromLab};
}

GridKernels const& gridKernelsAVX512() { return kKernels; }

} // namespace ORVO::ImageFlow::bilateral
