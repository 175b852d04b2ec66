#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/RangeIterator.h"

#include <cstddef>
#include <memory>
#include <string>

namespace ORVO::FilterGraph {

namespace Internal {
class InputSet;
}

/// The one image output of a filter, which may feed any number of inputs. Outputs belong to their filter.
///
/// Threads: as `IFilter`.
class ORVO_API Output {
public:
    /// An output named "dst" with no parent, no fixed channel count and no consumers.
    Output();

    /// Leaves the consumers unconnected; their time stamps do not move.
    virtual ~Output();

    Output(Output const&) = delete;
    Output& operator=(Output const&) = delete;

    /// The channel count of the image; 0 means that it is not fixed.
    std::size_t nChannel() const { return nChannel_; }

    std::string name() const { return name_; }

    /// The filter that owns the output; null for the output that a filter makes for itself at its
    /// construction.
    IFilter* parentFilter() const { return parentFilter_; }

    void setName(std::string const& name) { name_ = name; }

    void setNumChannels(std::size_t nChannel) { nChannel_ = nChannel; }

    /// The number of inputs that the output feeds.
    std::size_t numConsumerInputs() const;

    /// The inputs that the output feeds, in the order in which they were connected; valid until the next
    /// connection is made or broken.
    InputIterator consumerInputs();
    InputConstIterator consumerInputs() const;

private:
    friend class Internal::Filter;
    friend void Internal::Connect(Internal::Filter* pSourceFilter, Input* pInput);
    friend void FilterGraph::Disconnect(Input* pInput);

    /// @throws InternalException "Need valid parent filter." if `pParentFilter` is null.
    Output(IFilter* pParentFilter, std::string const& name, std::size_t nChannel);

    /// A new output with the same name and channel count, another parent and no consumers. The caller owns
    /// it.
    virtual Output* clone(IFilter* pNewParent) const;

    void insertConsumer(Input* pInput);
    void removeConsumer(Input* pInput);

    std::size_t nChannel_ = 0;
    std::string name_ = "dst";
    IFilter* parentFilter_ = nullptr;
    std::unique_ptr<Internal::InputSet> consumers_;
};

} // namespace ORVO::FilterGraph
