#pragma once

#include "orvo/core/Export.h"
#include "orvo/core/spaces/PositionExtentInWorldSpace.h"
#include "orvo/filter_graph/impl/IInputAdapter.h"
#include "orvo/filter_graph/internal/Filter.h"

#include <memory>

namespace ORVO::FilterGraph {
class ImageDescriptor;
}

namespace ORVO::FilterGraph::Internal {

/// The source of a graph.
///
/// Threads: as `IFilter`.
class ORVO_API InputAdapter : public IInputAdapter, public Filter {
public:
    explicit InputAdapter(eRegionSyncMode mode);
    ~InputAdapter() override;

    /// Binds an image and gives the output its channel count.
    /// @throws InternalException "consumerNumChannels == output->nChannel()" if that contradicts a connected
    /// consumer; the image stays bound.
    void setImage(ImageBase* image) override;
    ImageBase* getImage() const override;
    IFilter* getIFilter() override;
    IFilter const* getIFilter() const override;
    eRegionSyncMode mode() override;

    void setDomainOfDefinition(PositionExtentInWorldSpace const& region) override;
    PositionExtentInWorldSpace const& getDomainOfDefinition() const override;
    PositionExtentInWorldSpace const& getRegionOfInterest() const override;

    /// Stores the region of interest that the propagation found.
    virtual void updateROI(PositionExtentInWorldSpace const& region);

    /// The descriptor of the bound image.
    /// @throws InternalException "Enforce image_ != NULL" without an image.
    virtual ImageDescriptor const& getImageDescriptor() const;

    /// A copy with the same mode, without image and regions.
    std::shared_ptr<Filter> clone() override;

    /// The executable that the bound image needs; `target` is ignored, since the compiler bridges the
    /// difference.
    /// @throws InternalException "Enforce image_ != NULL" without an image.
    /// @throws ParameterException "false" for an image on a target that there is no source for.
    std::shared_ptr<IFilterExecutable> buildFilterExecutable(TargetPlatform target,
                                                             GraphExecutable& graphExecutable) override;

protected:
    InputAdapter(InputAdapter const& other);
    InputAdapter& operator=(InputAdapter const&) = delete;

private:
    ImageBase* image_ = nullptr;
    eRegionSyncMode mode_;
    PositionExtentInWorldSpace domainOfDefinition_;
    PositionExtentInWorldSpace regionOfInterest_;
};

} // namespace ORVO::FilterGraph::Internal
