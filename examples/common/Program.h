#pragma once

#include "common/CommandLine.h"
#include "common/Engine.h"

#include <functional>
#include <string>

namespace example {

/// Runs the work of a program and gives its exit status: 0; 130 if the work says with false that the user
/// ended it, so that nothing was written; 2 for a UsageError and 1 for any other failure. Whatever it is
/// stands on standard error in one line, behind the program's name.
[[nodiscard]] int runProgram(std::string const& name, std::function<bool()> const& work);

/// What a program says that is no failure.
void warn(std::string const& program, std::string const& text);

/// The engine as the options ask for it: on their target, with their number of threads.
struct RequestedEngine : Engine {
    explicit RequestedEngine(FilterOptions const& options);
};

} // namespace example
