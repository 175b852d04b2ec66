#include "orvo/ogl/internal/ContextRecord.h"

#include "orvo/ogl/ScopedContextWrapper.h"
#include "orvo/ogl/internal/ContextNames.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/Sentinel.h"
#include "orvo/ogl/internal/ShareGroup.h"

namespace ORVO::OGL::Internal {

ContextRecord::ContextRecord(NativeContext const& native) : oNative_(native) {
    ORVO_OGL_REQUIRE_CONTEXT();
    spGroup_ = ShareGroup::current();
    pSync_ = Sentinel::create();
}

ContextRecord::~ContextRecord() {
    if (pSync_ == nullptr)
        return;
    try {
        ScopedContextWrapper const restore;
        if (!isSharingWithCurrentContext())
            oNative_.makeCurrent();
        if (Sentinel::isAlive(pSync_))
            Sentinel::destroy(pSync_);
        spGroup_->deleteWaiting();
        spGroup_.reset();
    } catch (...) {
        // The host has destroyed the context, or uses it on another thread: the object dies with its group.
    }
}

void ContextRecord::makeCurrent() const {
    oNative_.makeCurrent();
    ContextNames::deleteOrphans();
    spGroup_->deleteWaiting();
}

bool ContextRecord::isSharingWithCurrentContext() const noexcept {
    NativeContext const current = NativeContext::current();
    if (current.pContext_ == nullptr || current.eAPI_ != oNative_.eAPI_)
        return false;
    return current.isSameContext(oNative_) || Sentinel::isAlive(pSync_);
}

} // namespace ORVO::OGL::Internal
