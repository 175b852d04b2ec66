#pragma once

#include "orvo/core/Export.h"

#include <cstdint>

namespace ORVO::FilterGraph {

class IFilter;
class ImageBase;

/// One end of a graph, to which a client image is bound. The image is not owned: the host keeps it alive
/// until it binds another one, or null, and no frame that uses it runs.
///
/// Binding an image with the same descriptor (channels, channel type, target, pixel extent) leaves the
/// compiled graph alone; binding another one, or null, makes the next frame rebuild it.
///
/// Threads: as `IFilter`.
class ORVO_API IAdapter {
public:
    /// Who says what the region of a source, and the region that is asked of a sink, are.
    enum eRegionSyncMode : std::int32_t {
        /// The bound image: its region is the source's domain of definition and the sink's region of
        /// interest. The mode of `createProcessor`.
        REGION_SYNC_FROM_IMAGE = 0,
        /// The host, through `setDomainOfDefinition` and `setRegionOfInterest`. The mode of
        /// `createEmbeddedProcessor`.
        REGION_SYNC_EXPLICIT = 1,
    };

    virtual ~IAdapter();

    /// Binds an image, or none.
    /// @throws InternalException if its channel count contradicts what is connected; the image stays bound.
    virtual void setImage(ImageBase* image) = 0;

    /// The bound image, or null.
    virtual ImageBase* getImage() const = 0;

    /// The adapter as a filter of the graph.
    virtual IFilter* getIFilter() = 0;
    virtual IFilter const* getIFilter() const = 0;

    /// The mode that the adapter was created with.
    virtual eRegionSyncMode mode() = 0;

protected:
    IAdapter() = default;
    IAdapter(IAdapter const&) = default;
    IAdapter& operator=(IAdapter const&) = default;
};

} // namespace ORVO::FilterGraph
