/// How the sources of this layer fail.
#pragma once

#include <string>

namespace ORVO::OGL::Internal {

/// What an interface to the window system said of a refusal: its error and the error's name.
struct PlatformFailure {
    unsigned nError_ = 0;
    char const* pName_ = "";
};

/// Throws ExceptionOGL "<message>" or, where the failure has a name, "<message> (<name>)".
[[noreturn]] void throwPlatform(char const* file, int line, char const* message,
                                PlatformFailure const& failure);

/// Throws ExceptionOGL with the given text and code.
[[noreturn]] void throwOGL(char const* file, int line, std::string const& message, unsigned glError);

/// Throws ExceptionOGL "No OpenGL context is current" if none is: an entry point that is called without a
/// context would end the process in the loader.
void requireContext(char const* file, int line);

/// Reads the error state until it is clear. Throws ExceptionOGL "<message> (<name of the first error>)" if
/// there was one, also one that was pending before the calls that are checked, or if an entry point was
/// missing.
void throwOnError(char const* file, int line, char const* message);

/// Reads the error state until it is clear: for failures that are seen by a result.
void clearErrors() noexcept;

/// Makes the loader hand out an entry point that does nothing where one is absent, instead of ending the
/// process; the next throwOnError reports it.
void installResolverFailureHandler() noexcept;
/// Puts back the handler that was there.
void removeResolverFailureHandler() noexcept;

} // namespace ORVO::OGL::Internal

#define ORVO_OGL_REQUIRE_CONTEXT() ::ORVO::OGL::Internal::requireContext(__FILE__, __LINE__)
#define ORVO_OGL_THROW_ON_ERROR(message) ::ORVO::OGL::Internal::throwOnError(__FILE__, __LINE__, message)
#define ORVO_OGL_FAIL(message, glError) ::ORVO::OGL::Internal::throwOGL(__FILE__, __LINE__, message, glError)
