#include "orvo/ogl/Framebuffer.h"

#include <algorithm>

#include "orvo/core/Check.h"
#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/Texture2.h"
#include "orvo/ogl/internal/ContextNames.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/Scopes.h"

namespace ORVO::OGL {

using Internal::ContextName;

namespace {

/// Name of the texture at a colour attachment of the bound framebuffer; 0 if there is none.
unsigned attachedTexture(unsigned attachmentIndex) noexcept {
    auto const ask = [attachmentIndex](GLenum what) {
        GLint value = 0;
        glGetFramebufferAttachmentParameteriv(GL_FRAMEBUFFER, GL_COLOR_ATTACHMENT0 + attachmentIndex, what,
                                              &value);
        return static_cast<unsigned>(value);
    };
    // Asked for the type first: some drivers take it as an error to ask an empty attachment for its name.
    if (ask(GL_FRAMEBUFFER_ATTACHMENT_OBJECT_TYPE) != GL_TEXTURE)
        return 0;
    return ask(GL_FRAMEBUFFER_ATTACHMENT_OBJECT_NAME);
}

} // namespace

Framebuffer::Framebuffer() : Object(GL_FRAMEBUFFER) {
    aNames_.reserve(1);
    aNames_.push_back(Internal::ContextNames::create(ContextName::Kind::framebuffer, 1));
}

Framebuffer::~Framebuffer() {
    for (ContextName const& name : aNames_)
        Internal::ContextNames::destroy(name);
}

ContextName const* Framebuffer::nameHere() const noexcept {
    auto const name = std::find_if(aNames_.begin(), aNames_.end(),
                                   [](ContextName const& n) { return n.isOfCurrentContext(); });
    return name != aNames_.end() ? &*name : nullptr;
}

unsigned Framebuffer::objectID() const {
    ContextName const* const pName = nameHere();
    return pName != nullptr ? pName->name() : 0;
}

unsigned Framebuffer::getBoundID() const {
    ORVO_OGL_REQUIRE_CONTEXT();
    return static_cast<unsigned>(Internal::integerState(GL_FRAMEBUFFER_BINDING));
}

void Framebuffer::bind() {
    ORVO_OGL_REQUIRE_CONTEXT();
    unsigned nName = objectID();
    if (nName == 0) {
        // Room first, so that the new name cannot be lost. A name of an earlier context at the same address
        // has died with it.
        void const* const pContext = NativeContext::currentHandle();
        aNames_.erase(std::remove_if(aNames_.begin(), aNames_.end(),
                                     [pContext](ContextName const& n) { return n.pContext_ == pContext; }),
                      aNames_.end());
        aNames_.reserve(aNames_.size() + 1);
        aNames_.push_back(Internal::ContextNames::create(ContextName::Kind::framebuffer, 1));
        nName = aNames_.back().name();
    }
    epoxy_glBindFramebuffer(GL_FRAMEBUFFER, nName);
}

void Framebuffer::unbind() {
    ORVO_OGL_REQUIRE_CONTEXT();
    epoxy_glBindFramebuffer(GL_FRAMEBUFFER, 0);
}

void Framebuffer::attach(Texture2* pTexture, unsigned attachmentIndex, unsigned level) {
    ORVO_ENFORCE(pTexture);
    ORVO_CHECK(isBound());
    glFramebufferTexture2D(GL_FRAMEBUFFER, GL_COLOR_ATTACHMENT0 + attachmentIndex, pTexture->target(),
                           pTexture->objectID(), static_cast<GLint>(level));
}

void Framebuffer::detach(Texture2* pTexture, unsigned attachmentIndex) {
    ORVO_ENFORCE(pTexture);
    ORVO_CHECK(isBound());
    if (attachedTexture(attachmentIndex) == pTexture->objectID())
        glFramebufferTexture2D(GL_FRAMEBUFFER, GL_COLOR_ATTACHMENT0 + attachmentIndex, pTexture->target(), 0,
                               0);
}

bool Framebuffer::statusOkay(unsigned* pStatus) const {
    ORVO_CHECK(isBound());
    GLenum const nStatus = glCheckFramebufferStatus(GL_FRAMEBUFFER);
    if (nStatus == GL_FRAMEBUFFER_COMPLETE)
        return true;
    if (pStatus != nullptr)
        *pStatus = nStatus;
    return false;
}

} // namespace ORVO::OGL
