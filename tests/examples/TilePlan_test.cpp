// How process_tiles cuts a picture, its command line and its progress bar.
#include "process_tiles/TilePlan.h"

#include "common/CommandLine.h"
#include "process_tiles/Progress.h"
#include "process_tiles/TileOptions.h"
#include "process_tiles/TileWriter.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <initializer_list>
#include <string>
#include <vector>

namespace example {
namespace {

constexpr std::size_t plenty = std::size_t(1) << 40U;
constexpr MemoryUse rgb8 = {std::size_t(140) << 20U, 3, 3, 16, 16};

std::string tileRefusal(std::initializer_list<char const*> arguments) {
    std::vector<char const*> all{"process_tiles"};
    all.insert(all.end(), arguments);
    try {
        static_cast<void>(parseTileOptions(static_cast<int>(all.size()), all.data()));
    } catch (UsageError const& failure) {
        return failure.what();
    }
    return "accepted";
}

TEST(TilePlan, StepsAreWholeNumbersOfCellsAndOfVectors) {
    struct Row {
        float sigma;
        int margin;
        int stepX;
        int stepY;
    };
    for (Row const& row : {Row{10.0F, 45, 80, 10}, Row{8.0F, 36, 16, 8}, Row{2.5F, 12, 80, 5},
                           Row{1.0F, 5, 16, 1}, Row{0.5F, 3, 16, 1}, Row{37.0F, 167, 592, 37},
                           Row{7.3F, 33, 1168, 73}, Row{100.0F, 450, 400, 100}}) {
        GridReach const reach = gridReachOf(row.sigma, row.sigma);
        EXPECT_EQ(reach.marginX, row.margin) << row.sigma;
        EXPECT_EQ(reach.marginY, row.margin) << row.sigma;
        EXPECT_EQ(reach.stepX, row.stepX) << row.sigma;
        EXPECT_EQ(reach.stepY, row.stepY) << row.sigma;
    }
    // 255 * 16 columns would be too many: the grids agree all the same.
    EXPECT_EQ(gridReachOf(51.0F, 1.0F).stepX, 816);
    EXPECT_EQ(gridReachOf(255.0F, 1.0F).stepX, 255);
    for (float const sigma : {0.0F, -1.0F}) {
        EXPECT_EQ(gridReachOf(sigma, sigma).marginX, 0);
        EXPECT_EQ(gridReachOf(sigma, sigma).stepX, 16);
        EXPECT_EQ(gridReachOf(sigma, sigma).stepY, 1);
    }
}

TEST(TilePlan, GridsTakeSixteenBytesACell) {
    // 1 / 0.25 and 9 cells of intensity: for every pixel, for every fourth one, and for each four times four.
    EXPECT_EQ(gridTexturesOf(1.0F, 1.0F, 0.25F), 13U * 16U);
    EXPECT_EQ(gridTexturesOf(2.0F, 2.0F, 0.25F), 13U * 16U / 4U);
    EXPECT_EQ(gridTexturesOf(0.5F, 0.5F, 0.25F), 13U * 16U * 4U);
    // A part of a byte counts as one: 10 * 16 / 10,000.
    EXPECT_EQ(gridTexturesOf(100.0F, 100.0F, 1.0F), 1U);
    EXPECT_EQ(gridTexturesOf(1e-30F, 1e-30F, 1.0F), 160'000'000U);
    EXPECT_EQ(gridTexturesOf(0.0F, 1.0F, 1.0F), 0U);
    EXPECT_EQ(gridTexturesOf(1.0F, 1.0F, 0.0F), 0U);
}

TEST(TilePlan, CopiesToWriteAreCounted) {
    // Nothing, where a picture goes into the file as it is.
    EXPECT_EQ(copiesToWrite("a.tif", 3, 3, Depth::uint8), 0U);
    EXPECT_EQ(copiesToWrite("a.exr", 3, 3, Depth::float32), 0U);
    // Without alpha; as grey, with the way over three channels; in floats.
    EXPECT_EQ(copiesToWrite("a.tif", 3, 4, Depth::float32), 12U);
    EXPECT_EQ(copiesToWrite("a.tif", 1, 3, Depth::uint8), 1U);
    EXPECT_EQ(copiesToWrite("a.tif", 1, 4, Depth::float32), 12U + 4U);
    EXPECT_EQ(copiesToWrite("a.EXR", 4, 4, Depth::uint8), 16U);
    EXPECT_EQ(copiesToWrite("a.tif", 3, 3, Depth::uint15_1), 12U);
    EXPECT_EQ(copiesToWrite("a.exr", 2, 4, Depth::float32), 8U + 8U);

    // 1024 x 1024 pixels of 2 * 3 + 3 * 3 + 32 bytes are 47 MiB, and copies of 4 bytes 4 MiB more.
    MemoryUse use = rgb8;
    std::size_t const memory = std::size_t(140 + 48) << 20U;
    EXPECT_EQ(TilePlan(1024, 1024, 1024, {}, use, memory).tiles().size(), 1U);
    use.copies = 4;
    EXPECT_GT(TilePlan(1024, 1024, 1024, {}, use, memory).tiles().size(), 1U);
}

TEST(TilePlan, TilesBeginOnTheEdgesOfFileTilesAndCoverThePicture) {
    for (int const size : {16, 100, 300, 2048}) {
        TilePlan const plan(700, 333, size, {}, rgb8, plenty);
        EXPECT_EQ(plan.fileTile() % 16, 0);
        EXPECT_LE(plan.fileTile(), 256);
        long pixels = 0;
        for (Rectangle const& tile : plan.tiles()) {
            EXPECT_EQ(tile.position().x() % plan.fileTile(), 0);
            EXPECT_EQ(tile.position().y() % plan.fileTile(), 0);
            EXPECT_TRUE(rightOf(tile) == 700 || rightOf(tile) % plan.fileTile() == 0);
            EXPECT_TRUE(bottomOf(tile) == 333 || bottomOf(tile) % plan.fileTile() == 0);
            EXPECT_EQ(plan.computed(tile), tile);
            pixels += static_cast<long>(tile.extent().width()) * tile.extent().height();
        }
        EXPECT_EQ(pixels, 700 * 333);
    }
}

TEST(TilePlan, WalksToANeighbourAtEveryStep) {
    TilePlan const plan(300, 300, 96, {}, rgb8, plenty);
    std::vector<std::pair<int, int>> places;
    for (Rectangle const& tile : plan.tiles())
        places.emplace_back(tile.position().x(), tile.position().y());
    // A last strip of 12 pixels belongs to its neighbour.
    EXPECT_EQ(places,
              (std::vector<std::pair<int, int>>{
                  {0, 0}, {96, 0}, {192, 0}, {192, 96}, {96, 96}, {0, 96}, {0, 192}, {96, 192}, {192, 192}}));
}

TEST(TilePlan, ComputesMoreThanTheTileFromACornerOfTheGrid) {
    TilePlan const plan(1000, 900, 256, gridReachOf(10.0F, 10.0F), rgb8, plenty);
    // 45 more on each side; columns from a multiple of 80 to one of 16, rows from a multiple of 10.
    EXPECT_EQ(plan.computed(rectangleBetween(256, 256, 512, 512)), rectangleBetween(160, 210, 560, 557));
    EXPECT_EQ(plan.computed(rectangleBetween(0, 0, 256, 256)), rectangleBetween(0, 0, 304, 301));
    EXPECT_EQ(plan.computed(rectangleBetween(768, 768, 1000, 900)), rectangleBetween(720, 720, 1000, 900));
}

TEST(TilePlan, ShortensTilesUntilTheyFitIntoMemory) {
    auto const heightWith = [](std::size_t mebibytes) {
        TilePlan const plan(30000, 20000, 2048, gridReachOf(10.0F, 10.0F), rgb8, mebibytes << 20U);
        return plan.tiles().front().extent().height();
    };
    EXPECT_EQ(heightWith(4096), 2048);
    int const height = heightWith(512);
    EXPECT_LT(height, 2048);
    EXPECT_GE(height, 1024);
    EXPECT_LT(heightWith(320), height);
    // The bands of whole rows fit, but not the frame of a tile that is 2048 pixels wide: one of 1280 takes
    // 1169 rows of 2 * 90,000 + 1466 * 848 bytes, 1587 MiB.
    MemoryUse const costly = {0, 3, 16, 400, 400};
    TilePlan const plan(30000, 20000, 2048, gridReachOf(10.0F, 10.0F), costly, std::size_t(1600) << 20U);
    EXPECT_EQ(plan.tiles().front().extent(), ORVO::ExtentInPixelSpace(1280, 1024));
    // Read by 256 rows, 255 more have to be held twice: 44 MiB, for which 1600 do not suffice.
    MemoryUse const byTiles = {0, 3, 16, 400, 400, 256};
    TilePlan const planByTiles(30000, 20000, 2048, gridReachOf(10.0F, 10.0F), byTiles,
                               std::size_t(1600) << 20U);
    EXPECT_EQ(planByTiles.tiles().front().extent(), ORVO::ExtentInPixelSpace(1024, 1024));
    try {
        heightWith(141);
        FAIL() << "141 MiB suffice";
    } catch (UsageError const& failure) {
        EXPECT_NE(std::string(failure.what()).find("The memory does not suffice: --memory-limit has to be "),
                  std::string::npos);
    }
}

TEST(TilePlan, CommonPartsMayBeEmpty) {
    Rectangle const one = rectangleBetween(0, 0, 10, 10);
    EXPECT_EQ(commonPart(one, rectangleBetween(4, -5, 20, 6)), rectangleBetween(4, 0, 10, 6));
    EXPECT_EQ(commonPart(one, rectangleBetween(12, 3, 20, 6)).extent(), ORVO::ExtentInPixelSpace(0, 3));
}

TEST(TileOptions, ReadsEveryOption) {
    char const* const arguments[] = {
        "process_tiles", "--filter",       "F",  "--set",     "a=1,2", "--target", "gl",     "--tile",
        "640",           "--memory-limit", "77", "--threads", "3",     "in.tif",   "out.exr"};
    TileOptions const options = parseTileOptions(15, arguments);
    EXPECT_EQ(options.filter, "F");
    ASSERT_EQ(options.values.size(), 1U);
    EXPECT_EQ(options.values[0], std::make_pair(std::string("a"), std::string("1,2")));
    EXPECT_EQ(options.target, Target::gl);
    EXPECT_EQ(options.tile, 640);
    EXPECT_EQ(options.memoryLimit, 77U);
    EXPECT_EQ(options.threads, 3U);
    EXPECT_EQ(options.input, "in.tif");
    EXPECT_EQ(options.output, "out.exr");
}

TEST(TileOptions, RefusesWithOneLine) {
    EXPECT_EQ(tileRefusal({"--help"}), "accepted");
    EXPECT_EQ(tileRefusal({"in", "out"}), "--filter is missing (apply_filter --list shows the filters)");
    EXPECT_EQ(tileRefusal({"--filter", "F", "in"}), "An input and an output file are needed");
    EXPECT_EQ(tileRefusal({"--filter"}), "--filter needs a value");
    EXPECT_EQ(tileRefusal({"--wrong", "1"}), "Unknown option --wrong (--help shows the options)");
    EXPECT_EQ(tileRefusal({"--tile", "0"}), "--tile needs a whole number of 1 or more, not \"0\"");
    EXPECT_EQ(tileRefusal({"--memory-limit", "x"}),
              "--memory-limit needs a whole number of 1 or more, not \"x\"");
    EXPECT_EQ(tileRefusal({"--filter", "F", "--memory-limit", "17592186044415", "in", "out"}), "accepted");
    EXPECT_EQ(tileRefusal({"--memory-limit", "17592186044416"}),
              "--memory-limit is too large: 17592186044416");
    EXPECT_EQ(tileRefusal({"--threads", "-1"}), "--threads needs a whole number of 1 or more, not \"-1\"");
    EXPECT_EQ(tileRefusal({"--target", "gpu"}), "--target is cpu or gl, not \"gpu\"");
    EXPECT_EQ(tileRefusal({"--set", "a"}), "--set needs NAME=VALUE, not \"a\"");
}

TEST(Progress, ShowsHowMuchIsDoneAndTheTimeLeft) {
    std::string const empty(40, '.');
    EXPECT_EQ(Progress::line(0, 100, 3.0), "[" + empty + "]   0 %");
    EXPECT_EQ(Progress::line(25, 100, 20.0),
              "[" + std::string(10, '#') + std::string(30, '.') + "]  25 %, 1:00 left");
    EXPECT_EQ(Progress::line(1, 100, 60.0), "[" + empty + "]   1 %, 1:39:00 left");
    EXPECT_EQ(Progress::line(100, 100, 7.0), "[" + std::string(40, '#') + "] 100 %, 0:00 left");
    EXPECT_EQ(Progress::line(0, 0, 0.0), "[" + std::string(40, '#') + "] 100 %");
}

} // namespace
} // namespace example
