#include "orvo/filter_graph/internal/ClientImageSource.h"

#include "orvo/image_runtime/images/ImageCPU.h"

namespace ORVO::FilterGraph::Internal {

ClientImageSource::ClientImageSource()
    : oChange_(0, "ContentChange", "Number of times that the pixels of the source may have changed") {
    registerParameter(&oChange_);
}

ClientImageSource::~ClientImageSource() = default;

void ClientImageSource::noteContent(ORVO::ImageCPU const* pImage, std::uint64_t contentStamp) {
    if (oWatch_.mayHaveChanged(pImage, pImage ? pImage->pixels() : nullptr, contentStamp)) {
        oChange_.setValue(oChange_.value() + 1);
    }
}

} // namespace ORVO::FilterGraph::Internal
