// apply_filter: one filter over a picture file. See Options.cpp for the command line.
#include "apply_filter/FileProfile.h"
#include "apply_filter/FilterList.h"
#include "apply_filter/FrameRunner.h"
#include "apply_filter/Interrupt.h"
#include "apply_filter/Options.h"
#include "apply_filter/RequestedFilter.h"
#include "common/Engine.h"
#include "common/Picture.h"
#include "common/Program.h"

#include <cstdio>
#include <iostream>
#include <memory>
#include <set>
#include <string>

namespace {

constexpr example::ProgramName program = {"apply_filter", "--list"};

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
                       example::Options const& options, example::Picture const& source,
                       example::Picture& result, ORVO::OGL::Context const* context) {
    try {
        return example::runFrames(filter, source, result, {context, options.repeat, options.async});
    } catch (std::exception const&) {
        if (example::Interrupt::requested())
            return false;
        // Asked of another one of its kind: this one's values may be what failed.
        if (example::runsOn(context, example::createFilterNamed(options.filter)))
            throw;
        throw example::doesNotRun(options, program);
    }
}

example::Depth depthFor(example::Options const& options) {
    auto const depth = options.precision ? *options.precision : example::depthOfFile(options.input);
    bool const inFloat = options.target == example::Target::gl && depth == example::Depth::uint15_1;
    return inFloat ? example::Depth::float32 : depth;
}

bool applyFilter(example::Options const& options, ORVO::OGL::Context const* context) {
    // While the result is written, too: a temporary file would stay.
    example::Interrupt const interrupt;
    auto const filter = example::requestedFilter(options, program);
    example::checkWritable(options.output);
    example::Picture const file = example::readPicture(options.input, depthFor(options));
    example::useProfileOfFile(*filter, file, options.values);
    example::Picture const source = example::widenedToColour(file);
    example::Picture result(source.width, source.height, source.channels, source.depth);
    if (!runFramesOfFilter(filter, options, source, result, context))
        return false;
    if (file.channels < 3)
        result = example::reducedToGrey(result);
    result.profile = example::profileOfResult(*filter, file);
    result.orientation = file.orientation;
    example::writePicture(options.output, result);
    return true;
}

void listAll() {
    std::set<std::string> onCPU;
    {
        example::Engine const withoutContext(example::noContext);
        onCPU = example::filtersOnCPU();
    }
    example::Engine const engine(contextIfThereIsOne);
    example::listFilters(std::cout, engine.context.get(), onCPU);
}

bool run(example::Options const& options) {
    if (options.help) {
        std::fputs(example::usageText, stdout);
        return true;
    }
    if (options.list) {
        listAll();
        return true;
    }
    example::RequestedEngine const engine(options);
    return applyFilter(options, engine.context.get());
}

} // namespace

int main(int argc, char** argv) {
    return example::runProgram(program.name, [&] { return run(example::parseOptions(argc, argv)); });
}
