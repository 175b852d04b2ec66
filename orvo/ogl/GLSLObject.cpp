#include "orvo/ogl/GLSLObject.h"

#include "orvo/ogl/internal/ShareGroup.h"

namespace ORVO::OGL {

GLSLObject::GLSLObject() noexcept = default;
GLSLObject::~GLSLObject() = default;

void GLSLObject::joinShareGroup() { spGroup_ = Internal::ShareGroup::current(); }

} // namespace ORVO::OGL
