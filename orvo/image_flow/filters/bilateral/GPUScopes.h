#pragma once

#include "orvo/image_runtime/ShaderProgramProxyOGLAutoLock.h"
#include "orvo/ogl/TextureUnit.h"

namespace ORVO {

class ImageGPU;

namespace OGL {
class Framebuffer;
class Program;
class Texture2;
} // namespace OGL

namespace ImageFlow::bilateral {

/// A framebuffer, bound, with a texture to draw to. Undone at the end, whatever happens.
///
/// Threads: construct and destroy on one thread, with the same context current.
class ScopedTarget {
public:
    /// @throws OGL::ExceptionOGL "Framebuffer attachment error: <status>" if the driver cannot draw to it.
    ScopedTarget(OGL::Framebuffer& framebuffer, OGL::Texture2* pTexture);
    ~ScopedTarget();
    ScopedTarget(ScopedTarget const&) = delete;
    ScopedTarget& operator=(ScopedTarget const&) = delete;

private:
    OGL::Framebuffer& oFramebuffer_;
    OGL::Texture2* pTexture_;
};

/// A program, locked and enabled.
///
/// Threads: as ScopedTarget.
class ScopedProgram {
public:
    /// @throws what ShaderProgramProxyOGLAutoLock throws.
    explicit ScopedProgram(ShaderProgramProxyOGL& oProxy);
    ~ScopedProgram();
    ScopedProgram(ScopedProgram const&) = delete;
    ScopedProgram& operator=(ScopedProgram const&) = delete;

    OGL::Program* operator->() const noexcept { return oLock_.getProgram(); }

private:
    ShaderProgramProxyOGLAutoLock oLock_;
};

/// An image, bound to unit 0: single texels, transparent black outside. Fixed function takes the texel for
/// the colour.
///
/// Threads: as ScopedTarget.
class ScopedInput {
public:
    explicit ScopedInput(ImageGPU const& image);
    ~ScopedInput();
    ScopedInput(ScopedInput const&) = delete;
    ScopedInput& operator=(ScopedInput const&) = delete;

private:
    ImageGPU const& oImage_;
    OGL::TextureUnit::Environment eEnvironment_;
};

} // namespace ImageFlow::bilateral
} // namespace ORVO
