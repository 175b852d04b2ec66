#include "orvo/ogl/ScopedContextWrapper.h"

namespace ORVO::OGL {

namespace {

/// Leaves no context current. A destructor lets nothing out; the next use of a context reports what is wrong.
void releaseCurrent() noexcept {
    try {
        NativeContext().makeCurrent();
    } catch (...) {
        return;
    }
}

} // namespace

ScopedContextWrapper::ScopedContextWrapper() noexcept : oSaved_(NativeContext::current()) {}

ScopedContextWrapper::~ScopedContextWrapper() {
    try {
        restore();
    } catch (...) {
        releaseCurrent();
    }
}

void ScopedContextWrapper::restore() { oSaved_.makeCurrent(); }

} // namespace ORVO::OGL
