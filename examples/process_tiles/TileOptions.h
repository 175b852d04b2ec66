#pragma once

#include "common/CommandLine.h"

#include <cstddef>
#include <string>
#include <utility>
#include <vector>

namespace example {

/// What the command line of process_tiles asks for.
struct TileOptions {
    std::string filter;
    std::vector<std::pair<std::string, std::string>> values; ///< of --set, in order
    Target target = Target::cpu;
    int tile = 2048;               ///< pixels, each way
    std::size_t memoryLimit = 512; ///< MiB
    std::size_t threads = 0;       ///< 0: as many as the machine has
    bool help = false;
    std::string input;
    std::string output;
};

/// Throws UsageError with one line for a person.
[[nodiscard]] TileOptions parseTileOptions(int argc, char const* const* argv);

extern char const tileUsageText[];

} // namespace example
