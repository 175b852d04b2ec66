#include "orvo/filter_graph/internal/ClientTextureSource.h"

#include "orvo/image_runtime/images/ImageGPU.h"

namespace ORVO::FilterGraph::Internal {

ClientTextureSource::ClientTextureSource()
    : oChange_(0, "ContentChange", "Number of times that the texels of the source may have changed") {
    registerParameter(&oChange_);
}

ClientTextureSource::~ClientTextureSource() = default;

void ClientTextureSource::noteContent(ORVO::ImageGPU const* pImage, std::uint64_t contentStamp) {
    if (oWatch_.mayHaveChanged(pImage, pImage ? pImage->texture() : nullptr, contentStamp)) {
        oChange_.setValue(oChange_.value() + 1);
    }
}

} // namespace ORVO::FilterGraph::Internal
