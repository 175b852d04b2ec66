#pragma once

#include <iosfwd>
#include <memory>
#include <set>
#include <string>

namespace ORVO {
namespace FilterGraph {
class IFilter;
} // namespace FilterGraph
namespace OGL {
class Context;
} // namespace OGL
} // namespace ORVO

namespace example {

/// A new filter of the registered type of that name; empty where there is none.
[[nodiscard]] std::shared_ptr<ORVO::FilterGraph::IFilter> createFilterNamed(std::string const& name);

/// The names of the registered filter types that run on the CPU. Asked of layers that were started without a
/// context: a type that has a node for each target has only OpenGL's where there is one.
[[nodiscard]] std::set<std::string> filtersOnCPU();

/// Every registered filter type: name, targets, inputs, parameters with type, default and bounds. A null
/// context means that there is no OpenGL here. Those named in onCPU run on the CPU, too.
void listFilters(std::ostream& stream, ORVO::OGL::Context const* context,
                 std::set<std::string> const& onCPU = {});

} // namespace example
