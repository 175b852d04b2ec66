#include "process_tiles/TileOptions.h"

#include <limits>
#include <string>
#include <vector>

namespace example {

char const tileUsageText[] = R"(Usage: process_tiles --filter NAME [options] INPUT OUTPUT

Runs one filter over a picture file of any size, tile by tile. The output is a tiled TIFF or EXR file.
8-bit pictures are computed in 8 bits, 16-bit ones in 16 bits where the filter can on the CPU, all others in
floats. A TIFF file keeps the picture's ICC profile, unless the filter leads to other colours.

  --filter NAME        the filter to run (apply_filter --list shows the filters)
  --target TARGET      cpu (the default), or gl: OpenGL in a context without a window
  --set NAME=VALUE     a parameter; vectors as numbers with commas: --set spatialSigma=10,10
                       colour spaces as four characters or a number: --set srcProfile=sRGB. Where the file
                       has an ICC profile, that is the source unless srcProfile is set
  --tile N             size of a tile in pixels, 2048 by default; tiles are smaller where memory demands,
                       and on gl where the driver has no textures for more
  --memory-limit MIB   memory that may be used, 512 by default; on gl textures count, too. A compressed strip
                       of a TIFF file is held whole, beyond the limit where it is a long one
  --threads N          number of threads that compute; all by default
  --help               this text

A progress bar is shown on a terminal. Ctrl-C ends the work; then, and after a failure, there is no output.
)";

namespace {

// A number of MiB that is a number of bytes, too.
std::size_t memoryLimitOf(std::string const& text) {
    std::string const option = "--memory-limit";
    auto const mebibytes = positive<std::size_t>(option, text);
    if (mebibytes > std::numeric_limits<std::size_t>::max() >> 20U)
        throw UsageError(option + " is too large: " + text);
    return mebibytes;
}

} // namespace

TileOptions parseTileOptions(int argc, char const* const* argv) {
    TileOptions options;
    CommandLine commandLine;
    addFilterOptions(commandLine, options);
    commandLine.addNumber("--tile", options.tile);
    commandLine.addOption("--memory-limit", [&options](std::string const& value) {
        options.memoryLimit = memoryLimitOf(value);
    });
    std::vector<std::string> const files = commandLine.read(argc, argv);
    if (!options.help)
        takeFiles(options, files, "apply_filter --list");
    return options;
}

} // namespace example
