#include "orvo/image_runtime/FragmentShaderSourceOGL.h"

namespace ORVO {

FragmentShaderSourceOGL::FragmentShaderSourceOGL(FragmentShaderSourceOGL const&) = default;
FragmentShaderSourceOGL::FragmentShaderSourceOGL(FragmentShaderSourceOGL&&) noexcept = default;
FragmentShaderSourceOGL& FragmentShaderSourceOGL::operator=(FragmentShaderSourceOGL const&) = default;
FragmentShaderSourceOGL& FragmentShaderSourceOGL::operator=(FragmentShaderSourceOGL&&) noexcept = default;
FragmentShaderSourceOGL::~FragmentShaderSourceOGL() = default;

} // namespace ORVO
