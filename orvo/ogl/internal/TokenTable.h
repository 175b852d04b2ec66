/// Enumerations that are the places in a table of OpenGL's tokens.
#pragma once

#include <array>
#include <string>

#include "orvo/ogl/TokenName.h"
#include "orvo/ogl/internal/Failure.h"
#include "orvo/ogl/internal/GL.h"

namespace ORVO::OGL::Internal {

/// The place of a token in its table. Throws ExceptionOGL "Unknown <what> <token's name>".
template <typename Enum, std::size_t n>
Enum fromToken(std::array<unsigned, n> const& aTokens, unsigned token, char const* what) {
    for (std::size_t i = 0; i < n; ++i)
        if (aTokens[i] == token)
            return static_cast<Enum>(i);
    ORVO_OGL_FAIL(std::string("Unknown ") + what + " " + TokenName(token), GL_INVALID_ENUM);
}

/// The token at a place. Throws ExceptionOGL "Unknown <what> <number>".
template <typename Enum, std::size_t n>
unsigned toToken(std::array<unsigned, n> const& aTokens, Enum value, char const* what) {
    auto const nIndex = static_cast<std::size_t>(value);
    if (nIndex >= n)
        ORVO_OGL_FAIL(std::string("Unknown ") + what + " " + std::to_string(static_cast<int>(value)),
                      GL_INVALID_ENUM);
    return aTokens[nIndex];
}

} // namespace ORVO::OGL::Internal
