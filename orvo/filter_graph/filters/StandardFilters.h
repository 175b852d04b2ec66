#pragma once

#include "orvo/core/Export.h"

namespace ORVO::FilterGraph {

/// Registers the filters that come with the library with FilterFactory::Instance(), so that a host creates
/// them by name:
///
/// | name | namespace, vendor | what it does |
/// |---|---|---|
/// | "FastBilateralBlur" | "Motion Loft", "Norvane Works" | the bilateral filter that suits the processing
/// mode | | "FastBilateralFilter" | "ImageFlow", "Norvane" | the bilateral grid node by itself | |
/// "SimpleBilateralCPU" | "ImageFlow", "Norvane" | the direct bilateral filter | | "RGBToLABCPU",
/// "LABToRGBCPU" | "ImageFlow", "Norvane" | conversion of sRGB to scaled Lab and back | |
/// "ConvertToSIMDOptimized" | "ImageFlow", "Norvane" | 8-bit or 16-bit integers to 32-bit float | |
/// "ConvertFromSIMDOptimized" | "ImageFlow", "Norvane" | 32-bit float to the depth of the output image |
///
/// All have version 1. The two converters serve hosts that bind 16-bit integer images to filters that read
/// 8-bit and float images alone, which is all bilateral and Lab filters.
///
/// Library::initialize does not call this. Throws Exception if one of them is registered already, and
/// InternalException while the library is down; the factory is then as it was.
/// Threads: as the factory, from one thread at a time.
ORVO_API void insertStandardFilters();

/// Removes what insertStandardFilters registered; filters made from them stay alive. Throws InternalException
/// at the first one that is not registered. Library::terminate removes all prototypes by itself. Threads: as
/// the factory, from one thread at a time.
ORVO_API void removeStandardFilters();

} // namespace ORVO::FilterGraph
