#include "common/CommandLine.h"

namespace example {

Target targetNamed(std::string const& text) {
    if (text == "cpu")
        return Target::cpu;
    if (text == "gl")
        return Target::gl;
    throw UsageError("--target is cpu or gl, not \"" + text + "\"");
}

std::pair<std::string, std::string> assignment(std::string const& text) {
    auto const equals = text.find('=');
    if (equals == std::string::npos || equals == 0)
        throw UsageError("--set needs NAME=VALUE, not \"" + text + "\"");
    return {text.substr(0, equals), text.substr(equals + 1)};
}

} // namespace example
