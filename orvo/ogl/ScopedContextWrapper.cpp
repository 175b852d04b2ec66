#include "orvo/ogl/ScopedContextWrapper.h"

namespace ORVO::OGL {

ScopedContextWrapper::ScopedContextWrapper() noexcept : oSaved_(NativeContext::current()) {}

ScopedContextWrapper::~ScopedContextWrapper() {
    try {
        oSaved_.makeCurrent();
    } catch (...) {
        // A destructor lets nothing out; the next use of a context reports what is wrong with it.
    }
}

} // namespace ORVO::OGL
