#include "orvo/ogl/Context.h"

#include "orvo/ogl/internal/AdoptedContext.h"

namespace ORVO::OGL {

Context::Context() noexcept = default;
Context::~Context() = default;

std::unique_ptr<Context> Context::adoptCurrent() { return std::make_unique<Internal::AdoptedContext>(); }

} // namespace ORVO::OGL
