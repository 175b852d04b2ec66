#pragma once

#include "orvo/core/ColorSpace.h"
#include "orvo/core/Export.h"

#include <cstddef>
#include <iosfwd>

namespace ORVO::FilterGraph {

/// Describes one image connection of a filter type: how many channels it carries and what they mean.
///
/// Threads: a plain value; any thread, one at a time for each object.
class ORVO_API DataDescriptor {
public:
    /// No channels; the colour space has the value 0.
    DataDescriptor() = default;

    /// A connection in a named colour space; the channel count is the one of that space.
    /// @throws ParameterException "Unknown color space" if `colorSpace` is none of the known spaces.
    explicit DataDescriptor(ColorSpace colorSpace);

    /// A connection of `nChannels` channels of no named colour space (the colour space value 6).
    explicit DataDescriptor(std::size_t nChannels);

    ColorSpace colorSpace() const { return colorSpace_; }

    std::size_t numChannels() const { return numChannels_; }

private:
    ColorSpace colorSpace_ = static_cast<ColorSpace>(0);
    std::size_t numChannels_ = 0;
};

/// Equal if colour space and channel count are.
ORVO_API bool operator==(DataDescriptor const& left, DataDescriptor const& right);
ORVO_API bool operator!=(DataDescriptor const& left, DataDescriptor const& right);

/// Orders by the channel count first and by the value of the colour space second.
ORVO_API bool operator<(DataDescriptor const& left, DataDescriptor const& right);

/// Writes "Number of channels:" and "Colorspace:" with their values, a line each.
ORVO_API std::ostream& operator<<(std::ostream& stream, DataDescriptor const& descriptor);

/// The order of `operator<` as a function object, for sets of descriptors.
struct DataDescriptorCompare {
    bool operator()(DataDescriptor const& left, DataDescriptor const& right) const { return left < right; }
};

} // namespace ORVO::FilterGraph
