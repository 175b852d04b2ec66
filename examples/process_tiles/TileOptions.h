#pragma once

#include "common/CommandLine.h"

#include <cstddef>

namespace example {

/// What the command line of process_tiles asks for.
struct TileOptions : FilterOptions {
    int tile = 2048;               ///< pixels, each way
    std::size_t memoryLimit = 512; ///< MiB
};

/// Throws UsageError with one line for a person.
[[nodiscard]] TileOptions parseTileOptions(int argc, char const* const* argv);

extern char const tileUsageText[];

} // namespace example
