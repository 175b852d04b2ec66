#include "orvo/image_runtime/VertexShaderSourceOGL.h"

namespace ORVO {

VertexShaderSourceOGL::VertexShaderSourceOGL(VertexShaderSourceOGL const&) = default;
VertexShaderSourceOGL::VertexShaderSourceOGL(VertexShaderSourceOGL&&) noexcept = default;
VertexShaderSourceOGL& VertexShaderSourceOGL::operator=(VertexShaderSourceOGL const&) = default;
VertexShaderSourceOGL& VertexShaderSourceOGL::operator=(VertexShaderSourceOGL&&) noexcept = default;
VertexShaderSourceOGL::~VertexShaderSourceOGL() = default;

} // namespace ORVO
