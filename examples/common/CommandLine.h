#pragma once

#include <charconv>
#include <stdexcept>
#include <string>
#include <utility>

namespace example {

/// Where frames are computed.
enum class Target {
    cpu,
    gl, ///< OpenGL, in a context without a window
};

/// A command line that asks for something that is not there; what() is one line for a person.
class UsageError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

/// A whole number of 1 or more. Throws UsageError.
template <typename Number>
[[nodiscard]] Number positive(std::string const& option, std::string const& text) {
    Number value = 0;
    auto const [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
    if (error != std::errc() || end != text.data() + text.size() || value < 1)
        throw UsageError(option + " needs a whole number of 1 or more, not \"" + text + "\"");
    return value;
}

/// "cpu" or "gl". Throws UsageError.
[[nodiscard]] Target targetNamed(std::string const& text);

/// NAME=VALUE in two parts. Throws UsageError.
[[nodiscard]] std::pair<std::string, std::string> assignment(std::string const& text);

} // namespace example
