// apply_filter: one filter over a picture file. See Options.cpp for the command line.
#include "apply_filter/FilterList.h"
#include "apply_filter/FilterValues.h"
#include "apply_filter/FrameRunner.h"
#include "apply_filter/Options.h"
#include "common/Picture.h"
#include "orvo/orvo.h"

#include <cstdio>
#include <iostream>

namespace {

constexpr int exitFailure = 1;
constexpr int exitUsage = 2;
constexpr int exitInterrupted = 130;

// The layers of the engine, up for the life of one of these, without any OpenGL context.
struct Engine {
    ORVO::Core::AutoInitializer core;
    ORVO::OGL::AutoInitializer ogl;
    ORVO::ImageRuntime::AutoInitializer runtime{nullptr, ORVO::VideoMemory::Configuration()};
    ORVO::DataFlow::AutoInitializer dataFlow;
    ORVO::ImageFlow::AutoInitializer imageFlow{false};
    ORVO::FilterGraph::AutoInitializer filterGraph{ORVO::FilterGraph::Library::InitializationOptions()};

    Engine() { ORVO::FilterGraph::insertStandardFilters(); }
};

int applyFilter(example::Options const& options) {
    auto const filter = example::createFilterNamed(options.filter);
    if (!filter)
        throw example::UsageError("There is no filter \"" + options.filter + "\" (--list shows the filters)");
    for (auto const& [name, value] : options.values) {
        std::string const warning = example::setValue(*filter, name, value);
        if (!warning.empty())
            std::fprintf(stderr, "apply_filter: warning: %s\n", warning.c_str());
    }
    example::checkWritable(options.output);
    auto const depth = options.precision ? *options.precision : example::depthOfFile(options.input);
    example::Picture const file = example::readPicture(options.input, depth);
    example::Picture const source = example::widenedToColour(file);
    example::Picture result(source.width, source.height, source.channels, source.depth);
    if (!example::runFrames(filter, source, result, options.repeat, options.async)) {
        std::fputs("apply_filter: cancelled, nothing was written\n", stderr);
        return exitInterrupted;
    }
    example::writePicture(options.output, file.channels < 3 ? example::reducedToGrey(result) : result);
    return 0;
}

int run(example::Options const& options) {
    if (options.help) {
        std::fputs(example::usageText, stdout);
        return 0;
    }
    Engine const engine;
    if (options.list) {
        example::listFilters(std::cout);
        return 0;
    }
    if (options.threads > 0)
        ORVO::FilterGraph::setNumberOfThreads(options.threads);
    return applyFilter(options);
}

// What a failure of the engine says to a person.
std::string describe(std::exception const& failure) {
    auto const* client = dynamic_cast<ORVO::FilterGraph::Exception const*>(&failure);
    if (client && !client->errorsAndWarnings().empty())
        return client->errorsAndWarnings().front().message();
    return failure.what();
}

} // namespace

int main(int argc, char** argv) {
    try {
        return run(example::parseOptions(argc, argv));
    } catch (example::UsageError const& failure) {
        std::fprintf(stderr, "apply_filter: %s\n", failure.what());
        return exitUsage;
    } catch (example::ValueError const& failure) {
        std::fprintf(stderr, "apply_filter: %s\n", failure.what());
        return exitUsage;
    } catch (std::exception const& failure) {
        std::fprintf(stderr, "apply_filter: %s\n", describe(failure).c_str());
        return exitFailure;
    }
}
