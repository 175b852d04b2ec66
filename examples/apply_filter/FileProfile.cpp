#include "apply_filter/FileProfile.h"

#include "apply_filter/FilterValues.h"
#include "orvo/colour_engine/ColourEngine.h"
#include "orvo/core/Core.h"
#include "orvo/filter_graph/FilterGraph.h"

#include <algorithm>

namespace example {

namespace {

// The conversions lead to Lab, which no profile of RGB is for, and to sRGB.
bool leadsToOtherColours(ORVO::FilterGraph::IFilter& filter) {
    std::string const& name = filter.identifier().name();
    return filter.parameter("dstProfile") || name == "RGBToLABCPU" || name == "LABToRGBCPU";
}

} // namespace

void useProfileOfFile(ORVO::FilterGraph::IFilter& filter, Picture const& file,
                      std::vector<std::pair<std::string, std::string>> const& values) {
    namespace Engine = ORVO::ColourEngine;
    char const* const source = "srcProfile";
    auto* const parameter = filter.parameter(source);
    bool const isNamed =
        std::any_of(values.begin(), values.end(), [&](auto const& value) { return value.first == source; });
    if (!parameter || file.profile.empty() || isNamed)
        return;
    constexpr auto code = Engine::profileCode("file");
    try {
        Engine::registerProfile(code, file.profile.data(), file.profile.size());
    } catch (ORVO::ParameterException const& failure) {
        throw ValueError("The colour profile in the file cannot be used (" + std::string(failure.message()) +
                         "); --set srcProfile=sRGB or another one stands in for it");
    }
    parameter->as<int>().setValue(static_cast<int>(code));
}

std::vector<unsigned char> profileOfResult(ORVO::FilterGraph::IFilter& filter, Picture const& file) {
    return leadsToOtherColours(filter) ? std::vector<unsigned char>() : file.profile;
}

} // namespace example
