#pragma once

#include <cstddef>

#include "orvo/core/Export.h"

namespace ORVO::OGL {

/// How pixels lie in the memory that an upload reads: rows follow one another without padding to a multiple
/// of bytes (alignment 1: the alignment of 4 that OpenGL starts with would shear tight rows of odd width).
///
/// Threads: a plain value; apply speaks to the calling thread's current context.
class ORVO_API PixelUnpackParameters {
public:
    /// Tight rows from the first pixel on.
    PixelUnpackParameters() noexcept;

    /// Length of a row in memory, in pixels; 0 means that rows are as long as the rectangle is wide.
    void setRowLength(std::size_t rowLength) noexcept { nRowLength_ = rowLength; }
    std::size_t rowLength() const noexcept { return nRowLength_; }

    /// Writes all unpack parameters to OpenGL: alignment 1, the row length, no skips, no byte swaps. Throws
    /// ParameterException "rowLength <= INT_MAX" for what OpenGL cannot take, ExceptionOGL "No OpenGL context
    /// is current".
    void apply() const;

private:
    std::size_t nRowLength_ = 0;
};

} // namespace ORVO::OGL
