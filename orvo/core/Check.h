/// Checks that are ordinary code: they are active in every build and their texts are part of the system.
///
/// ORVO_CHECK(condition[, text])            throws InternalException, text or the condition as it is written
/// ORVO_CHECK_PARAMETER(condition[, text])  throws ParameterException in the same way
/// ORVO_ENFORCE(pointer[, "name"])          throws InternalException "Enforce <pointer or name> != NULL"
/// ORVO_FAIL(text), ORVO_FAIL_PARAMETER(text) throw always
///
/// Each is a statement. The condition is evaluated once; the text (a C string or a std::string) is evaluated
/// only on failure. A condition with a comma outside parentheses must be put into parentheses.
#pragma once

#include <string>

#include "orvo/core/Export.h"

namespace ORVO_private {

/// Throws ORVO::InternalException with the given site and text.
[[noreturn]] ORVO_API void throwInternal(char const* file, int line, char const* text);
[[noreturn]] ORVO_API void throwInternal(char const* file, int line, std::string const& text);

/// Throws ORVO::ParameterException with the given site and text.
[[noreturn]] ORVO_API void throwParameter(char const* file, int line, char const* text);
[[noreturn]] ORVO_API void throwParameter(char const* file, int line, std::string const& text);

/// Throws ORVO::InternalException with the text "Enforce <name> != NULL".
[[noreturn]] ORVO_API void throwEnforce(char const* file, int line, char const* name);

} // namespace ORVO_private

// Picks the form with or without a text of its own. The condition is stringised before it is passed on, so
// that macros inside it stand in the text as they were written.
#define ORVO_PRIVATE_SELECT(first, second, chosen, ...) chosen

#define ORVO_PRIVATE_CHECK_OWN(thrower, expression, condition)                                               \
    do {                                                                                                     \
        if (__builtin_expect(!(condition), 0))                                                               \
            ::ORVO_private::thrower(__FILE__, __LINE__, expression);                                         \
    } while (false)
#define ORVO_PRIVATE_CHECK_TEXT(thrower, expression, condition, text)                                        \
    do {                                                                                                     \
        if (__builtin_expect(!(condition), 0))                                                               \
            ::ORVO_private::thrower(__FILE__, __LINE__, text);                                               \
    } while (false)

#define ORVO_CHECK(...)                                                                                      \
    ORVO_PRIVATE_SELECT(__VA_ARGS__, ORVO_PRIVATE_CHECK_TEXT, ORVO_PRIVATE_CHECK_OWN, 0)                     \
    (throwInternal, #__VA_ARGS__, __VA_ARGS__)

#define ORVO_CHECK_PARAMETER(...)                                                                            \
    ORVO_PRIVATE_SELECT(__VA_ARGS__, ORVO_PRIVATE_CHECK_TEXT, ORVO_PRIVATE_CHECK_OWN, 0)                     \
    (throwParameter, #__VA_ARGS__, __VA_ARGS__)

#define ORVO_ENFORCE(...)                                                                                    \
    ORVO_PRIVATE_SELECT(__VA_ARGS__, ORVO_PRIVATE_CHECK_TEXT, ORVO_PRIVATE_CHECK_OWN, 0)                     \
    (throwEnforce, #__VA_ARGS__, __VA_ARGS__)

#define ORVO_FAIL(text) ::ORVO_private::throwInternal(__FILE__, __LINE__, text)
#define ORVO_FAIL_PARAMETER(text) ::ORVO_private::throwParameter(__FILE__, __LINE__, text)
