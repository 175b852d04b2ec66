#pragma once

#include "common/CommandLine.h"
#include "common/Picture.h"

#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace example {

/// What the command line asks for.
struct Options {
    std::string filter;
    Target target = Target::cpu;
    std::vector<std::pair<std::string, std::string>> values; ///< of --set, in order
    std::optional<Depth> precision;                          ///< that of the file where not given
    std::size_t threads = 0;                                 ///< 0: as many as the machine has
    int repeat = 1;
    bool async = false;
    bool list = false;
    bool help = false;
    std::string input;
    std::string output;
};

/// Throws UsageError with one line for a person.
[[nodiscard]] Options parseOptions(int argc, char const* const* argv);

extern char const usageText[];

} // namespace example
