#pragma once

#include "orvo/image_runtime/ShaderSourceOGL.h"

namespace ORVO {

/// A part of a program's vertex stage.
///
/// Threads: a plain value.
class ORVO_API VertexShaderSourceOGL : public ShaderSourceOGL {
public:
    using ShaderSourceOGL::ShaderSourceOGL;
    VertexShaderSourceOGL(VertexShaderSourceOGL const&);
    VertexShaderSourceOGL(VertexShaderSourceOGL&&) noexcept;
    VertexShaderSourceOGL& operator=(VertexShaderSourceOGL const&);
    VertexShaderSourceOGL& operator=(VertexShaderSourceOGL&&) noexcept;
    ~VertexShaderSourceOGL() override;
};

} // namespace ORVO
