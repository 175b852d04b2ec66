#include "orvo/ogl/TextureUnit.h"

#include <array>

#include "orvo/core/Check.h"
#include "orvo/ogl/Texture1D.h"
#include "orvo/ogl/Texture2D.h"
#include "orvo/ogl/Texture3D.h"
#include "orvo/ogl/TextureRECT.h"
#include "orvo/ogl/TextureState.h"
#include "orvo/ogl/internal/DriverFacts.h"
#include "orvo/ogl/internal/TokenTable.h"

namespace ORVO::OGL {

namespace {

constexpr std::array<unsigned, 6> aEnvironments{GL_ADD,   GL_BLEND,    GL_COMBINE,
                                                GL_DECAL, GL_MODULATE, GL_REPLACE};

} // namespace

/// The objects of all units: more than any driver has.
struct TextureUnits {
    static constexpr unsigned nUnits = 512;

    TextureUnits() noexcept {
        for (unsigned i = 0; i < nUnits; ++i)
            aUnits_[i].nUnit_ = i;
    }
    // No std::array: that could not call the private constructor.
    TextureUnit aUnits_[nUnits];
};

TextureUnit const& TextureUnit::Unit(unsigned unit) {
    static TextureUnits const oUnits;
    ORVO_CHECK_PARAMETER(unit < TextureUnits::nUnits, "The texture unit does not exist");
    return oUnits.aUnits_[unit];
}

void TextureUnit::select() const { TextureState::setActiveTextureUnit(nUnit_); }

bool TextureUnit::selectIfFixedFunction() const {
    select();
    return nUnit_ < Internal::DriverFacts::current().nFixedFunctionUnits_;
}

void TextureUnit::bindTexture(Texture const* pTexture) const {
    select();
    glBindTexture(pTexture->target(), pTexture->objectID());
}

void TextureUnit::bind(Texture1D const* pTexture) const {
    ORVO_ENFORCE(pTexture);
    bindTexture(pTexture);
}

void TextureUnit::bind(Texture2D const* pTexture) const {
    ORVO_ENFORCE(pTexture);
    bindTexture(pTexture);
}

void TextureUnit::bind(Texture3D const* pTexture) const {
    ORVO_ENFORCE(pTexture);
    bindTexture(pTexture);
}

void TextureUnit::bind(TextureRECT const* pTexture) const {
    ORVO_ENFORCE(pTexture);
    bindTexture(pTexture);
}

void TextureUnit::bindDefault(unsigned nTarget) const {
    select();
    glBindTexture(nTarget, 0);
}

void TextureUnit::bind1DDefault() const { bindDefault(GL_TEXTURE_1D); }
void TextureUnit::bind2DDefault() const { bindDefault(GL_TEXTURE_2D); }
void TextureUnit::bind3DDefault() const { bindDefault(GL_TEXTURE_3D); }

void TextureUnit::setEnabled(unsigned nTarget, bool bEnabled) const {
    if (!selectIfFixedFunction())
        return;
    if (bEnabled)
        glEnable(nTarget);
    else
        glDisable(nTarget);
}

void TextureUnit::enable1D() const { setEnabled(GL_TEXTURE_1D, true); }
void TextureUnit::enable2D() const { setEnabled(GL_TEXTURE_2D, true); }
void TextureUnit::enable3D() const { setEnabled(GL_TEXTURE_3D, true); }
void TextureUnit::disable1D() const { setEnabled(GL_TEXTURE_1D, false); }
void TextureUnit::disable2D() const { setEnabled(GL_TEXTURE_2D, false); }
void TextureUnit::disable3D() const { setEnabled(GL_TEXTURE_3D, false); }

void TextureUnit::setEnv(Environment environment) const {
    auto const nMode = static_cast<GLint>(Environment2GL(environment));
    if (selectIfFixedFunction())
        glTexEnvi(GL_TEXTURE_ENV, GL_TEXTURE_ENV_MODE, nMode);
}

TextureUnit::Environment TextureUnit::GL2Environment(unsigned token) {
    return Internal::fromToken<Environment>(aEnvironments, token, "texture environment");
}

unsigned TextureUnit::Environment2GL(Environment environment) {
    return Internal::toToken(aEnvironments, environment, "texture environment");
}

} // namespace ORVO::OGL
