#include "orvo/ogl/internal/AdoptedContext.h"

namespace ORVO::OGL::Internal {

AdoptedContext::AdoptedContext() : oRecord_(NativeContext::current()) {}
AdoptedContext::~AdoptedContext() = default;

void AdoptedContext::makeCurrent() const { oRecord_.makeCurrent(); }
bool AdoptedContext::isSharingWithCurrentContext() const { return oRecord_.isSharingWithCurrentContext(); }
ContextRecord const& AdoptedContext::record() const noexcept { return oRecord_; }

} // namespace ORVO::OGL::Internal
