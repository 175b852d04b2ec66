#include "orvo/image_flow/filters/lab/LabKernelTables.h"
#include "orvo/image_flow/filters/lab/LabKernels.h"

#include "orvo/image_flow/filters/vector/VectorAVX2.h"

#include "orvo/image_flow/filters/vector/VectorMath.h"

#include "orvo/image_flow/filters/lab/LabVector.h"

#include "orvo/image_flow/filters/lab/LabKernelBody.h"

namespace ORVO::ImageFlow::lab {

namespace {
LabKernels const kKernels = {transformLabRow<LabVector::toLab>, transformLabRow<LabVector::toRGB>};
}

LabKernels const& labKernelsAVX2() { return kKernels; }

} // namespace ORVO::ImageFlow::lab
