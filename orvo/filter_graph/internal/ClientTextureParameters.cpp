#include "orvo/filter_graph/internal/ClientTextureParameters.h"

#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/Texture2D.h"
#include "orvo/ogl/internal/GL.h"
#include "orvo/ogl/internal/Scopes.h"

namespace ORVO::FilterGraph::Internal {

namespace {

using OGL::Internal::ScopedTextureBinding;

int parameterOfBoundTexture(unsigned name) noexcept {
    GLint value = 0;
    glGetTexParameteriv(GL_TEXTURE_2D, name, &value);
    return value;
}

} // namespace

ClientTextureParameters::ClientTextureParameters() = default;

ClientTextureParameters::~ClientTextureParameters() { putBack(); }

void ClientTextureParameters::keep(OGL::Texture2D const& texture) {
    if (OGL::NativeContext::currentHandle() == nullptr) {
        return;
    }
    ScopedTextureBinding const binding(GL_TEXTURE_2D, texture.objectID());
    Parameters parameters{texture.objectID(),
                          parameterOfBoundTexture(GL_TEXTURE_MIN_FILTER),
                          parameterOfBoundTexture(GL_TEXTURE_MAG_FILTER),
                          parameterOfBoundTexture(GL_TEXTURE_WRAP_S),
                          parameterOfBoundTexture(GL_TEXTURE_WRAP_T),
                          {}};
    glGetTexParameterfv(GL_TEXTURE_2D, GL_TEXTURE_BORDER_COLOR, parameters.aBorderColor_.data());
    aKept_.push_back(parameters);
}

void ClientTextureParameters::putBack() noexcept {
    if (aKept_.empty() || OGL::NativeContext::currentHandle() == nullptr) {
        return;
    }
    for (Parameters const& parameters : aKept_) {
        ScopedTextureBinding const binding(GL_TEXTURE_2D, parameters.nTexture_);
        glTexParameteri(GL_TEXTURE_2D, GL_TEXTURE_MIN_FILTER, parameters.nMinFilter_);
        glTexParameteri(GL_TEXTURE_2D, GL_TEXTURE_MAG_FILTER, parameters.nMagFilter_);
        glTexParameteri(GL_TEXTURE_2D, GL_TEXTURE_WRAP_S, parameters.nWrapS_);
        glTexParameteri(GL_TEXTURE_2D, GL_TEXTURE_WRAP_T, parameters.nWrapT_);
        glTexParameterfv(GL_TEXTURE_2D, GL_TEXTURE_BORDER_COLOR, parameters.aBorderColor_.data());
    }
    aKept_.clear();
}

} // namespace ORVO::FilterGraph::Internal
