#include "common/CommandLine.h"

namespace example {

namespace {

Target targetNamed(std::string const& text) {
    if (text == "cpu")
        return Target::cpu;
    if (text == "gl")
        return Target::gl;
    throw UsageError("--target is cpu or gl, not \"" + text + "\"");
}

// NAME=VALUE in two parts.
std::pair<std::string, std::string> assignment(std::string const& text) {
    auto const equals = text.find('=');
    if (equals == std::string::npos || equals == 0)
        throw UsageError("--set needs NAME=VALUE, not \"" + text + "\"");
    return {text.substr(0, equals), text.substr(equals + 1)};
}

bool looksLikeOption(std::string const& argument) { return argument.size() > 1 && argument[0] == '-'; }

} // namespace

void CommandLine::addFlag(std::string const& name, bool& flag) { options_[name] = {&flag, {}}; }

void CommandLine::addOption(std::string const& name, Take take) {
    options_[name] = {nullptr, std::move(take)};
}

void CommandLine::addText(std::string const& name, std::string& text) {
    addOption(name, [&text](std::string const& value) { text = value; });
}

CommandLine::Option const& CommandLine::named(std::string const& name) const {
    auto const found = options_.find(name);
    if (found == options_.end())
        throw UsageError("Unknown option " + name + " (--help shows the options)");
    return found->second;
}

std::vector<std::string> CommandLine::read(int argc, char const* const* argv) const {
    std::vector<std::string> files;
    for (int i = 1; i < argc; ++i) {
        std::string const argument = argv[i];
        if (argument == "--") {
            files.insert(files.end(), argv + i + 1, argv + argc);
            break;
        }
        if (!looksLikeOption(argument)) {
            files.push_back(argument);
            continue;
        }
        auto const equals = argument.find('=');
        std::string const name = argument.substr(0, equals);
        Option const& option = named(name);
        if (option.flag) {
            if (equals != std::string::npos)
                throw UsageError(name + " has no value");
            *option.flag = true;
        } else if (equals != std::string::npos) {
            option.take(argument.substr(equals + 1));
        } else {
            // The next option is no value; a negative number is one, if a wrong one.
            if (i + 1 == argc || std::string(argv[i + 1]).rfind("--", 0) == 0)
                throw UsageError(name + " needs a value");
            option.take(argv[++i]);
        }
    }
    return files;
}

void addFilterOptions(CommandLine& commandLine, FilterOptions& options) {
    commandLine.addText("--filter", options.filter);
    commandLine.addOption(
        "--set", [&options](std::string const& value) { options.values.push_back(assignment(value)); });
    commandLine.addOption("--target",
                          [&options](std::string const& value) { options.target = targetNamed(value); });
    commandLine.addNumber("--threads", options.threads);
    commandLine.addFlag("--help", options.help);
    commandLine.addFlag("-h", options.help);
}

void takeFiles(FilterOptions& options, std::vector<std::string> const& files, std::string const& list) {
    if (options.filter.empty())
        throw UsageError("--filter is missing (" + list + " shows the filters)");
    if (files.size() != 2)
        throw UsageError("An input and an output file are needed");
    options.input = files[0];
    options.output = files[1];
}

} // namespace example
