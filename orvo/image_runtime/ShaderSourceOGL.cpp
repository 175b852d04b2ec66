#include "orvo/image_runtime/ShaderSourceOGL.h"

#include <utility>

namespace ORVO {

ShaderSourceOGL::ShaderSourceOGL(std::string sSource) : sSource_(std::move(sSource)) {}
ShaderSourceOGL::ShaderSourceOGL(ShaderSourceOGL const&) = default;
ShaderSourceOGL::ShaderSourceOGL(ShaderSourceOGL&&) noexcept = default;
ShaderSourceOGL& ShaderSourceOGL::operator=(ShaderSourceOGL const&) = default;
ShaderSourceOGL& ShaderSourceOGL::operator=(ShaderSourceOGL&&) noexcept = default;
ShaderSourceOGL::~ShaderSourceOGL() = default;

} // namespace ORVO
