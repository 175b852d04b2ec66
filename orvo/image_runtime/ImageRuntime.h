#pragma once

/// All public headers of the image runtime.

#include "orvo/image_runtime/BlankSIMDOptimizedImageCPU.h"
#include "orvo/image_runtime/ConvertSIMDOptimizedImageCPU.h"
#include "orvo/image_runtime/ImageRuntimeLibrary.h"
#include "orvo/image_runtime/VideoMemoryConfiguration.h"
#include "orvo/image_runtime/VideoMemoryListener.h"
#include "orvo/image_runtime/images/ImageAccessorBase.h"
#include "orvo/image_runtime/images/ImageBase.h"
#include "orvo/image_runtime/images/ImageCPU.h"
#include "orvo/image_runtime/images/ImageCPUReadAccessor.h"
#include "orvo/image_runtime/images/ImageCPUWriteAccessor.h"
#include "orvo/image_runtime/images/ImageReadAccessor.h"
#include "orvo/image_runtime/images/ImageWriteAccessor.h"
#include "orvo/image_runtime/images/PixelStructures.h"
#include "orvo/image_runtime/kernels/InstructionSet.h"
#include "orvo/image_runtime/kernels/RowKernels.h"
#include "orvo/image_runtime/kernels/Rows.h"
