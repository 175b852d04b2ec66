#include "apply_filter/Options.h"

namespace example {

char const usageText[] = R"(Usage: apply_filter --filter NAME [options] INPUT OUTPUT
       apply_filter --list

Runs one filter over a picture (PNG, JPEG, TIFF or EXR, 1 to 4 channels). The output keeps the picture's ICC
profile (but in EXR), unless the filter leads to other colours.

  --list               every filter with the targets it runs on, its inputs, parameters, defaults and bounds
  --filter NAME        the filter to run
  --target TARGET      cpu (the default), or gl: OpenGL in a context without a window
  --set NAME=VALUE     a parameter; vectors as numbers with commas: --set spatialSigma=10,10
                       colour spaces as four characters or a number: --set srcProfile=sRGB. Where the file
                       has an ICC profile, that is the source unless srcProfile is set
  --precision DEPTH    8, 16 or 32f: what the graph works with; that of the file by default. On gl 16 and 32f
                       both work in 16-bit floats
  --threads N          number of threads; all by default
  --repeat N           run N frames and print the milliseconds of each
  --async              run frames as tasks, poll them and show a progress line; Ctrl-C cancels
  --help               this text
)";

namespace {

Depth depthNamed(std::string const& text) {
    if (text == "8")
        return Depth::uint8;
    if (text == "16")
        return Depth::uint15_1;
    if (text == "32f")
        return Depth::float32;
    throw UsageError("--precision is 8, 16 or 32f, not \"" + text + "\"");
}

} // namespace

Options parseOptions(int argc, char const* const* argv) {
    Options options;
    CommandLine commandLine;
    addFilterOptions(commandLine, options);
    commandLine.addOption("--precision",
                          [&options](std::string const& value) { options.precision = depthNamed(value); });
    commandLine.addNumber("--repeat", options.repeat);
    commandLine.addFlag("--async", options.async);
    commandLine.addFlag("--list", options.list);
    std::vector<std::string> const files = commandLine.read(argc, argv);
    if (!options.list && !options.help)
        takeFiles(options, files, "--list");
    return options;
}

} // namespace example
