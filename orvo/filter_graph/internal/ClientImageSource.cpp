#include "orvo/filter_graph/internal/ClientImageSource.h"

#include "orvo/image_runtime/images/ImageCPU.h"

namespace ORVO::FilterGraph::Internal {

ClientImageSource::ClientImageSource()
    : oChange_(0, "ContentChange", "Number of times that the pixels of the source may have changed") {
    registerParameter(&oChange_);
}

ClientImageSource::~ClientImageSource() = default;

void ClientImageSource::noteContent(ImageCPU const* pImage, std::uint64_t contentStamp) {
    void const* const pPixels = pImage ? pImage->pixels() : nullptr;
    PositionExtentInPixelSpace const rect = pImage ? pImage->positionExtent() : PositionExtentInPixelSpace();
    bool const bSame = contentStamp != 0 && contentStamp == iLastStamp_ && pImage == pLastImage_ &&
                       pPixels == pLastPixels_ && rect == oLastRect_;
    if (bSame) {
        return;
    }
    oChange_.setValue(oChange_.value() + 1);
    pLastImage_ = pImage;
    pLastPixels_ = pPixels;
    oLastRect_ = rect;
    iLastStamp_ = contentStamp;
}

} // namespace ORVO::FilterGraph::Internal
