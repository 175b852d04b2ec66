#pragma once

#include <cstdint>

#include "orvo/core/Export.h"
#include "orvo/core/spaces/PositionExtentInPixelSpace.h"

namespace ORVO {
class ImageBase;
}

namespace ORVO::FilterGraph::Internal {

/// Knows whether the client's image that a source is handed may have changed since the last frame.
///
/// Threads: as its source.
class ORVO_API ContentWatch {
public:
    /// To be asked once with the image of each frame (not owned, may be null), its storage, and its content
    /// stamp: true unless `contentStamp` is not 0 and image, storage, rectangle (pixel space) and stamp are
    /// those of the last call.
    bool mayHaveChanged(ORVO::ImageBase const* pImage, void const* pStorage, std::uint64_t contentStamp);

private:
    ORVO::ImageBase const* pLastImage_ = nullptr;
    void const* pLastStorage_ = nullptr;
    PositionExtentInPixelSpace oLastRect_;
    std::uint64_t iLastStamp_ = 0;
};

} // namespace ORVO::FilterGraph::Internal
