#include "orvo/filter_graph/internal/ContentWatch.h"

#include "orvo/image_runtime/images/ImageBase.h"

namespace ORVO::FilterGraph::Internal {

bool ContentWatch::mayHaveChanged(ORVO::ImageBase const* pImage, void const* pStorage,
                                  std::uint64_t contentStamp) {
    PositionExtentInPixelSpace const rect = pImage ? pImage->positionExtent() : PositionExtentInPixelSpace();
    bool const bSame = contentStamp != 0 && contentStamp == iLastStamp_ && pImage == pLastImage_ &&
                       pStorage == pLastStorage_ && rect == oLastRect_;
    if (bSame) {
        return false;
    }
    pLastImage_ = pImage;
    pLastStorage_ = pStorage;
    oLastRect_ = rect;
    iLastStamp_ = contentStamp;
    return true;
}

} // namespace ORVO::FilterGraph::Internal
