#include "orvo/ogl/ContextOffscreen.h"

#include <optional>

#include "orvo/core/Check.h"
#include "orvo/ogl/ScopedContextWrapper.h"
#include "orvo/ogl/internal/ContextNames.h"
#include "orvo/ogl/internal/ContextRecord.h"
#include "orvo/ogl/internal/EGLPlatform.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/GL.h"
#include "orvo/ogl/internal/GLXPlatform.h"
#include "orvo/ogl/internal/Scopes.h"

namespace ORVO::OGL {

namespace {

void destroyNative(NativeContext const& native) noexcept {
    if (native.eAPI_ == ContextAPI::egl)
        Internal::EGLPlatform::destroy(native);
    else
        Internal::GLXPlatform::destroy(native);
}

NativeContext createNative(NativeContext const& shareWith) {
    if (shareWith.pContext_ == nullptr)
        return Internal::EGLPlatform::createHeadless();
    return shareWith.eAPI_ == ContextAPI::egl ? Internal::EGLPlatform::createSharing(shareWith)
                                              : Internal::GLXPlatform::createSharing(shareWith);
}

void setClamping() noexcept {
    if (epoxy_gl_version() >= 30 || epoxy_has_gl_extension("GL_ARB_color_buffer_float"))
        Internal::clampNoFloats();
}

} // namespace

class ContextOffscreen::Implementation {
public:
    /// A context that shares with the given one; with none, from nothing, if the record is empty.
    explicit Implementation(NativeContext const& shareWith) : oContext_(createNative(shareWith)) {
        ScopedContextWrapper const restore;
        native().makeCurrent();
        setClamping();
        oRecord_.emplace(native());
    }

    ~Implementation() {
        NativeContext const before = NativeContext::current();
        try {
            oRecord_->makeCurrent();
            oRecord_.reset();
        } catch (...) {
            // The driver refuses, because another thread has the context or the device is gone.
        }
        try {
            // A context that is current would live on until it is released.
            (before.isSameContext(native()) ? NativeContext() : before).makeCurrent();
        } catch (...) {
            // The former context was destroyed meanwhile.
        }
        Internal::ContextNames::forgetContext(native().pContext_);
    }

    Implementation(Implementation const&) = delete;
    Implementation& operator=(Implementation const&) = delete;

    NativeContext const& native() const noexcept { return oContext_.oNative_; }
    Internal::ContextRecord const& record() const noexcept { return *oRecord_; }

private:
    /// A native context with its surface, destroyed with this object.
    class OwnedContext {
    public:
        explicit OwnedContext(NativeContext const& native) noexcept : oNative_(native) {}
        ~OwnedContext() { destroyNative(oNative_); }
        OwnedContext(OwnedContext const&) = delete;
        OwnedContext& operator=(OwnedContext const&) = delete;

        NativeContext const oNative_;
    };

    OwnedContext oContext_;
    std::optional<Internal::ContextRecord> oRecord_;
};

ContextOffscreen::ContextOffscreen(Context const* pShareWith) {
    ORVO_ENFORCE(pShareWith);
    NativeContext shareWith;
    if (auto const* const pOffscreen = dynamic_cast<ContextOffscreen const*>(pShareWith)) {
        shareWith = pOffscreen->pImplementation_->native();
    } else if (auto const* const pHolder = dynamic_cast<Internal::RecordHolder const*>(pShareWith)) {
        shareWith = pHolder->record().native();
    } else {
        ScopedContextWrapper const restore;
        pShareWith->makeCurrent();
        ORVO_OGL_REQUIRE_CONTEXT();
        shareWith = NativeContext::current();
    }
    pImplementation_ = std::make_unique<Implementation>(shareWith);
}

ContextOffscreen::ContextOffscreen(std::unique_ptr<Implementation> pImplementation) noexcept
    : pImplementation_(std::move(pImplementation)) {}

ContextOffscreen::~ContextOffscreen() = default;

std::unique_ptr<ContextOffscreen> ContextOffscreen::createHeadless() {
    auto pImplementation = std::make_unique<Implementation>(NativeContext());
    return std::unique_ptr<ContextOffscreen>(new ContextOffscreen(std::move(pImplementation)));
}

void ContextOffscreen::makeCurrent() const { pImplementation_->record().makeCurrent(); }

bool ContextOffscreen::isSharingWithCurrentContext() const {
    return pImplementation_->record().isSharingWithCurrentContext();
}

} // namespace ORVO::OGL
