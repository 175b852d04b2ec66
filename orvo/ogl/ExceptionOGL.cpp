#include "orvo/ogl/ExceptionOGL.h"

namespace ORVO::OGL {

ExceptionOGL::ExceptionOGL(char const* file, unsigned line, char const* message, unsigned glError)
    : LogicalException(file, static_cast<int>(line), message), nError_(glError) {}

ExceptionOGL::ExceptionOGL(ExceptionOGL const& other) noexcept = default;
ExceptionOGL& ExceptionOGL::operator=(ExceptionOGL const& other) noexcept = default;
ExceptionOGL::~ExceptionOGL() = default;

unsigned ExceptionOGL::glError() const noexcept { return nError_; }

ExceptionOGL* ExceptionOGL::clone() const { return new ExceptionOGL(*this); }

} // namespace ORVO::OGL
