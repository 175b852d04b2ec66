#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/spaces/PositionExtentInWorldSpace.h"
#include "orvo/filter_graph/impl/IOutputAdapter.h"
#include "orvo/filter_graph/internal/Filter.h"

#include <memory>

namespace ORVO::FilterGraph {
class ImageDescriptor;
}

namespace ORVO::FilterGraph::Internal {

/// The sink of a graph, with the one input "InputImage".
///
/// Threads: as `IFilter`.
class ORVO_API OutputAdapter : public IOutputAdapter, public Filter {
public:
    explicit OutputAdapter(eRegionSyncMode mode);
    ~OutputAdapter() override;

    /// A new sink without an image.
    static std::shared_ptr<OutputAdapter> create(eRegionSyncMode mode);

    /// Binds an image and makes its channel count the demand of the input.
    /// @throws InternalException "this->getImageDescriptor().format().nChannel == producerChannels" if that
    /// contradicts a connected producer; the image stays bound.
    void setImage(ImageBase* image) override;
    ImageBase* getImage() const override;
    IFilter* getIFilter() override;
    IFilter const* getIFilter() const override;
    eRegionSyncMode mode() override;

    void setRegionOfInterest(PositionExtentInWorldSpace const& region) override;
    PositionExtentInWorldSpace const& getRegionOfInterest() const override;
    PositionExtentInWorldSpace const& getDomainOfDefinition() const override;
    PositionExtentInPixelSpace getImageRect() override;

    /// Stores the domain of definition that the propagation found.
    virtual void updateDOD(PositionExtentInWorldSpace const& region);

    /// The descriptor of the bound image.
    /// @throws InternalException "Enforce image_ != NULL" without an image.
    virtual ImageDescriptor const& getImageDescriptor() const;

    /// Whether the sink wants the SIMD-optimised layout: never.
    virtual bool isSIMD() const;

    /// A copy with the same mode, without image and regions.
    std::shared_ptr<Filter> clone() override;

    /// The end of the compiled graph, whatever the target.
    std::shared_ptr<IFilterExecutable> buildFilterExecutable(TargetPlatform target,
                                                             GraphExecutable& graphExecutable) override;

protected:
    OutputAdapter(OutputAdapter const& other);
    OutputAdapter& operator=(OutputAdapter const&) = delete;

private:
    ImageBase* image_ = nullptr;
    eRegionSyncMode mode_;
    PositionExtentInWorldSpace regionOfInterest_;
    PositionExtentInWorldSpace domainOfDefinition_;
};

} // namespace ORVO::FilterGraph::Internal
