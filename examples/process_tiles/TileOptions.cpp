#include "process_tiles/TileOptions.h"

namespace example {

char const tileUsageText[] = R"(Usage: process_tiles --filter NAME [options] INPUT OUTPUT

Runs one filter over a picture file of any size, tile by tile. The output is a tiled TIFF or EXR file.
Pictures of 8 bits are computed in 8 bits, others in floats.

  --filter NAME        the filter to run (apply_filter --list shows the filters)
  --target TARGET      cpu (the default), or gl: OpenGL in a context without a window
  --set NAME=VALUE     a parameter; vectors as numbers with commas: --set spatialSigma=10,10
  --tile N             size of a tile in pixels, 2048 by default; tiles are smaller where memory demands
  --memory-limit MIB   memory that may be used, 512 by default; on gl textures count, too
  --threads N          number of threads that compute; all by default
  --help               this text

A progress bar is shown on a terminal. Ctrl-C ends the work; then, and after a failure, there is no output.
)";

namespace {

void applyOption(TileOptions& options, std::string const& option, std::string const& value) {
    if (option == "--filter")
        options.filter = value;
    else if (option == "--set")
        options.values.push_back(assignment(value));
    else if (option == "--target")
        options.target = targetNamed(value);
    else if (option == "--tile")
        options.tile = positive<int>(option, value);
    else if (option == "--memory-limit")
        options.memoryLimit = positive<std::size_t>(option, value);
    else if (option == "--threads")
        options.threads = positive<std::size_t>(option, value);
    else
        throw UsageError("Unknown option " + option);
}

} // namespace

TileOptions parseTileOptions(int argc, char const* const* argv) {
    TileOptions options;
    std::vector<std::string> files;
    for (int i = 1; i < argc; ++i) {
        std::string const argument = argv[i];
        if (argument == "--help") {
            options.help = true;
        } else if (argument.rfind("--", 0) == 0) {
            if (i + 1 == argc)
                throw UsageError(argument + " needs a value");
            applyOption(options, argument, argv[++i]);
        } else {
            files.push_back(argument);
        }
    }
    if (options.help)
        return options;
    if (options.filter.empty())
        throw UsageError("--filter is missing (apply_filter --list shows the filters)");
    if (files.size() != 2)
        throw UsageError("An input and an output file are needed");
    options.input = files[0];
    options.output = files[1];
    return options;
}

} // namespace example
