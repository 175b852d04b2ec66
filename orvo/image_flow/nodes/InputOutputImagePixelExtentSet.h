#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/spaces/PixelExtentInWorldSpace.h"

#include <iosfwd>
#include <map>
#include <string>

namespace ORVO {

/// The pixel extents (world units a pixel) of an image node, by connector name: one entry for each image
/// input and one for the image output. Clones of the output bear its name and share its entry.
///
/// Threads: a plain value without locks.
struct InputOutputImagePixelExtentSet {
    std::map<std::string, PixelExtentInWorldSpace> aInputPixelExtents_;
    std::map<std::string, PixelExtentInWorldSpace> aOutputPixelExtents_;
};

/// Writes "Input images:", a line "<name>  <extent>" for each input and an empty line, then "Output images:"
/// and the outputs in the same way.
ORVO_API std::ostream& operator<<(std::ostream& stream, InputOutputImagePixelExtentSet const& set);

} // namespace ORVO
