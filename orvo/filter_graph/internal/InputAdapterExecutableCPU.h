#pragma once

#include "orvo/filter_graph/internal/ImageFlowFilterExecutable.h"

namespace ORVO::FilterGraph::Internal {

class ClientImageSource;
class InputAdapter;

/// The executable of an input adapter whose image lives in host memory: a source node that is handed the
/// client's image before each frame.
///
/// Threads: as `IFilterExecutable`.
class ORVO_API InputAdapterExecutableCPU : public ImageFlowFilterExecutable {
public:
    /// Makes the source node. `graphExecutable` and `adapter` must outlive this object.
    InputAdapterExecutableCPU(GraphExecutable& graphExecutable, InputAdapter& adapter);

    ~InputAdapterExecutableCPU() override;

    /// Hands the adapter's image, its pixel extent and its domain of definition (world space) to the source.
    /// The source counts as changed unless the image bears a content stamp and image and stamp are those of
    /// the last frame. Throws InternalException "Enforce image_ != NULL" if the region is that of an image
    /// and there is none.
    void forwardStuff() override;

    /// The source's region of interest (world space) goes back to the adapter.
    void returnStuff() override;

    TargetPlatform getOutputTargetPlatform() override;

private:
    ClientImageSource* pNode_ = nullptr; // owned through the base
    InputAdapter* pAdapter_;
};

} // namespace ORVO::FilterGraph::Internal
