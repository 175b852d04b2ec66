#include "orvo/ogl/GLSLObject.h"

namespace ORVO::OGL {

GLSLObject::GLSLObject() noexcept = default;
GLSLObject::~GLSLObject() = default;

} // namespace ORVO::OGL
