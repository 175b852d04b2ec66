#include "process_tiles/TileRunner.h"

#include "apply_filter/FileProfile.h"
#include "apply_filter/FilterList.h"
#include "apply_filter/FrameRunner.h"
#include "apply_filter/Interrupt.h"
#include "apply_filter/RequestedFilter.h"
#include "common/Engine.h"
#include "common/Picture.h"
#include "common/PictureIO.h"
#include "orvo/core/memory/ImageStorage.h"
#include "orvo/filter_graph/FilterGraph.h"
#include "process_tiles/BandReader.h"
#include "process_tiles/Progress.h"
#include "process_tiles/TileFrame.h"
#include "process_tiles/TilePlan.h"
#include "process_tiles/TileWriter.h"

#include <algorithm>
#include <exception>
#include <functional>
#include <memory>
#include <string>
#include <utility>
#include <vector>

namespace example {

namespace {

using FilterPtr = std::shared_ptr<ORVO::FilterGraph::IFilter>;

// That of the tiles of a file.
constexpr int smallestTile = 16;

std::size_t pixelsOf(Rectangle const& rectangle) {
    return static_cast<std::size_t>(rectangle.extent().width()) *
           static_cast<std::size_t>(rectangle.extent().height());
}

FilterPtr filterOf(TileOptions const& options, ORVO::OGL::Context const* context) {
    constexpr ProgramName program = {"process_tiles", "apply_filter --list"};
    FilterPtr filter = requestedFilter(options, program);
    // Asked of another one of its kind: this one's values may be what fails.
    if (!runsOn(context, createFilterNamed(options.filter)) && !Interrupt::requested())
        throw doesNotRun(options, program);
    return filter;
}

// The tiles of one height, and the rows that they need.
struct Row {
    std::vector<Rectangle> tiles;
    Rows rows;
};

std::vector<Row> rowsOf(TilePlan const& plan, TileFrame& frame) {
    std::vector<Row> result;
    for (Rectangle const& tile : plan.tiles()) {
        if (result.empty() || result.back().tiles.front().position().y() != tile.position().y()) {
            Rectangle const needed = frame.needed(plan.computed(tile));
            result.push_back({{}, {needed.position().y(), bottomOf(needed)}});
        }
        result.back().tiles.push_back(tile);
    }
    return result;
}

// Bands go down the picture without a gap, as the reader wants them.
std::vector<Rows> bandsOf(std::vector<Row> const& rows) {
    std::vector<Rows> bands;
    for (Row const& row : rows) {
        Rows band = row.rows;
        if (bands.empty()) {
            band.first = 0;
        } else {
            band.first = std::clamp(band.first, bands.back().first, bands.back().end);
            band.end = std::max(band.end, bands.back().end);
        }
        bands.push_back(band);
    }
    return bands;
}

// Most filters on the CPU compute in 8 bits or in floats, and those on OpenGL all do.
Depth workingDepth(BandReader const& reader, std::string const& filter, bool onOpenGL) {
    if (reader.depth() == Depth::uint15_1 && (onOpenGL || !takesSixteenBits(createFilterNamed(filter))))
        return Depth::float32;
    return reader.depth();
}

Rectangle largestFrame(TilePlan const& plan) {
    Rectangle largest = rectangleBetween(0, 0, 0, 0);
    for (Rectangle const& tile : plan.tiles()) {
        Rectangle const computed = plan.computed(tile);
        if (pixelsOf(computed) > pixelsOf(largest))
            largest = computed;
    }
    return largest;
}

// What OpenGL has room for is for the driver to say: textures between the stages of a filter may be larger
// than its tile by far. Tiles are half as large each time until their frames are not refused. What fails for
// a single pixel, though, has another reason, which is that of the program's failure.
TilePlan planOnOpenGL(std::function<TilePlan(int)> const& planOf, TileFrame& frame, int tileSize) {
    for (bool pixelWorks = false;; tileSize /= 2) {
        try {
            TilePlan plan = planOf(tileSize);
            if (!Interrupt::requested())
                frame.tryOut(largestFrame(plan));
            return plan;
        } catch (UsageError const&) {
            // Memory does not suffice.
            if (tileSize <= smallestTile)
                throw;
        } catch (std::exception const& failure) {
            if (!pixelWorks)
                frame.tryOut(rectangleBetween(0, 0, 1, 1));
            pixelWorks = true;
            if (tileSize <= smallestTile)
                throw UsageError("Tiles of every size are refused: " + describe(failure));
        }
    }
}

std::string compressionFor(std::string const& output, BandReader const& reader) {
    std::string const compression = reader.compression();
    bool const known = compression == "zip" || compression == "lzw" || compression == "packbits";
    if (extensionOf(output) == ".exr")
        return "zip";
    return known ? compression : "none";
}

} // namespace

bool processTiles(TileOptions const& options, ORVO::OGL::Context const* context) {
    Interrupt const interrupt;
    std::size_t const memory = options.memoryLimit << 20U;
    FilterPtr const filter = filterOf(options, context);
    checkTilesWritable(options.output);
    BandReader reader(options.input);
    Picture file;
    file.profile = reader.profile();
    useProfileOfFile(*filter, file, options.values);
    Depth const depth = workingDepth(reader, options.filter, context != nullptr);
    TileFrame frame(filter, {context, reader.width(), reader.height(), reader.channels(), depth, memory / 4});
    MemoryUse use = frame.memoryUse();
    use.rowUnit = reader.rowUnit();
    use.copies = copiesToWrite(options.output, reader.channels(), frame.channels(), depth);
    auto const planOf = [&](int tileSize) {
        return TilePlan(reader.width(), reader.height(), tileSize, gridReachOf(*filter), use, memory);
    };
    TilePlan const plan = context ? planOnOpenGL(planOf, frame, options.tile) : planOf(options.tile);
    // Half as much again as one frame takes: tiles at the edges are smaller than others, and would take the
    // place of what the next tile needs.
    ORVO::Core::setImageStorageLimit(plan.frameMemory() / 2 * 3);

    std::vector<Row> const rows = rowsOf(plan, frame);
    reader.start(bandsOf(rows), depth);
    TileWriter writer(options.output, {reader.width(), reader.height(), plan.fileTile(), reader.channels(),
                                       reader.depth(), compressionFor(options.output, reader),
                                       profileOfResult(*filter, file), reader.orientation()});
    Progress progress(pixelsOf(plan.picture()));
    for (Row const& row : rows) {
        Band const& band = reader.next();
        for (Rectangle const& tile : row.tiles) {
            if (Interrupt::requested())
                return false;
            Rectangle const computed = plan.computed(tile);
            Picture result = writer.spare();
            frame.run(band, computed, result);
            writer.write(tile, computed, std::move(result));
            progress.advance(pixelsOf(tile));
        }
    }
    if (Interrupt::requested())
        return false;
    writer.finish();
    return true;
}

} // namespace example
