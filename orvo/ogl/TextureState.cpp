#include "orvo/ogl/TextureState.h"

#include "orvo/core/Check.h"
#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/internal/DriverFacts.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/Scopes.h"

namespace ORVO::OGL {

unsigned TextureState::activeTextureUnit() {
    ORVO_OGL_REQUIRE_CONTEXT();
    return static_cast<unsigned>(Internal::integerState(GL_ACTIVE_TEXTURE)) - GL_TEXTURE0;
}

void TextureState::setActiveTextureUnit(unsigned unit) {
    ORVO_OGL_REQUIRE_CONTEXT();
    ORVO_CHECK_PARAMETER(unit < Internal::DriverFacts::current().nSelectableUnits_,
                         "The texture unit does not exist");
    epoxy_glActiveTexture(GL_TEXTURE0 + unit);
}

bool TextureState::supportsNonPowerOfTwo() {
    return ExtensionManager::Instance()->supportsNonPowerOfTwoTextures();
}

} // namespace ORVO::OGL
