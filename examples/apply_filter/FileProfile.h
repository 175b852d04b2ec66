#pragma once

#include "common/Picture.h"

#include <string>
#include <utility>
#include <vector>

namespace ORVO::FilterGraph {
class IFilter;
} // namespace ORVO::FilterGraph

namespace example {

/// Makes the ICC profile of the picture's file the source of a colour transform: it is registered with the
/// engine, and "srcProfile" set to its code. Does nothing for filters without that parameter, for files
/// without a profile, and where `values`, those of the command line, name a source. Throws ValueError for a
/// profile that the engine cannot use.
void useProfileOfFile(ORVO::FilterGraph::IFilter& filter, Picture const& file,
                      std::vector<std::pair<std::string, std::string>> const& values);

/// The profile that the result has: that of the file, but none behind a filter that leads to other colours:
/// one that has a "dstProfile", and those between RGB and Lab.
[[nodiscard]] std::vector<unsigned char> profileOfResult(ORVO::FilterGraph::IFilter& filter,
                                                         Picture const& file);

} // namespace example
