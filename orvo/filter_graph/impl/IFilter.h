#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/impl/Identifier.h"
#include "orvo/filter_graph/impl/RangeIterator.h"

#include <cstddef>
#include <string>

namespace ORVO::FilterGraph {

class FilterEquality;
class Output;

/// A filter of the client graph: a named operation with any number of image inputs, exactly one output,
/// parameters and metadata. A host gets filters from `FilterFactory::create`, wires them with `Connect`, sets
/// their parameters, and hands the graph's output adapter to a processor. How a filter runs is hidden.
///
/// Filters are held by `std::shared_ptr`. The links between them are plain pointers: the host keeps every
/// filter of a graph alive as long as a processor uses it. A filter that dies is disconnected from both
/// sides.
///
/// All pointers that are handed out (inputs, output, parameters, metadata items) belong to the filter and
/// live as long as it does.
///
/// Threads: no locks. A graph, its filters and their iterators belong to one thread at a time.
class ORVO_API IFilter {
public:
    using Identifier = FilterGraph::Identifier;
    using Equality = FilterEquality;
    using IODataDescriptors = FilterGraph::IODataDescriptors;

    virtual ~IFilter();

    /// The identity of the filter's type.
    virtual Identifier const& identifier() const = 0;

    /// Channels of the output; 0 means that the count is not fixed.
    virtual std::size_t nChannel() const = 0;

    /// The inputs in the order in which the filter declares them.
    virtual InputConstIterator inputs() const = 0;
    virtual InputIterator inputs() = 0;

    /// The input of that name, or null.
    virtual Input const* input(std::string const& name) const = 0;
    virtual Input* input(std::string const& name) = 0;

    virtual std::size_t getNumberOfInputs() const = 0;

    /// The one output; the name is ignored.
    virtual Output const* output(std::string const& name) const = 0;
    virtual Output* output(std::string const& name) = 0;
    virtual Output const* output() const = 0;
    virtual Output* output() = 0;

    /// The parameters in the order in which the filter declares them.
    virtual ParameterConstIterator parameters() const = 0;
    virtual ParameterIterator parameters() = 0;

    /// The parameter of that name, or null.
    virtual ParameterBase const* parameter(std::string const& name) const = 0;
    virtual ParameterBase* parameter(std::string const& name) = 0;

    virtual std::size_t getNumberOfParameters() const = 0;

    /// The metadata items of the filter itself; those of its parameters are found on the parameters.
    virtual MetadataConstIterator metadata() const = 0;

    /// The first metadata item of that name, or null.
    virtual MetadataItemBase const* metadataItem(std::string const& name) const = 0;

    virtual std::size_t getNumberOfMetadataItems() const = 0;

protected:
    IFilter() = default;
    IFilter(IFilter const&) = default;
    IFilter& operator=(IFilter const&) = default;
};

} // namespace ORVO::FilterGraph
