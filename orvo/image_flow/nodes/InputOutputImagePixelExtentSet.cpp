#include "orvo/image_flow/nodes/InputOutputImagePixelExtentSet.h"

#include <ostream>

namespace ORVO {

std::ostream& operator<<(std::ostream& stream, InputOutputImagePixelExtentSet const& set) {
    stream << "Input images:\n";
    for (auto const& [name, extent] : set.aInputPixelExtents_) {
        stream << name << "  " << extent << '\n';
    }
    stream << '\n';
    stream << "Output images:\n";
    for (auto const& [name, extent] : set.aOutputPixelExtents_) {
        stream << name << "  " << extent << '\n';
    }
    return stream << '\n';
}

} // namespace ORVO
