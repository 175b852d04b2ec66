#pragma once

#include "orvo/core/Export.h"
#include "orvo/filter_graph/impl/IAdapter.h"

#include <memory>

namespace ORVO {
class PositionExtentInPixelSpace;
class PositionExtentInWorldSpace;
} // namespace ORVO

namespace ORVO::FilterGraph {

/// The sink of a graph: a filter with the one input "InputImage", on which a processor is created and whose
/// image the frames are written to.
///
/// Threads: as `IFilter`.
class ORVO_API IOutputAdapter : public IAdapter {
public:
    ~IOutputAdapter() override;

    /// Sets the world region that frames compute. Read in the mode `REGION_SYNC_EXPLICIT` alone.
    virtual void setRegionOfInterest(PositionExtentInWorldSpace const& region) = 0;

    /// The world region that frames compute.
    /// @throws InternalException "Enforce image_ != NULL" in the mode `REGION_SYNC_FROM_IMAGE` without an
    /// image.
    virtual PositionExtentInWorldSpace const& getRegionOfInterest() const = 0;

    /// The world region that the graph can give, as the last propagation found it.
    virtual PositionExtentInWorldSpace const& getDomainOfDefinition() const = 0;

    /// The pixels of the output image that a frame writes: the region of interest inside the domain of
    /// definition.
    /// @throws InternalException "Enforce image_ != NULL" without an image.
    virtual PositionExtentInPixelSpace getImageRect() = 0;
};

/// A new sink without an image.
ORVO_API std::shared_ptr<IOutputAdapter> createOutputAdapter(IAdapter::eRegionSyncMode mode);

} // namespace ORVO::FilterGraph
