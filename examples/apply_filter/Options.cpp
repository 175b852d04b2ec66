#include "apply_filter/Options.h"

namespace example {

char const usageText[] = R"(Usage: apply_filter --filter NAME [options] INPUT OUTPUT
       apply_filter --list

Runs one filter over a picture (PNG, JPEG, TIFF or EXR, 1 to 4 channels).

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

void applyOption(Options& options, std::string const& option, std::string const& value) {
    if (option == "--filter")
        options.filter = value;
    else if (option == "--set")
        options.values.push_back(assignment(value));
    else if (option == "--target")
        options.target = targetNamed(value);
    else if (option == "--precision")
        options.precision = depthNamed(value);
    else if (option == "--threads")
        options.threads = positive<std::size_t>(option, value);
    else if (option == "--repeat")
        options.repeat = positive<int>(option, value);
    else
        throw UsageError("Unknown option " + option);
}

void checkComplete(Options const& options, std::size_t files) {
    if (options.list || options.help)
        return;
    if (options.filter.empty())
        throw UsageError("--filter is missing (--list shows the filters)");
    if (files != 2)
        throw UsageError("An input and an output file are needed");
}

} // namespace

Options parseOptions(int argc, char const* const* argv) {
    Options options;
    std::vector<std::string> files;
    for (int i = 1; i < argc; ++i) {
        std::string const argument = argv[i];
        if (argument == "--list") {
            options.list = true;
        } else if (argument == "--async") {
            options.async = true;
        } else if (argument == "--help") {
            options.help = true;
        } else if (argument.rfind("--", 0) == 0) {
            if (i + 1 == argc)
                throw UsageError(argument + " needs a value");
            applyOption(options, argument, argv[++i]);
        } else {
            files.push_back(argument);
        }
    }
    checkComplete(options, files.size());
    if (files.size() == 2) {
        options.input = files[0];
        options.output = files[1];
    }
    return options;
}

} // namespace example
