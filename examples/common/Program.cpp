#include "common/Program.h"

#include <cstdio>

namespace example {

namespace {

constexpr int exitFailure = 1;
constexpr int exitUsage = 2;
constexpr int exitInterrupted = 130;

int failed(std::string const& name, std::string const& text, int status) {
    std::fprintf(stderr, "%s: %s\n", name.c_str(), text.c_str());
    return status;
}

} // namespace

int runProgram(std::string const& name, std::function<bool()> const& work) {
    try {
        return work() ? 0 : failed(name, "cancelled, nothing was written", exitInterrupted);
    } catch (UsageError const& failure) {
        return failed(name, failure.what(), exitUsage);
    } catch (std::exception const& failure) {
        return failed(name, describe(failure), exitFailure);
    }
}

void warn(std::string const& program, std::string const& text) {
    std::fprintf(stderr, "%s: warning: %s\n", program.c_str(), text.c_str());
}

RequestedEngine::RequestedEngine(FilterOptions const& options)
    : Engine(options.target == Target::gl ? makeContext : noContext) {
    if (options.threads > 0)
        ORVO::FilterGraph::setNumberOfThreads(options.threads);
}

} // namespace example
