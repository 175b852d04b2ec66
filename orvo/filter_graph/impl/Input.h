#pragma once

#include "orvo/core/Export.h"

#include <cstddef>
#include <string>

namespace ORVO::FilterGraph {

class IFilter;
class Input;
class Output;

namespace Internal {
class Filter;
ORVO_API void Connect(Filter* pSourceFilter, Input* pInput);
} // namespace Internal

ORVO_API void Disconnect(Input* pInput);

/// A named image input of a filter, which has at most one producer. Inputs belong to their filter; they are
/// made by it and die with it.
///
/// Threads: as `IFilter`.
class ORVO_API Input {
public:
    virtual ~Input();

    Input(Input const&) = delete;
    Input& operator=(Input const&) = delete;

    /// The channel count that the input demands; 0 accepts any.
    std::size_t nChannel() const { return nChannel_; }

    std::string name() const { return name_; }

    /// The filter that owns the input; never null.
    IFilter* parentFilter() const { return parentFilter_; }

    /// The filter that the input is connected to, or null.
    IFilter* producerFilter() const { return producerFilter_; }

private:
    friend class Internal::Filter;
    friend class Output;
    friend void Internal::Connect(Internal::Filter* pSourceFilter, Input* pInput);
    friend void FilterGraph::Disconnect(Input* pInput);

    /// @throws InternalException "Need valid pParentFilter." if `pParentFilter` is null.
    Input(IFilter* pParentFilter, std::string const& name, std::size_t nChannel);

    /// A new input with the same name and channel count, another parent and no producer. The caller owns it.
    virtual Input* clone(IFilter* pNewParent) const;

    void setProducer(IFilter* pProducer) { producerFilter_ = pProducer; }

    std::size_t nChannel_;
    std::string name_;
    IFilter* parentFilter_;
    IFilter* producerFilter_ = nullptr;
};

} // namespace ORVO::FilterGraph
