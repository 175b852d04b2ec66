#pragma once

/// Small guards of OpenGL state: each changes one piece of state of the current context and undoes that with
/// its scope. A pass pushes them on a GLStateStack as it goes; the stack undoes them in reverse order, also
/// when an exception passes.
///
///     GLStateStack states;
///     states.push_back(ORVO_NEW ScopedGLEnable(GL_BLEND));
///     states.push_back(ORVO_NEW ScopedTexture2DEnablerWithActivation(0));
///
/// Constructors throw ExceptionOGL "No OpenGL context is current" without one, and ParameterException "The
/// texture unit does not exist" for a unit that the driver does not have; then nothing is changed.
/// Destructors do nothing if no context is current, and let nothing out.
///
/// Threads: construct and destroy on one thread, with the same context current.

#include "orvo/core/Export.h"

#include <cstddef>
#include <vector>

namespace ORVO {

namespace OGL {
class Texture1D;
class Texture2;
class Texture2D;
class Texture3D;
} // namespace OGL

/// Base of all state scopes.
///
/// Threads: as the file says.
class ORVO_API StateObject {
public:
    virtual ~StateObject();
    StateObject(StateObject const&) = delete;
    StateObject& operator=(StateObject const&) = delete;

protected:
    StateObject() noexcept;
};

/// Scopes that are undone in the reverse order of their push.
///
/// Threads: as the file says.
class ORVO_API GLStateStack {
public:
    GLStateStack() noexcept;
    /// Destroys the scopes, the last one first.
    ~GLStateStack();
    GLStateStack(GLStateStack const&) = delete;
    GLStateStack& operator=(GLStateStack const&) = delete;

    /// Takes ownership of a scope made with ORVO_NEW or plain new. If memory fails the scope is undone.
    /// @throws InternalException "Enforce pState != NULL".
    void push_back(StateObject* pState);
    /// Destroys the scope that was pushed last. @throws InternalException "!vpState_.empty()".
    void pop();

    bool empty() const noexcept { return vpState_.empty(); }
    std::size_t size() const noexcept { return vpState_.size(); }

private:
    std::vector<StateObject*> vpState_;
};

/// Makes the unit that is active now the active one again.
///
/// Threads: as the file says.
class ORVO_API ScopedActiveTextureUnitRestore : public StateObject {
public:
    ScopedActiveTextureUnitRestore();
    ~ScopedActiveTextureUnitRestore() override;

private:
    unsigned nSaved_;
};

/// Enables a capability (a GLenum), and disables it at the end, whatever it was before.
///
/// Threads: as the file says.
class ORVO_API ScopedGLEnable : public StateObject {
public:
    explicit ScopedGLEnable(unsigned cap);
    ~ScopedGLEnable() override;

private:
    unsigned nCap_;
};

/// Enables a vertex array (a GLenum), and disables it at the end, whatever it was before.
///
/// Threads: as the file says.
class ORVO_API ScopedGLEnableClientState : public StateObject {
public:
    explicit ScopedGLEnableClientState(unsigned array);
    ~ScopedGLEnableClientState() override;

private:
    unsigned nArray_;
};

/// Enables fixed-function texturing of 1, 2 or 3 dimensions on a unit, and disables it there at the end.
/// With activation the unit becomes the active one, both at the beginning and at the end; without, the active
/// unit stays what it is.
///
/// Threads: as the file says.
template <unsigned nDimensions, bool bActivates>
class ScopedTextureEnabler : public StateObject {
public:
    explicit ScopedTextureEnabler(unsigned unit);
    ~ScopedTextureEnabler() override;

private:
    unsigned nUnit_;
};

using ScopedTexture1DEnablerNoActivation = ScopedTextureEnabler<1, false>;
using ScopedTexture2DEnablerNoActivation = ScopedTextureEnabler<2, false>;
using ScopedTexture3DEnablerNoActivation = ScopedTextureEnabler<3, false>;
using ScopedTexture1DEnablerWithActivation = ScopedTextureEnabler<1, true>;
using ScopedTexture2DEnablerWithActivation = ScopedTextureEnabler<2, true>;
using ScopedTexture3DEnablerWithActivation = ScopedTextureEnabler<3, true>;

/// Binds a texture to a unit, and name 0 at the end. Binding selects the unit, which then stays active; with
/// activation the end selects it explicitly too.
///
/// Throws InternalException "Enforce pTexture != NULL".
///
/// Threads: as the file says.
template <typename TextureT, bool bActivates>
class ScopedTextureBinder : public StateObject {
public:
    ScopedTextureBinder(unsigned unit, TextureT const* pTexture);
    ~ScopedTextureBinder() override;

private:
    unsigned nUnit_;
};

using ScopedTexture1DBind = ScopedTextureBinder<OGL::Texture1D, false>;
using ScopedTexture2DBind = ScopedTextureBinder<OGL::Texture2D, false>;
using ScopedTexture3DBind = ScopedTextureBinder<OGL::Texture3D, false>;
using ScopedTexture1DBindUnbindWithActivation = ScopedTextureBinder<OGL::Texture1D, true>;
using ScopedTexture2DBindUnbindWithActivation = ScopedTextureBinder<OGL::Texture2D, true>;
using ScopedTexture3DBindUnbindWithActivation = ScopedTextureBinder<OGL::Texture3D, true>;

/// Binds a texture (OGL::Texture2 or OGL::Texture2D) to its target on the active unit, and at the end what
/// was bound there before; the same unit must be active then.
///
/// Throws InternalException "Enforce pTexture != NULL".
///
/// Threads: as the file says.
template <typename T>
class ScopedTextureBindRestore : public StateObject {
public:
    explicit ScopedTextureBindRestore(T const* pTexture);
    ~ScopedTextureBindRestore() override;

private:
    unsigned nPrevious_;
    unsigned nTarget_;
};

extern template class ORVO_API ScopedTextureEnabler<1, false>;
extern template class ORVO_API ScopedTextureEnabler<2, false>;
extern template class ORVO_API ScopedTextureEnabler<3, false>;
extern template class ORVO_API ScopedTextureEnabler<1, true>;
extern template class ORVO_API ScopedTextureEnabler<2, true>;
extern template class ORVO_API ScopedTextureEnabler<3, true>;
extern template class ORVO_API ScopedTextureBinder<OGL::Texture1D, false>;
extern template class ORVO_API ScopedTextureBinder<OGL::Texture2D, false>;
extern template class ORVO_API ScopedTextureBinder<OGL::Texture3D, false>;
extern template class ORVO_API ScopedTextureBinder<OGL::Texture1D, true>;
extern template class ORVO_API ScopedTextureBinder<OGL::Texture2D, true>;
extern template class ORVO_API ScopedTextureBinder<OGL::Texture3D, true>;
extern template class ORVO_API ScopedTextureBindRestore<OGL::Texture2>;
extern template class ORVO_API ScopedTextureBindRestore<OGL::Texture2D>;

} // namespace ORVO
