#include "orvo/filter_graph/filters/PointFilter.h"

#include "orvo/filter_graph/filters/PointKernel.h"
#include "orvo/ogl/Texture.h"
#include "orvo/ogl/TextureState.h"

namespace ORVO::FilterGraph::Internal::Filters {

PointFilter::PointFilter(char const* name, std::string const& expression, int numChannels)
    : BasicGLShaderFilter(name, pointKernel(expression).c_str(), numChannels) {
    addInput("src");
}

PointFilter::~PointFilter() = default;

void PointFilter::preProcess() {
    BasicGLShaderFilter::preProcess();
    ImageGPU const& input = **vpInputs_.front();
    if (input.pixelExtent() != pOutputImage_->pixelExtent()) {
        return;
    }
    unsigned const nNearest = OGL::Texture::Filter2GL(OGL::Texture::FILTER_NEAREST);
    OGL::TextureState::setActiveTextureUnit(static_cast<unsigned>(input.boundTexUnit()));
    input.setFilter(nNearest, nNearest);
}

} // namespace ORVO::FilterGraph::Internal::Filters
