#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/math/Float.h"

/// The transform between sRGB and the scaled Lab space, pixel by pixel in single precision: the definition of
/// the results, which LabKernels computes row by row.
///
/// The scaled Lab space carries L, a and b divided by 100: L runs 0 .. 1, a and b about -1 .. 1. Formulas:
/// sRGB of IEC 61966-2-1 with D65 white (0.95047, 1, 1.08883), CIE L*a*b* of 1976, with rounded constants. A
/// negative component is transformed by its absolute value and gets its sign back after each step. Alpha
/// passes through all of them.
///
/// Threads: free of state; any thread.
namespace ORVO::ImageFlow::lab {

/// sRGB (r, g, b, alpha) to (X, Y, Z, alpha).
ORVO_API float4 sRGBToXYZ(float4 const& pixel);

/// (X, Y, Z, alpha) to (L, a, b, alpha).
ORVO_API float4 XYZToLab(float4 const& pixel);

/// (L, a, b, alpha) to (X, Y, Z, alpha).
ORVO_API float4 LabToXYZ(float4 const& pixel);

/// (X, Y, Z, alpha) to sRGB (r, g, b, alpha).
ORVO_API float4 XYZTosRGB(float4 const& pixel);

/// sRGBToXYZ() and XYZToLab().
ORVO_API float4 sRGBToLab(float4 const& pixel);

/// LabToXYZ() and XYZTosRGB().
ORVO_API float4 LabTosRGB(float4 const& pixel);

} // namespace ORVO::ImageFlow::lab
