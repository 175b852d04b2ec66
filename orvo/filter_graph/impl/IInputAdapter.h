#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/impl/IAdapter.h"

#include <memory>

namespace ORVO {
class PositionExtentInWorldSpace;
}

namespace ORVO::FilterGraph {

/// A source of a graph: a filter with an output and no input, which hands a client image to its consumers.
///
/// Threads: as `IFilter`.
class ORVO_API IInputAdapter : public IAdapter {
public:
    ~IInputAdapter() override;

    /// Sets the world region that the source has pixels for. Read in the mode `REGION_SYNC_EXPLICIT` alone.
    virtual void setDomainOfDefinition(PositionExtentInWorldSpace const& region) = 0;

    /// The world region that the source has pixels for.
    /// @throws InternalException "Enforce image_ != NULL" in the mode `REGION_SYNC_FROM_IMAGE` without an
    /// image.
    virtual PositionExtentInWorldSpace const& getDomainOfDefinition() const = 0;

    /// The world region that the last propagation asked of the source.
    virtual PositionExtentInWorldSpace const& getRegionOfInterest() const = 0;
};

/// A new source without an image.
ORVO_API std::shared_ptr<IInputAdapter> createInputAdapter(IAdapter::eRegionSyncMode mode);

} // namespace ORVO::FilterGraph
