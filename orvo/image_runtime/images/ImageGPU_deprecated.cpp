// The older surface of ImageGPU for fixed function.
#include "orvo/image_runtime/images/ImageGPU.h"

#include "orvo/core/Check.h"
#include "orvo/image_runtime/GLStateUtils.h"
#include "orvo/ogl/Texture2D.h"
#include "orvo/ogl/TextureState.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/Scopes.h"

namespace ORVO {

namespace {

/// Makes a unit the active one; -1 stands for the one that is.
void activate(int unit) {
    if (unit == -1) {
        ORVO_OGL_REQUIRE_CONTEXT();
        return;
    }
    OGL::TextureState::setActiveTextureUnit(static_cast<unsigned>(unit));
}

/// Whether the active unit has a switch for texturing: those beyond fixed function serve shaders alone.
bool canSwitch() {
    return static_cast<int>(OGL::TextureState::activeTextureUnit()) <
           OGL::Internal::integerState(GL_MAX_TEXTURE_UNITS);
}

} // namespace

void ImageGPU::bind_DEPRECATED_2_0(int unit) const {
    OGL::Texture2D const& texture = requiredTexture();
    activate(unit);
    glBindTexture(texture.target(), texture.objectID());
}

void ImageGPU::enable_DEPRECATED_2_0(int unit) const {
    OGL::Texture2D const& texture = requiredTexture();
    activate(unit);
    if (canSwitch())
        glEnable(texture.target());
}

void ImageGPU::disable_DEPRECATED_2_0(int unit) const {
    OGL::Texture2D const& texture = requiredTexture();
    if (unit == -1) {
        activate(unit);
        if (canSwitch())
            glDisable(texture.target());
        return;
    }
    ScopedActiveTextureUnitRestore const restore;
    activate(unit);
    ORVO_CHECK(canSwitch() && glIsEnabled(texture.target()) == GL_TRUE,
               "Texture target is not enabled..can't disable texture");
    glDisable(texture.target());
}

void ImageGPU::unbind_DEPRECATED_2_0() const {
    OGL::Texture2D const& texture = requiredTexture();
    ORVO_CHECK(texture.isBound(), "Texture not bound");
    glBindTexture(texture.target(), 0);
}

void ImageGPU::setEnvironment_DEPRECATED_2_0(unsigned mode) const {
    ORVO_OGL_REQUIRE_CONTEXT();
    glTexEnvi(GL_TEXTURE_ENV, GL_TEXTURE_ENV_MODE, static_cast<GLint>(mode));
    ORVO_OGL_THROW_ON_ERROR("The texture environment could not be set");
}

} // namespace ORVO
