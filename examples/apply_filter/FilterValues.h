#pragma once

#include "common/CommandLine.h"

#include <memory>
#include <string>

namespace ORVO::FilterGraph {
class IFilter;
class ParameterBase;
} // namespace ORVO::FilterGraph

namespace example {

/// A parameter that a filter has not, or text that is no value of it.
class ValueError : public UsageError {
public:
    using UsageError::UsageError;
};

/// The name of the parameter's type, such as "float2".
[[nodiscard]] std::string typeName(ORVO::FilterGraph::ParameterBase const& parameter);

/// The value as text, as setValue reads it. item is "" for the parameter's value, or the name of a metadata
/// item of the parameter's type such as "Minimum Value"; empty where there is none.
[[nodiscard]] std::string valueText(ORVO::FilterGraph::ParameterBase const& parameter,
                                    std::string const& item = "");

/// Sets the filter's parameter of that name from text. A colour space (a number whose name ends in "Profile")
/// is given as its code of four characters, shorter ones meaning spaces behind, or as a number. Bounds
/// inform, they do not forbid: a value outside its interval is set, and the result is a line that says so,
/// else empty. Throws ValueError for an unknown parameter and for text that is no value of its type, with the
/// filter as it was.
[[nodiscard]] std::string setValue(ORVO::FilterGraph::IFilter& filter, std::string const& name,
                                   std::string const& text);

} // namespace example
