#pragma once

#include <iosfwd>
#include <memory>
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

/// Every registered filter type: name, targets, inputs, parameters with type, default and bounds. A null
/// context means that there is no OpenGL here.
void listFilters(std::ostream& stream, ORVO::OGL::Context const* context);

} // namespace example
