#pragma once

#include <cstddef>
#include <initializer_list>
#include <memory>
#include <string>
#include <utility>

#include "orvo/filter_graph/impl/Output.h"
#include "orvo/filter_graph/internal/Filter.h"
#include "orvo/filter_graph/internal/IFilterExecutable.h"

namespace ORVO::Test {

/// A filter that cannot run: the common part of all filters, open to tests.
class PlainFilter : public FilterGraph::Internal::Filter {
public:
    explicit PlainFilter(std::string const& name = "plain", std::initializer_list<char const*> inputs = {})
        : PlainFilter(Identifier(name, "test", "ORVO", 1), inputs) {}

    explicit PlainFilter(Identifier const& identifier, std::initializer_list<char const*> inputs = {}) {
        setIdentifier(identifier);
        for (char const* input : inputs)
            addInput(input, 0);
    }

    PlainFilter(PlainFilter const& other) = default;
    PlainFilter& operator=(PlainFilter const& other) = default;

    std::shared_ptr<Filter> clone() override { return std::make_shared<PlainFilter>(*this); }

    std::shared_ptr<FilterGraph::Internal::IFilterExecutable>
    buildFilterExecutable(TargetPlatform, FilterGraph::Internal::GraphExecutable&) override {
        return nullptr;
    }

    using Filter::addInput;
    using Filter::addParameter;
    using Filter::clearParameterSet;
    using Filter::deleteAllParameters;
    using Filter::setIdentifier;
};

/// A plain filter in a shared pointer, with a fixed number of channels on its output (0: not fixed).
inline std::shared_ptr<PlainFilter>
makePlain(std::string const& name, std::initializer_list<char const*> inputs = {}, std::size_t channels = 0) {
    auto filter = std::make_shared<PlainFilter>(name, inputs);
    filter->output()->setNumChannels(channels);
    return filter;
}

} // namespace ORVO::Test
