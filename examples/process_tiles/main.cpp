// process_tiles: one filter over a picture file of any size, tile by tile. See TileOptions.cpp for the
// command line.
#include "apply_filter/FilterValues.h"
#include "common/Engine.h"
#include "process_tiles/TileOptions.h"
#include "process_tiles/TileRunner.h"

#include <cstdio>

namespace {

constexpr int exitFailure = 1;
constexpr int exitUsage = 2;
constexpr int exitInterrupted = 130;

example::ContextPtr noContext() { return {}; }

int run(example::TileOptions const& options) {
    if (options.help) {
        std::fputs(example::tileUsageText, stdout);
        return 0;
    }
    example::Engine const engine(options.target == example::Target::gl ? example::makeContext : noContext);
    if (options.threads > 0)
        ORVO::FilterGraph::setNumberOfThreads(options.threads);
    if (example::processTiles(options, engine.context.get()))
        return 0;
    std::fputs("process_tiles: cancelled, nothing was written\n", stderr);
    return exitInterrupted;
}

} // namespace

int main(int argc, char** argv) {
    try {
        return run(example::parseTileOptions(argc, argv));
    } catch (example::UsageError const& failure) {
        std::fprintf(stderr, "process_tiles: %s\n", failure.what());
        return exitUsage;
    } catch (example::ValueError const& failure) {
        std::fprintf(stderr, "process_tiles: %s\n", failure.what());
        return exitUsage;
    } catch (std::exception const& failure) {
        std::fprintf(stderr, "process_tiles: %s\n", example::describe(failure).c_str());
        return exitFailure;
    }
}
