#pragma once

#include <memory>

#include "orvo/ogl/Context.h"

namespace ORVO::OGL {

/// A hidden context of the library's own: without a surface, or with a pixel buffer of 1 by 1 pixels.
///
/// Vertex colours are not clamped in it, and fragments and reads only where the target is of fixed point, so
/// that values outside 0..1 pass through.
///
/// Threads: as OGL::Context. Destroyed on a thread on which it can be made current.
class ORVO_API ContextOffscreen : public Context {
public:
    /// A context that shares objects with the given one, made through the same interface (for GLX on the same
    /// display, which must stay open as long as this context lives). What is current stays so. A context of
    /// the host's own class is made current for the moment. Throws InternalException "Enforce pShareWith !=
    /// NULL", ExceptionOGL if the driver refuses or if making the given context current leaves none current.
    explicit ContextOffscreen(Context const* pShareWith);
    ~ContextOffscreen() override;

    /// A context from nothing, for hosts without a window: on the first device with hardware, else on the
    /// software driver. It shares with none. What is current stays so. Throws ExceptionOGL, with "No OpenGL
    /// driver is available" where there is none.
    static std::unique_ptr<ContextOffscreen> createHeadless();

    void makeCurrent() const override;
    bool isSharingWithCurrentContext() const override;

private:
    class Implementation;
    explicit ContextOffscreen(std::unique_ptr<Implementation> pImplementation) noexcept;

    std::unique_ptr<Implementation> pImplementation_;
};

} // namespace ORVO::OGL
