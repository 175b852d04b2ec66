#pragma once

#include <cstddef>

#include "orvo/core/Check.h"

namespace ORVO::OGL::Internal {

/// Throws ParameterException "The rectangle lies outside the texture" unless the stretch lies inside the
/// size.
inline void requireRange(int begin, std::size_t length, std::size_t size) {
    ORVO_CHECK_PARAMETER(begin >= 0 && length <= size && static_cast<std::size_t>(begin) <= size - length,
                         "The rectangle lies outside the texture");
}

} // namespace ORVO::OGL::Internal
