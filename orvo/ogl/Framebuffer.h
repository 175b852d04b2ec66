#pragma once

#include <vector>

#include "orvo/ogl/Object.h"

namespace ORVO::OGL {

class Texture2;

namespace Internal {
struct ContextName;
}

/// A framebuffer object. Contexts do not share framebuffers, so the object has a name of its own in each
/// context in which it is used, made on first use there; attachments belong to the context in which they were
/// made. Names are deleted only while their context is current: those of other contexts when that is made
/// current through this layer, or a framebuffer is made in it.
///
/// Threads: one at a time, with any context current.
class ORVO_API Framebuffer : public Object {
public:
    /// Makes the current context's name. Throws ExceptionOGL.
    Framebuffer();
    ~Framebuffer() override;

    /// The name in the current context; 0 if there is none yet.
    unsigned objectID() const override;
    unsigned getBoundID() const override;

    /// Binds for drawing and reading, making the current context's name if there is none. Throws
    /// ExceptionOGL.
    void bind();
    /// Binds the context's own framebuffer.
    void unbind();

    /// Attaches a level of a texture to a colour attachment of the bound framebuffer. Throws
    /// InternalException "Enforce pTexture != NULL", "isBound()".
    void attach(Texture2* pTexture, unsigned attachmentIndex, unsigned level);
    /// Takes the texture off a colour attachment of the bound framebuffer; an attachment with another texture
    /// stays. Throws as attach.
    void detach(Texture2* pTexture, unsigned attachmentIndex);

    /// Whether the bound framebuffer is complete; if not, and pStatus is not null, OpenGL's status is stored
    /// there (GL_FRAMEBUFFER_UNSUPPORTED is 36061). Throws InternalException "isBound()".
    bool statusOkay(unsigned* pStatus) const;

private:
    Internal::ContextName const* nameHere() const noexcept;

    std::vector<Internal::ContextName> aNames_;
};

} // namespace ORVO::OGL
