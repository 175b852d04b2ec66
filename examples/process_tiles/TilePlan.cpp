#include "process_tiles/TilePlan.h"

#include "common/CommandLine.h"
#include "orvo/core/math/Float.h"
#include "orvo/core/utility/SaturatingCast.h"
#include "orvo/filter_graph/FilterGraph.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <numeric>
#include <optional>
#include <string>

namespace example {

namespace {

namespace FG = ORVO::FilterGraph;

// Sums of the grid are taken by so many columns at a time, or by a part of that.
constexpr int vectorColumns = 16;

// Beyond this a step would cost more than it is good for.
constexpr int largestStep = 2048;

// Tiles become smaller than this only where nothing else helps.
constexpr int comfortableSide = 1024;

// The result that is computed, the one that waits and the one that is being written.
constexpr std::size_t resultsInFlight = 3;

// Of 16-bit floats with four channels, in the texture that is read and in that which is drawn to. The padding
// is that of the intensity axis; that of the others is less than the margin.
constexpr double cellBytes = 16.0;
constexpr double paddingCells = 9.0;

// For a pixel: more than anybody has memory for, and still a number of bytes for any picture.
constexpr double mostCells = 1e7;

int roundedUp(int value, int unit) { return (value + unit - 1) / unit * unit; }

int stepOf(float sigma) {
    if (!(sigma > 0.0F) || !std::isfinite(sigma))
        return 1;
    int best = 1;
    double smallest = 1.0;
    for (int pixels = 1; pixels <= largestStep / 4; ++pixels) {
        double const cells = pixels / static_cast<double>(sigma);
        double const error = std::round(cells) < 1.0 ? 1.0 : std::abs(cells - std::round(cells)) / cells;
        if (error < smallest) {
            smallest = error;
            best = pixels;
        }
        if (error < 1e-7)
            break;
    }
    return best;
}

int marginOf(float sigma) {
    return ORVO::saturatingCast<int>(std::ceil(4.5 * std::clamp(static_cast<double>(sigma), 0.0, 1e8)));
}

std::size_t areaOf(Rectangle const& rectangle) {
    return static_cast<std::size_t>(rectangle.extent().width()) *
           static_cast<std::size_t>(rectangle.extent().height());
}

std::size_t bytesNeeded(Rectangle const& window, Rectangle const& picture, MemoryUse const& use) {
    int const width = picture.extent().width();
    auto const rows = static_cast<std::size_t>(
        std::min(window.extent().height() + use.rowUnit - 1, picture.extent().height()));
    return 2 * rows * static_cast<std::size_t>(width) * use.file +
           areaOf(window) * (resultsInFlight * use.result + use.copies + use.work + use.kept);
}

std::optional<ORVO::float2> spatialSigmaOf(FG::IFilter& filter) {
    FG::ParameterBase const* const sigma = filter.parameter("spatialSigma");
    if (sigma && sigma->type() == FG::DataItemBase::TYPE_FLOAT2)
        return sigma->as<ORVO::float2>().value();
    if (sigma && sigma->type() == FG::DataItemBase::TYPE_FLOAT)
        return ORVO::float2(sigma->as<float>().value(), sigma->as<float>().value());
    return {};
}

// A last strip of fewer than 16 pixels belongs to the tile before it.
int longestTile(int picture, int tile) {
    int const strip = picture % tile;
    return strip < 16 ? tile + strip : tile;
}

// Every second row of tiles is walked the other way.
std::vector<Rectangle> serpentine(Rectangle const& picture, int tileWidth, int tileHeight) {
    FG::ImageDescriptor::Format const format = {3, FG::ImageDescriptor::CHANNEL_TYPE_UINT8};
    FG::Utility::Tiles tiles(FG::ImageDescriptorCPU(format, ORVO::PixelExtentInWorldSpace()), picture,
                             ORVO::ExtentInPixelSpace(tileWidth, tileHeight));
    tiles.reorderTilesAsSerpentine();
    std::vector<Rectangle> result;
    for (auto const& tile : tiles.tiles())
        result.push_back(tile->image().rect());
    return result;
}

} // namespace

int rightOf(Rectangle const& rectangle) { return rectangle.position().x() + rectangle.extent().width(); }

int bottomOf(Rectangle const& rectangle) { return rectangle.position().y() + rectangle.extent().height(); }

Rectangle rectangleBetween(int left, int top, int right, int bottom) {
    return {ORVO::PositionInPixelSpace(left, top), ORVO::ExtentInPixelSpace(right - left, bottom - top)};
}

Rectangle commonPart(Rectangle const& one, Rectangle const& other) {
    int const left = std::max(one.position().x(), other.position().x());
    int const top = std::max(one.position().y(), other.position().y());
    int const right = std::max(left, std::min(rightOf(one), rightOf(other)));
    int const bottom = std::max(top, std::min(bottomOf(one), bottomOf(other)));
    return rectangleBetween(left, top, right, bottom);
}

GridReach gridReachOf(FG::IFilter& filter) {
    auto const sigma = spatialSigmaOf(filter);
    return sigma ? gridReachOf((*sigma)[0], (*sigma)[1]) : GridReach();
}

GridReach gridReachOf(float sigmaX, float sigmaY) {
    GridReach reach;
    reach.marginX = marginOf(sigmaX);
    reach.marginY = marginOf(sigmaY);
    int const columns = stepOf(sigmaX);
    int const whole = std::lcm(columns, vectorColumns);
    reach.stepX = whole <= largestStep ? whole : columns;
    reach.stepY = stepOf(sigmaY);
    return reach;
}

std::size_t gridTexturesOf(FG::IFilter& filter) {
    auto const sigma = spatialSigmaOf(filter);
    FG::ParameterBase const* const range = filter.parameter("rangeSigma");
    if (!sigma || !range || range->type() != FG::DataItemBase::TYPE_FLOAT)
        return 0;
    return gridTexturesOf((*sigma)[0], (*sigma)[1], range->as<float>().value());
}

std::size_t gridTexturesOf(float sigmaX, float sigmaY, float rangeSigma) {
    double const area = static_cast<double>(sigmaX) * static_cast<double>(sigmaY);
    if (!(area > 0.0) || !(rangeSigma > 0.0F))
        return 0;
    double const cells = (1.0 / static_cast<double>(rangeSigma) + paddingCells) / area;
    return static_cast<std::size_t>(std::ceil(std::min(cells, mostCells) * cellBytes));
}

TilePlan::TilePlan(int width, int height, int tileSize, GridReach const& reach, MemoryUse const& use,
                   std::size_t memory)
    : width_(width),
      height_(height),
      reach_(reach),
      fileTile_(roundedUp(std::min(tileSize, 256), vectorColumns)) {
    int tileWidth = roundedUp(std::min(tileSize, roundedUp(width, fileTile_)), fileTile_);
    int tileHeight = roundedUp(std::min(tileSize, roundedUp(height, fileTile_)), fileTile_);
    // The worst case: a tile between others, farthest from the grid's corners. What the frame reads beyond
    // what it computes is less than half the margin.
    auto const window = [&] {
        int const right = longestTile(width, tileWidth) + 2 * reach.marginX + reach.stepX + vectorColumns;
        int const bottom = longestTile(height, tileHeight) + 3 * reach.marginY + reach.stepY;
        return commonPart(rectangleBetween(0, 0, right, bottom), picture());
    };
    auto const needed = [&] { return use.fixed + bytesNeeded(window(), picture(), use); };
    auto const shorten = [&](int& side, int least) {
        while (needed() > memory && side > std::max(least, fileTile_))
            side -= fileTile_;
    };
    // Rows cost the most, since they are as long as the picture is wide; but thin tiles are nearly all
    // margin.
    for (int const least : {comfortableSide, 0}) {
        shorten(tileHeight, least);
        shorten(tileWidth, least);
    }
    if (needed() > memory)
        throw UsageError("The memory does not suffice: --memory-limit has to be " +
                         std::to_string((needed() >> 20U) + 1) + " or more" +
                         (fileTile_ > vectorColumns ? ", or --tile smaller" : ""));
    tiles_ = serpentine(picture(), tileWidth, tileHeight);
    frameMemory_ = areaOf(window()) * use.work;
}

Rectangle TilePlan::computed(Rectangle const& tile) const {
    if (reach_.marginX == 0 && reach_.marginY == 0)
        return tile;
    auto const roundedDown = [](int value, int step) { return std::max(value, 0) / step * step; };
    int const right = rightOf(tile) + std::min(reach_.marginX, width_);
    int const bottom = bottomOf(tile) + std::min(reach_.marginY, height_);
    Rectangle const window = rectangleBetween(roundedDown(tile.position().x() - reach_.marginX, reach_.stepX),
                                              roundedDown(tile.position().y() - reach_.marginY, reach_.stepY),
                                              roundedUp(right, vectorColumns), bottom);
    return commonPart(window, picture());
}

} // namespace example
