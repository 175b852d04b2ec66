#include "orvo/image_flow/filters/bilateral/SimpleKernelTables.h"
#include "orvo/image_flow/filters/bilateral/SimpleKernels.h"

#include "orvo/image_flow/filters/vector/VectorSSE2.h"

#include "orvo/image_flow/filters/vector/VectorMath.h"

#include "orvo/image_flow/filters/bilateral/SimpleBody.h"

namespace ORVO::ImageFlow::bilateral {

void simpleRowSSE2(SimpleJob const& job) { simpleRow(job); }

} // namespace ORVO::ImageFlow::bilateral
