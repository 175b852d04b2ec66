#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/impl/DataDescriptor.h"

#include <iosfwd>
#include <set>

namespace ORVO::FilterGraph {

/// What a filter type expects on its inputs and gives on its output. Part of the identity of a filter type:
/// two filters of one name may differ in nothing but these.
///
/// Threads: a plain value; any thread, one at a time for each object.
class ORVO_API IODataDescriptors {
public:
    /// An ordered collection of descriptors in which equal ones may occur several times.
    using Set = std::multiset<DataDescriptor, DataDescriptorCompare>;

    /// Not initialised: nothing is said about inputs and output, and every other description matches.
    IODataDescriptors() = default;

    /// Initialised, with copies of the two sets.
    IODataDescriptors(Set const& inputDataDescriptors, Set const& outputDataDescriptors);

    Set const& inputDataDescriptors() const { return inputDataDescriptors_; }

    Set const& outputDataDescriptors() const { return outputDataDescriptors_; }

    /// Whether the sets were given. Two empty sets that were given count as initialised.
    bool isInitialized() const { return isInitialized_; }

private:
    Set inputDataDescriptors_;
    Set outputDataDescriptors_;
    bool isInitialized_ = false;
};

/// Element by element on both sets; whether they are initialised takes no part in it.
ORVO_API bool operator==(IODataDescriptors const& left, IODataDescriptors const& right);
ORVO_API bool operator!=(IODataDescriptors const& left, IODataDescriptors const& right);

/// Writes the two sets in braces, inputs first.
ORVO_API std::ostream& operator<<(std::ostream& stream, IODataDescriptors const& descriptors);

} // namespace ORVO::FilterGraph
