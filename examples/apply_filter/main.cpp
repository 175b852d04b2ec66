// apply_filter: one filter over a picture file. See Options.cpp for the command line.
#include "apply_filter/FileProfile.h"
#include "apply_filter/FilterList.h"
#include "apply_filter/FilterValues.h"
#include "apply_filter/FrameRunner.h"
#include "apply_filter/Options.h"
#include "common/Engine.h"
#include "common/Picture.h"

#include <cstdio>
#include <iostream>
#include <memory>
#include <set>
#include <string>
#include <utility>

namespace {

constexpr int exitFailure = 1;
constexpr int exitUsage = 2;
constexpr int exitInterrupted = 130;

example::ContextPtr noContext() { return {}; }

// The list of filters does without OpenGL where there is none.
example::ContextPtr contextIfThereIsOne() {
    try {
        return example::makeContext();
    } catch (ORVO::OGL::ExceptionOGL const&) {
        return {};
    }
}

// A filter that has no code for the target fails like any other; the user is told so in words.
bool runFramesOfFilter(std::shared_ptr<ORVO::FilterGraph::IFilter> const& filter,
                       example::Picture const& source, example::Picture& result,
                       example::FrameSettings const& settings) {
    try {
        return example::runFrames(filter, source, result, settings);
    } catch (std::exception const&) {
        // Asked of another one of its kind: this one's values may be what failed.
        if (example::runsOn(settings.context, example::createFilterNamed(filter->identifier().name())))
            throw;
        throw example::UsageError("The filter \"" + filter->identifier().name() + "\" does not run on " +
                                  (settings.context ? "gl" : "cpu") + " (--list shows the targets)");
    }
}

example::Depth depthFor(example::Options const& options) {
    auto const depth = options.precision ? *options.precision : example::depthOfFile(options.input);
    bool const inFloat = options.target == example::Target::gl && depth == example::Depth::uint15_1;
    return inFloat ? example::Depth::float32 : depth;
}

int applyFilter(example::Options const& options, ORVO::OGL::Context const* context) {
    auto const filter = example::createFilterNamed(options.filter);
    if (!filter)
        throw example::UsageError("There is no filter \"" + options.filter + "\" (--list shows the filters)");
    for (auto const& [name, value] : options.values) {
        std::string const warning = example::setValue(*filter, name, value);
        if (!warning.empty())
            std::fprintf(stderr, "apply_filter: warning: %s\n", warning.c_str());
    }
    example::checkWritable(options.output);
    example::Picture const file = example::readPicture(options.input, depthFor(options));
    example::useProfileOfFile(*filter, file, options.values);
    example::Picture const source = example::widenedToColour(file);
    example::Picture result(source.width, source.height, source.channels, source.depth);
    if (!runFramesOfFilter(filter, source, result, {context, options.repeat, options.async})) {
        std::fputs("apply_filter: cancelled, nothing was written\n", stderr);
        return exitInterrupted;
    }
    example::writePicture(options.output, file.channels < 3 ? example::reducedToGrey(result) : result);
    return 0;
}

void listAll() {
    std::set<std::string> onCPU;
    {
        example::Engine const withoutContext(noContext);
        onCPU = example::filtersOnCPU();
    }
    example::Engine const engine(contextIfThereIsOne);
    example::listFilters(std::cout, engine.context.get(), onCPU);
}

int run(example::Options const& options) {
    if (options.help) {
        std::fputs(example::usageText, stdout);
        return 0;
    }
    if (options.list) {
        listAll();
        return 0;
    }
    example::Engine const engine(options.target == example::Target::gl ? example::makeContext : noContext);
    if (options.threads > 0)
        ORVO::FilterGraph::setNumberOfThreads(options.threads);
    return applyFilter(options, engine.context.get());
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
        std::fprintf(stderr, "apply_filter: %s\n", example::describe(failure).c_str());
        return exitFailure;
    }
}
