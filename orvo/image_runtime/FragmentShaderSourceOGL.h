#pragma once

#include "orvo/image_runtime/ShaderSourceOGL.h"

namespace ORVO {

/// A part of a program's fragment stage.
///
/// Threads: a plain value.
class ORVO_API FragmentShaderSourceOGL : public ShaderSourceOGL {
public:
    using ShaderSourceOGL::ShaderSourceOGL;
    FragmentShaderSourceOGL(FragmentShaderSourceOGL const&);
    FragmentShaderSourceOGL(FragmentShaderSourceOGL&&) noexcept;
    FragmentShaderSourceOGL& operator=(FragmentShaderSourceOGL const&);
    FragmentShaderSourceOGL& operator=(FragmentShaderSourceOGL&&) noexcept;
    ~FragmentShaderSourceOGL() override;
};

} // namespace ORVO
