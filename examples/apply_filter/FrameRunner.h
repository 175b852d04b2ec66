#pragma once

#include "common/Picture.h"

#include <memory>

namespace ORVO::FilterGraph {
class IFilter;
} // namespace ORVO::FilterGraph

namespace example {

/// Runs repeat frames of input -> filter -> output on the CPU and prints the milliseconds of each where there
/// are several. With async, frames run as tasks that are polled, with a progress line if standard error is a
/// terminal. Gives false, and leaves result unspecified, if the user interrupted the work. Throws what the
/// engine throws.
bool runFrames(std::shared_ptr<ORVO::FilterGraph::IFilter> const& filter, Picture const& source,
               Picture& result, int repeat, bool async);

} // namespace example
