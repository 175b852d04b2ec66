#pragma once

#include "common/CommandLine.h"

#include <memory>

namespace ORVO {
namespace FilterGraph {
class IFilter;
} // namespace FilterGraph
namespace OGL {
class Context;
} // namespace OGL
} // namespace ORVO

namespace example {

/// How a program speaks of itself.
struct ProgramName {
    char const* name;
    char const* list; ///< what a user of it types to see the filters
};

/// The filter that the options name, with the values that they set. Values outside their bounds are told of
/// on standard error. Throws UsageError where there is no such filter, and ValueError.
[[nodiscard]] std::shared_ptr<ORVO::FilterGraph::IFilter> requestedFilter(FilterOptions const& options,
                                                                          ProgramName const& program);

/// What to throw where a filter has no code for the target.
[[nodiscard]] UsageError doesNotRun(FilterOptions const& options, ProgramName const& program);

} // namespace example
