/// Guards of OpenGL state that this layer's own operations change.
#pragma once

#include <array>
#include <cstddef>

#include "orvo/ogl/internal/GL.h"

namespace ORVO::OGL::Internal {

/// Pixels that are uploaded, read or copied as they are, for a scope: a host may have set scales, biases and
/// maps of colours, which are set again at the end.
class ScopedPlainPixelTransfer {
public:
    ScopedPlainPixelTransfer() noexcept;
    ~ScopedPlainPixelTransfer();
    ScopedPlainPixelTransfer(ScopedPlainPixelTransfer const&) = delete;
    ScopedPlainPixelTransfer& operator=(ScopedPlainPixelTransfer const&) = delete;

private:
    /// Scales of red, green, blue and alpha, and their biases.
    static constexpr std::size_t nNumbers_ = 8;

    std::array<float, nNumbers_> aSaved_{};
    int nMapsColors_ = 0;
    bool bChanged_ = false;
};

/// Pixel store parameters, restored at the end, and pixels that are transferred as they are.
class ScopedPixelStore {
public:
    ScopedPixelStore() noexcept;
    ~ScopedPixelStore();
    ScopedPixelStore(ScopedPixelStore const&) = delete;
    ScopedPixelStore& operator=(ScopedPixelStore const&) = delete;

private:
    ScopedPlainPixelTransfer oTransfer_;
};

/// A buffer bound to a target for a scope; what was bound before is bound again at the end. Does nothing for
/// targets that the driver does not know.
class ScopedBufferBinding {
public:
    ScopedBufferBinding(unsigned nTarget, unsigned nName) noexcept;
    ~ScopedBufferBinding();
    ScopedBufferBinding(ScopedBufferBinding const&) = delete;
    ScopedBufferBinding& operator=(ScopedBufferBinding const&) = delete;

private:
    unsigned nTarget_;
    unsigned nSaved_ = 0;
    bool bChanged_ = false;
};

/// A texture bound to its target on the active unit for a scope.
class ScopedTextureBinding {
public:
    ScopedTextureBinding(unsigned nTarget, unsigned nName) noexcept;
    ~ScopedTextureBinding();
    ScopedTextureBinding(ScopedTextureBinding const&) = delete;
    ScopedTextureBinding& operator=(ScopedTextureBinding const&) = delete;

private:
    unsigned nTarget_;
    unsigned nSaved_;
};

/// The name that is bound to a buffer's target; 0 for a target that the driver does not know.
unsigned boundBuffer(unsigned nTarget) noexcept;
/// The name that is bound to a texture's target on the active unit.
unsigned boundTexture(unsigned nTarget) noexcept;
/// The value of a state with one integer.
int integerState(unsigned nName) noexcept;
/// Lets values beyond 0..1 pass, where pixels are floats; for drivers that can clamp them.
void clampNoFloats() noexcept;

} // namespace ORVO::OGL::Internal
