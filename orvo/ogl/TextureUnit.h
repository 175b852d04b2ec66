#pragma once

#include "orvo/core/Export.h"

namespace ORVO::OGL {

class Texture;
class Texture1D;
class Texture2D;
class Texture3D;
class TextureRECT;

/// One texture unit of the current context. Every operation selects the unit, which then stays active. Each
/// throws ExceptionOGL "No OpenGL context is current" if there is none, ParameterException "The texture unit
/// does not exist" for a unit that the driver does not have.
///
/// Threads: any thread with a current context.
class ORVO_API TextureUnit {
public:
    /// What fixed function does with a texel.
    enum Environment : int {
        ENVIRONMENT_ADD = 0,
        ENVIRONMENT_BLEND = 1,
        ENVIRONMENT_COMBINE = 2,
        ENVIRONMENT_DECAL = 3,
        ENVIRONMENT_MODULATE = 4,
        ENVIRONMENT_REPLACE = 5
    };

    /// The object of a unit, counted from 0; valid for the rest of the process. Throws ParameterException
    /// "The texture unit does not exist" beyond what any driver has.
    static TextureUnit const& Unit(unsigned unit);

    /// Binds a texture. Throws InternalException "Enforce pTexture != NULL".
    void bind(Texture1D const* pTexture) const;
    void bind(Texture2D const* pTexture) const;
    void bind(Texture3D const* pTexture) const;
    void bind(TextureRECT const* pTexture) const;

    /// Bind name 0.
    void bind1DDefault() const;
    void bind2DDefault() const;
    void bind3DDefault() const;

    /// Switch texturing of fixed function. Units beyond those of fixed function serve shaders alone and have
    /// no such switch: nothing happens.
    void enable1D() const;
    void enable2D() const;
    void enable3D() const;
    void disable1D() const;
    void disable2D() const;
    void disable3D() const;

    /// Texture environment mode; nothing happens for units that serve shaders alone. Throws ExceptionOGL for
    /// a value that is none.
    void setEnv(Environment environment) const;

    /// Conversions; each throws ExceptionOGL, naming the value, for one that has no counterpart. Threads:
    /// any.
    static Environment GL2Environment(unsigned token);
    static unsigned Environment2GL(Environment environment);

    TextureUnit(TextureUnit const&) = delete;
    TextureUnit& operator=(TextureUnit const&) = delete;

private:
    friend struct TextureUnits;
    TextureUnit() noexcept = default;

    void select() const;
    bool selectIfFixedFunction() const;
    void bindTexture(Texture const* pTexture) const;
    void bindDefault(unsigned nTarget) const;
    void setEnabled(unsigned nTarget, bool bEnabled) const;

    unsigned nUnit_ = 0;
};

} // namespace ORVO::OGL
