#include "orvo/filter_graph/impl/DataDescriptor.h"

#include <ostream>

namespace ORVO::FilterGraph {

DataDescriptor::DataDescriptor(ColorSpace colorSpace)
    : colorSpace_(colorSpace), numChannels_(static_cast<std::size_t>(getNumChannels(colorSpace))) {}

DataDescriptor::DataDescriptor(std::size_t nChannels)
    : colorSpace_(COLOR_SPACE_UNNAMED), numChannels_(nChannels) {}

bool operator==(DataDescriptor const& left, DataDescriptor const& right) {
    return left.colorSpace() == right.colorSpace() && left.numChannels() == right.numChannels();
}

bool operator!=(DataDescriptor const& left, DataDescriptor const& right) { return !(left == right); }

bool operator<(DataDescriptor const& left, DataDescriptor const& right) {
    if (left.numChannels() != right.numChannels())
        return left.numChannels() < right.numChannels();
    return left.colorSpace() < right.colorSpace();
}

std::ostream& operator<<(std::ostream& stream, DataDescriptor const& descriptor) {
    return stream << "Number of channels:" << descriptor.numChannels() << "\n"
                  << "Colorspace:" << descriptor.colorSpace() << "\n";
}

} // namespace ORVO::FilterGraph
