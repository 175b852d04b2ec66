#pragma once

#include "orvo/core/exceptions/LogicalException.h"

namespace ORVO::OGL {

/// A failure of the OpenGL object layer: an error of the driver, a failed compile or link, a context that
/// could not be made.
///
/// Threads: an object is immutable after construction and may be read from any thread.
class ORVO_API ExceptionOGL : public LogicalException {
public:
    /// Copies both texts; null pointers count as empty texts. glError is the code of the failure, an OpenGL
    /// error or status (of EGL where a context is concerned), 0 where there is none.
    ExceptionOGL(char const* file, unsigned line, char const* message, unsigned glError);
    ExceptionOGL(ExceptionOGL const& other) noexcept;
    ExceptionOGL& operator=(ExceptionOGL const& other) noexcept;
    ~ExceptionOGL() override;

    /// The code given at construction.
    unsigned glError() const noexcept;

    ExceptionOGL* clone() const override;

private:
    unsigned nError_;
};

} // namespace ORVO::OGL
