#include "apply_filter/FilterList.h"

#include "apply_filter/FilterValues.h"
#include "apply_filter/FrameRunner.h"
#include "orvo/filter_graph/FilterGraph.h"

#include <ostream>

namespace example {

namespace {

namespace FG = ORVO::FilterGraph;

void listParameter(std::ostream& stream, FG::ParameterBase const& parameter) {
    stream << "    " << parameter.name() << "  " << typeName(parameter);
    std::string const text = valueText(parameter);
    if (!text.empty())
        stream << "  default " << text;
    std::string const minimum = valueText(parameter, "Minimum Value");
    std::string const maximum = valueText(parameter, "Maximum Value");
    if (!minimum.empty() && !maximum.empty())
        stream << "  from " << minimum << " to " << maximum;
    if (auto const* description = parameter.metadataItem("Description"))
        stream << "\n        " << description->as<std::string>().value();
    stream << '\n';
}

std::string targetsOf(std::shared_ptr<FG::IFilter> const& filter, ORVO::OGL::Context const* context,
                      std::set<std::string> const& onCPU) {
    bool const cpu = onCPU.count(filter->identifier().name()) != 0 || runsOn(nullptr, filter);
    bool const gl = context && runsOn(context, filter);
    if (cpu || gl)
        return cpu && gl ? "runs on cpu, gl" : cpu ? "runs on cpu" : "runs on gl";
    return context ? "runs on no target" : "does not run on cpu, and there is no OpenGL here";
}

void listFilter(std::ostream& stream, std::shared_ptr<FG::IFilter> const& prototype,
                ORVO::OGL::Context const* context, std::set<std::string> const& onCPU) {
    FG::IFilter const& filter = *prototype;
    auto const& identifier = filter.identifier();
    stream << identifier.name() << "  (" << identifier.nameSpace() << ", " << identifier.vendor()
           << ", version " << identifier.version() << ")\n    " << targetsOf(prototype, context, onCPU)
           << '\n';
    for (auto input = filter.inputs(); input.isValid(); ++input) {
        stream << "    input " << input->name();
        if (input->nChannel() > 0)
            stream << "  " << input->nChannel() << " channels";
        stream << '\n';
    }
    for (auto parameter = filter.parameters(); parameter.isValid(); ++parameter)
        listParameter(stream, **parameter);
}

} // namespace

std::shared_ptr<FG::IFilter> createFilterNamed(std::string const& name) {
    FG::FilterFactory& factory = *FG::FilterFactory::Instance();
    for (auto prototype = factory.prototypes(); prototype.isValid(); ++prototype)
        if (prototype->identifier().name() == name)
            return factory.create(prototype->identifier());
    return {};
}

std::set<std::string> filtersOnCPU() {
    std::set<std::string> names;
    FG::FilterFactory& factory = *FG::FilterFactory::Instance();
    for (auto prototype = factory.prototypes(); prototype.isValid(); ++prototype)
        if (runsOn(nullptr, factory.create(prototype->identifier())))
            names.insert(prototype->identifier().name());
    return names;
}

void listFilters(std::ostream& stream, ORVO::OGL::Context const* context,
                 std::set<std::string> const& onCPU) {
    FG::FilterFactory& factory = *FG::FilterFactory::Instance();
    for (auto prototype = factory.prototypes(); prototype.isValid(); ++prototype)
        listFilter(stream, factory.create(prototype->identifier()), context, onCPU);
}

} // namespace example
