#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/impl/Identifier.h"

#include <memory>

namespace ORVO::FilterGraph {

class IFilter;

/// Predicate that accepts the filters whose identifier matches a stored one, known as `IFilter::Equality`.
/// The stored identifier stands on the left of the comparison.
///
/// Threads: a plain value; any thread, one at a time for each object.
class ORVO_API FilterEquality {
public:
    explicit FilterEquality(Identifier const& identifier);

    /// Takes a copy of the filter's identifier.
    /// @throws InternalException "Enforce pFilter != NULL" if `pFilter` is null.
    explicit FilterEquality(IFilter const* pFilter);

    /// Whether the filter matches; an empty pointer never does.
    bool operator()(std::shared_ptr<IFilter> const& spFilter) const;

private:
    Identifier identifier_;
};

} // namespace ORVO::FilterGraph
