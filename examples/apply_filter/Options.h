#pragma once

#include "common/CommandLine.h"
#include "common/Picture.h"

#include <optional>

namespace example {

/// What the command line asks for.
struct Options : FilterOptions {
    std::optional<Depth> precision; ///< that of the file where not given
    int repeat = 1;
    bool async = false;
    bool list = false;
};

/// Throws UsageError with one line for a person.
[[nodiscard]] Options parseOptions(int argc, char const* const* argv);

extern char const usageText[];

} // namespace example
