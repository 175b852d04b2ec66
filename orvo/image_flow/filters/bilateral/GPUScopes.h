#pragma once

#include "orvo/core/Export.h"
#include "orvo/image_runtime/ShaderProgramProxyOGLAutoLock.h"
#include "orvo/ogl/TextureUnit.h"

#include <vector>

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

/// Drawing with blend equations that add, without point sprites, sizes of points from programs, and generic
/// arrays, which a host may have set: sprites replace the texture coordinates of points (some drivers: of
/// everything), and the first generic array the vertices.
///
/// Threads: as ScopedTarget.
class ORVO_API ScopedPlainDrawing {
public:
    ScopedPlainDrawing();
    ~ScopedPlainDrawing();
    ScopedPlainDrawing(ScopedPlainDrawing const&) = delete;
    ScopedPlainDrawing& operator=(ScopedPlainDrawing const&) = delete;

private:
    void setEquations(int nColor, int nAlpha) const;

    /// Whether the driver has the state of version 2: equations for alpha, sprites, sizes, generic arrays.
    bool bSecondVersion_;
    int nColorEquation_;
    int nAlphaEquation_;
    bool bSprites_ = false;
    bool bProgramSizes_ = false;
    /// The generic arrays that were enabled.
    std::vector<unsigned> aArrays_;
};

} // namespace ImageFlow::bilateral
} // namespace ORVO
