#include "apply_filter/RequestedFilter.h"

#include "apply_filter/FilterList.h"
#include "apply_filter/FilterValues.h"
#include "common/Program.h"

#include <string>

namespace example {

std::shared_ptr<ORVO::FilterGraph::IFilter> requestedFilter(FilterOptions const& options,
                                                            ProgramName const& program) {
    auto filter = createFilterNamed(options.filter);
    if (!filter)
        throw UsageError("There is no filter \"" + options.filter + "\" (" + program.list +
                         " shows the filters)");
    for (auto const& [name, value] : options.values) {
        std::string const warning = setValue(*filter, name, value);
        if (!warning.empty())
            warn(program.name, warning);
    }
    return filter;
}

UsageError doesNotRun(FilterOptions const& options, ProgramName const& program) {
    return UsageError("The filter \"" + options.filter + "\" does not run on " +
                      (options.target == Target::gl ? "gl" : "cpu") + " (" + program.list +
                      " shows the targets)");
}

} // namespace example
