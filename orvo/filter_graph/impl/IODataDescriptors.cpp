#include "orvo/filter_graph/impl/IODataDescriptors.h"

#include <ostream>

namespace ORVO::FilterGraph {

namespace {

void writeSet(std::ostream& stream, char const* name, IODataDescriptors::Set const& descriptors) {
    stream << name << " data descriptors:{";
    for (DataDescriptor const& descriptor : descriptors)
        stream << " " << descriptor;
    stream << "}   ";
}

} // namespace

IODataDescriptors::IODataDescriptors(Set const& inputDataDescriptors, Set const& outputDataDescriptors)
    : inputDataDescriptors_(inputDataDescriptors),
      outputDataDescriptors_(outputDataDescriptors),
      isInitialized_(true) {}

bool operator==(IODataDescriptors const& left, IODataDescriptors const& right) {
    return left.inputDataDescriptors() == right.inputDataDescriptors() &&
           left.outputDataDescriptors() == right.outputDataDescriptors();
}

bool operator!=(IODataDescriptors const& left, IODataDescriptors const& right) { return !(left == right); }

std::ostream& operator<<(std::ostream& stream, IODataDescriptors const& descriptors) {
    writeSet(stream, "Input", descriptors.inputDataDescriptors());
    stream << "\n";
    writeSet(stream, "Output", descriptors.outputDataDescriptors());
    return stream;
}

} // namespace ORVO::FilterGraph
