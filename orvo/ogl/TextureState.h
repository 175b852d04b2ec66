#pragma once

#include "orvo/core/Export.h"

namespace ORVO::OGL {

/// State of the current context that concerns all texture units. Each operation throws ExceptionOGL "No
/// OpenGL context is current" if there is none.
///
/// Threads: any thread with a current context.
class ORVO_API TextureState {
public:
    TextureState() = delete;

    /// The active unit, counted from 0.
    static unsigned activeTextureUnit();
    /// Makes a unit the active one. Throws ParameterException "The texture unit does not exist".
    static void setActiveTextureUnit(unsigned unit);
    /// ExtensionManager::supportsNonPowerOfTwoTextures().
    static bool supportsNonPowerOfTwo();
};

} // namespace ORVO::OGL
