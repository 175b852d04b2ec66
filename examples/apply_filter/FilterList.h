#pragma once

#include <iosfwd>
#include <memory>
#include <string>

namespace ORVO::FilterGraph {
class IFilter;
} // namespace ORVO::FilterGraph

namespace example {

/// A new filter of the registered type of that name; empty where there is none.
[[nodiscard]] std::shared_ptr<ORVO::FilterGraph::IFilter> createFilterNamed(std::string const& name);

/// Every registered filter type: name, inputs, parameters with type, default and bounds.
void listFilters(std::ostream& stream);

} // namespace example
