#pragma once

#include <cstddef>
#include <string>

#include "orvo/filter_graph/impl/IFilter.h"
#include "orvo/filter_graph/impl/Output.h"

namespace ORVO::Test {

/// A filter that is none of the library's own: it only looks like one.
class ForeignFilter : public FilterGraph::IFilter {
public:
    Identifier const& identifier() const override { return identifier_; }
    std::size_t nChannel() const override { return 0; }
    FilterGraph::InputConstIterator inputs() const override { return {}; }
    FilterGraph::InputIterator inputs() override { return {}; }
    FilterGraph::Input const* input(std::string const&) const override { return nullptr; }
    FilterGraph::Input* input(std::string const&) override { return nullptr; }
    std::size_t getNumberOfInputs() const override { return 0; }
    FilterGraph::Output const* output(std::string const&) const override { return nullptr; }
    FilterGraph::Output* output(std::string const&) override { return nullptr; }
    FilterGraph::Output const* output() const override { return nullptr; }
    FilterGraph::Output* output() override { return nullptr; }
    FilterGraph::ParameterConstIterator parameters() const override { return {}; }
    FilterGraph::ParameterIterator parameters() override { return {}; }
    FilterGraph::ParameterBase const* parameter(std::string const&) const override { return nullptr; }
    FilterGraph::ParameterBase* parameter(std::string const&) override { return nullptr; }
    std::size_t getNumberOfParameters() const override { return 0; }
    FilterGraph::MetadataConstIterator metadata() const override { return {}; }
    FilterGraph::MetadataItemBase const* metadataItem(std::string const&) const override { return nullptr; }
    std::size_t getNumberOfMetadataItems() const override { return 0; }

private:
    Identifier identifier_{"foreign", "test", "ORVO", 1};
};

} // namespace ORVO::Test
