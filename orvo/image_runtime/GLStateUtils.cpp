#include "orvo/image_runtime/GLStateUtils.h"

#include "orvo/core/Check.h"
#include "orvo/core/utility/ScopedPtr.h"
#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/Texture1D.h"
#include "orvo/ogl/Texture2D.h"
#include "orvo/ogl/Texture3D.h"
#include "orvo/ogl/TextureState.h"
#include "orvo/ogl/TextureUnit.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/GL.h"

namespace ORVO {

namespace {

using OGL::TextureState;
using OGL::TextureUnit;

/// Runs the undoing of a scope, which may find that the context is gone or another one.
template <typename Undo>
void undo(Undo const& code) noexcept {
    if (OGL::NativeContext::currentHandle() == nullptr)
        return;
    try {
        code();
    } catch (...) {
        // The current context is not the one in which the scope began, and lacks the unit.
    }
}

template <unsigned nDimensions>
void setEnabled(unsigned unit, bool bEnabled) {
    static_assert(nDimensions >= 1 && nDimensions <= 3);
    TextureUnit const& textureUnit = TextureUnit::Unit(unit);
    if constexpr (nDimensions == 1)
        bEnabled ? textureUnit.enable1D() : textureUnit.disable1D();
    else if constexpr (nDimensions == 2)
        bEnabled ? textureUnit.enable2D() : textureUnit.disable2D();
    else
        bEnabled ? textureUnit.enable3D() : textureUnit.disable3D();
}

/// The object of a unit selects its unit: with activation that is wanted, without it is taken back.
template <unsigned nDimensions, bool bActivates>
void switchTexturing(unsigned unit, bool bEnabled) {
    if constexpr (bActivates) {
        TextureState::setActiveTextureUnit(unit);
        setEnabled<nDimensions>(unit, bEnabled);
    } else {
        ScopedActiveTextureUnitRestore const restore;
        setEnabled<nDimensions>(unit, bEnabled);
    }
}

void bindDefault(TextureUnit const& unit, OGL::Texture1D const*) { unit.bind1DDefault(); }
void bindDefault(TextureUnit const& unit, OGL::Texture2D const*) { unit.bind2DDefault(); }
void bindDefault(TextureUnit const& unit, OGL::Texture3D const*) { unit.bind3DDefault(); }

} // namespace

StateObject::StateObject() noexcept = default;
StateObject::~StateObject() = default;

GLStateStack::GLStateStack() noexcept = default;

GLStateStack::~GLStateStack() {
    while (!vpState_.empty())
        pop();
}

void GLStateStack::push_back(StateObject* pState) {
    ORVO_ENFORCE(pState);
    ScopedPtr<StateObject> pOwned(pState);
    vpState_.push_back(pState);
    static_cast<void>(pOwned.release());
}

void GLStateStack::pop() {
    ORVO_CHECK(!vpState_.empty());
    // The object at the back is undone before it leaves the stack.
    trackedDelete(vpState_.back());
    vpState_.pop_back();
}

ScopedActiveTextureUnitRestore::ScopedActiveTextureUnitRestore()
    : nSaved_(TextureState::activeTextureUnit()) {}

ScopedActiveTextureUnitRestore::~ScopedActiveTextureUnitRestore() {
    undo([this] { TextureState::setActiveTextureUnit(nSaved_); });
}

ScopedGLEnable::ScopedGLEnable(unsigned cap) : nCap_(cap) {
    ORVO_OGL_REQUIRE_CONTEXT();
    glEnable(nCap_);
}

ScopedGLEnable::~ScopedGLEnable() {
    undo([this] { glDisable(nCap_); });
}

ScopedGLEnableClientState::ScopedGLEnableClientState(unsigned array) : nArray_(array) {
    ORVO_OGL_REQUIRE_CONTEXT();
    glEnableClientState(nArray_);
}

ScopedGLEnableClientState::~ScopedGLEnableClientState() {
    undo([this] { glDisableClientState(nArray_); });
}

template <unsigned nDimensions, bool bActivates>
ScopedTextureEnabler<nDimensions, bActivates>::ScopedTextureEnabler(unsigned unit) : nUnit_(unit) {
    switchTexturing<nDimensions, bActivates>(nUnit_, true);
}

template <unsigned nDimensions, bool bActivates>
ScopedTextureEnabler<nDimensions, bActivates>::~ScopedTextureEnabler() {
    undo([this] { switchTexturing<nDimensions, bActivates>(nUnit_, false); });
}

template <typename TextureT, bool bActivates>
ScopedTextureBinder<TextureT, bActivates>::ScopedTextureBinder(unsigned unit, TextureT const* pTexture)
    : nUnit_(unit) {
    ORVO_ENFORCE(pTexture);
    TextureUnit::Unit(nUnit_).bind(pTexture);
}

template <typename TextureT, bool bActivates>
ScopedTextureBinder<TextureT, bActivates>::~ScopedTextureBinder() {
    undo([this] {
        if constexpr (bActivates)
            TextureState::setActiveTextureUnit(nUnit_);
        bindDefault(TextureUnit::Unit(nUnit_), static_cast<TextureT const*>(nullptr));
    });
}

template <typename T>
ScopedTextureBindRestore<T>::ScopedTextureBindRestore(T const* pTexture) {
    ORVO_ENFORCE(pTexture);
    nPrevious_ = pTexture->getBoundID();
    nTarget_ = pTexture->target();
    glBindTexture(nTarget_, pTexture->objectID());
}

template <typename T>
ScopedTextureBindRestore<T>::~ScopedTextureBindRestore() {
    undo([this] { glBindTexture(nTarget_, nPrevious_); });
}

template class ScopedTextureEnabler<1, false>;
template class ScopedTextureEnabler<2, false>;
template class ScopedTextureEnabler<3, false>;
template class ScopedTextureEnabler<1, true>;
template class ScopedTextureEnabler<2, true>;
template class ScopedTextureEnabler<3, true>;
template class ScopedTextureBinder<OGL::Texture1D, false>;
template class ScopedTextureBinder<OGL::Texture2D, false>;
template class ScopedTextureBinder<OGL::Texture3D, false>;
template class ScopedTextureBinder<OGL::Texture1D, true>;
template class ScopedTextureBinder<OGL::Texture2D, true>;
template class ScopedTextureBinder<OGL::Texture3D, true>;
template class ScopedTextureBindRestore<OGL::Texture2>;
template class ScopedTextureBindRestore<OGL::Texture2D>;

} // namespace ORVO
