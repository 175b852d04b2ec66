#pragma once

#include <cstdint>

#include "orvo/core/Export.h"
#include "orvo/data_flow/parameters/Parameter.h"
#include "orvo/filter_graph/internal/ContentWatch.h"
#include "orvo/image_flow/sources/ImageCPUInput.h"

namespace ORVO::FilterGraph::Internal {

/// The source of a compiled graph: an `ImageCPUInput` that knows whether the client's image may have changed.
/// It counts the changes in the parameter "ContentChange", so that the dirty pass sees them like any other
/// change.
///
/// Threads: as `ImageCPUInput`.
class ORVO_API ClientImageSource : public ImageCPUInput {
public:
    ClientImageSource();
    ~ClientImageSource() override;

    /// To be called with the image of each frame (not owned, may be null) and its content stamp. Counts a
    /// change unless `contentStamp` is not 0 and image, pixels, rectangle (pixel space) and stamp are those
    /// of the last call.
    void noteContent(ORVO::ImageCPU const* pImage, std::uint64_t contentStamp);

private:
    DataFlow::Parameter<unsigned long long> oChange_;
    ContentWatch oWatch_;
};

} // namespace ORVO::FilterGraph::Internal
