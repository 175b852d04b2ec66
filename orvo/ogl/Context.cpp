#include "orvo/ogl/Context.h"

namespace ORVO::OGL {

Context::Context() noexcept = default;
Context::~Context() = default;

} // namespace ORVO::OGL
