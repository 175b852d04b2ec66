// Pictures through tiles: the same as in one piece, on both roads, from and into every kind of file.
#include "process_tiles/TileRunner.h"

#include "apply_filter/FilterList.h"
#include "apply_filter/FilterValues.h"
#include "apply_filter/FrameRunner.h"
#include "common/Engine.h"
#include "common/Picture.h"
#include "common/PictureIO.h"
#include "process_tiles/TileFrame.h"
#include "tests/examples/support/PictureDifference.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <random>
#include <string>
#include <utility>
#include <vector>

#include <unistd.h>

namespace example {
namespace {

namespace fs = std::filesystem;

// Slopes, edges and noise, which are the same on every run.
Picture scene(std::size_t width, std::size_t height, std::size_t channels, Depth depth) {
    Picture picture(width, height, channels, depth);
    std::mt19937 random(7);
    for (std::size_t i = 0; i < width * height * channels; ++i) {
        std::size_t const x = i / channels % width;
        std::size_t const y = i / channels / width;
        double const slope = 0.5 + 0.3 * std::sin(0.05 * static_cast<double>(x + i % channels * 20)) *
                                       std::cos(0.04 * static_cast<double>(y));
        double const edge = (x / 37 + y / 29) % 2 == 0 ? 0.12 : -0.12;
        double const noise = static_cast<double>(random() % 1000) / 1000.0 * 0.08 - 0.04;
        double const value = std::clamp(slope + edge + noise, 0.0, 1.0);
        if (depth == Depth::uint8)
            picture.pixels[i] = static_cast<unsigned char>(std::lround(255.0 * value));
        else if (depth == Depth::uint15_1)
            reinterpret_cast<std::uint16_t*>(picture.pixels.data())[i] =
                static_cast<std::uint16_t>(std::lround(32768.0 * value));
        else
            reinterpret_cast<float*>(picture.pixels.data())[i] = static_cast<float>(value);
    }
    return picture;
}

class ProcessTiles : public testing::Test {
protected:
    ProcessTiles() { fs::create_directories(folder_); }
    ~ProcessTiles() override { fs::remove_all(folder_); }

    std::string file(std::string const& name) const { return (folder_ / name).string(); }
    ORVO::OGL::Context const* context() const { return engine_.context.get(); }

    TileOptions options(std::string const& filter, std::string const& input, std::string const& output,
                        std::vector<std::pair<std::string, std::string>> const& values = {}) const {
        TileOptions result;
        result.filter = filter;
        result.values = values;
        result.tile = 64;
        result.input = input;
        result.output = output;
        return result;
    }

    Picture inOnePiece(TileOptions const& what, ORVO::OGL::Context const* where, Picture const& file) const {
        auto const filter = createFilterNamed(what.filter);
        for (auto const& [name, value] : what.values)
            EXPECT_EQ(setValue(*filter, name, value), "");
        Picture const source = widenedToColour(file);
        Picture result(source.width, source.height, source.channels, source.depth);
        EXPECT_TRUE(runFrames(filter, source, result, {where, 1, false}));
        return file.channels < 3 ? reducedToGrey(result) : result;
    }

    // How far the picture through tiles is from that in one piece.
    int difference(TileOptions what, ORVO::OGL::Context const* where, Picture const& picture) const {
        what.input = file("in.tif");
        what.output = file("out.tif");
        writePicture(what.input, picture);
        EXPECT_TRUE(processTiles(what, where));
        return largestDifference(readPicture(what.output, picture.depth), inOnePiece(what, where, picture));
    }

private:
    Engine engine_{makeContext};
    fs::path folder_ = fs::temp_directory_path() / ("process_tiles_test." + std::to_string(::getpid()));
};

TEST_F(ProcessTiles, HasNoSeamsOnTheCPU) {
    Picture const picture = scene(301, 219, 3, Depth::uint8);
    for (char const* const sigma : {"4,4", "10,6", "2.5,3"})
        for (char const* const colorize : {"false", "true"})
            EXPECT_EQ(difference(options("FastBilateralBlur", "", "",
                                         {{"spatialSigma", sigma}, {"colorize", colorize}}),
                                 nullptr, picture),
                      0)
                << sigma << ' ' << colorize;
}

TEST_F(ProcessTiles, HasAlmostNoSeamsWhereCellsAreNoWholeNumberOfPixels) {
    // The corners of the grids are up to a thousandth of a cell apart, and sums are taken in another order.
    Picture const picture = scene(301, 219, 3, Depth::uint8);
    for (char const* const sigma : {"7.3,3.1", "3.14159,2.71828"})
        EXPECT_LE(
            difference(options("FastBilateralBlur", "", "", {{"spatialSigma", sigma}}), nullptr, picture), 1)
            << sigma;
}

TEST_F(ProcessTiles, HasNoSeamsOnOpenGLWhereSigmasAreExact) {
    // With a power of two every place in the grid is exact; otherwise the shaders multiply by a rounded
    // inverse, whose error depends on how far the tile's corner is, and 8-bit results differ by a step at
    // most.
    Picture const picture = scene(301, 219, 3, Depth::uint8);
    EXPECT_EQ(difference(options("FastBilateralBlur", "", "", {{"spatialSigma", "4,2"}}), context(), picture),
              0);
    EXPECT_LE(
        difference(options("FastBilateralBlur", "", "", {{"spatialSigma", "5,3"}, {"colorize", "true"}}),
                   context(), picture),
        2);
}

TEST_F(ProcessTiles, TakesEveryNumberOfChannels) {
    for (std::size_t channels = 1; channels <= 4; ++channels) {
        Picture const picture = scene(150, 90, channels, Depth::uint8);
        EXPECT_EQ(
            difference(options("FastBilateralBlur", "", "", {{"spatialSigma", "2,2"}}), nullptr, picture), 0)
            << channels;
        EXPECT_EQ(difference(options("scaleDown4channel", "", ""), context(), picture), 0) << channels;
    }
}

TEST_F(ProcessTiles, KeepsTheDepthOfTheFile) {
    // Ordinary values alone: the intensity axis is then the same for every tile.
    Picture const picture = scene(150, 90, 3, Depth::float32);
    TileOptions const what =
        options("FastBilateralBlur", file("in.exr"), file("out.exr"), {{"spatialSigma", "4,4"}});
    writePicture(what.input, picture);
    ASSERT_TRUE(processTiles(what, nullptr));
    EXPECT_EQ(depthOfFile(what.output), Depth::float32);
    EXPECT_EQ(readPicture(what.output, Depth::float32).pixels, inOnePiece(what, nullptr, picture).pixels);

    writePicture(file("in.tif"), Picture(40, 40, 3, Depth::uint15_1));
    ASSERT_TRUE(processTiles(options("FastBilateralBlur", file("in.tif"), file("out.tif")), nullptr));
    EXPECT_EQ(depthOfFile(file("out.tif")), Depth::uint15_1);
}

// Colour transforms on the CPU take no floats.
TEST_F(ProcessTiles, TransformsTheColoursOfSixteenBits) {
    std::vector<std::pair<std::string, std::string>> const toP3 = {{"srcProfile", "sRGB"},
                                                                   {"dstProfile", "P3"}};
    for (std::size_t const channels : {1U, 3U, 4U}) {
        Picture const picture = scene(150, 91, channels, Depth::uint15_1);
        TileOptions const what = options("ColorspaceTransformer", "", "", toP3);
        EXPECT_EQ(difference(what, nullptr, picture), 0) << channels;
        EXPECT_EQ(depthOfFile(file("out.tif")), Depth::uint15_1);
        // Unless nothing was done.
        EXPECT_TRUE(channels == 1 || readPicture(file("out.tif"), picture.depth).pixels != picture.pixels);

        ASSERT_TRUE(
            processTiles(options("ColorspaceTransformer", file("in.tif"), file("gl.tif"), toP3), context()));
        EXPECT_EQ(depthOfFile(file("gl.tif")), Depth::uint15_1);
        Picture const inFloats = readPicture(file("in.tif"), Depth::float32);
        auto const wanted = pictureToFloats(inOnePiece(what, context(), inFloats));
        auto const got = pictureToFloats(readPicture(file("gl.tif"), Depth::float32));
        ASSERT_EQ(got.size(), wanted.size());
        // In a texture of another size a colour between two 16-bit floats may go to the other one, a step of
        // 1/2048 at most; the file takes the nearest of its values.
        for (std::size_t i = 0; i < got.size(); ++i)
            ASSERT_NEAR(got[i], std::clamp(wanted[i], 0.0F, 1.0F), 1.0F / 2048.0F + 0.51F / 65535.0F)
                << channels << " at " << i;
    }
}

Picture columnsOf(Picture const& picture, std::size_t first, std::size_t end) {
    Picture part(end - first, picture.height, picture.channels, picture.depth);
    std::size_t const pixel = picture.rowBytes() / picture.width;
    for (std::size_t y = 0; y < picture.height; ++y)
        std::copy_n(&picture.pixels[y * picture.rowBytes() + first * pixel], part.rowBytes(),
                    &part.pixels[y * part.rowBytes()]);
    return part;
}

TEST_F(ProcessTiles, TakesSmallerTilesWhereOpenGLHasNoTexturesForMore) {
    Picture const picture = scene(2100, 6, 3, Depth::uint8);
    for (char const* const sigma : {"1,1", "0.5,0.5"}) {
        TileOptions what =
            options("FastBilateralBlur", file("in.tif"), file("out.tif"), {{"spatialSigma", sigma}});
        what.tile = TileOptions().tile;
        what.memoryLimit = 4096;
        writePicture(what.input, picture);
        ASSERT_TRUE(processTiles(what, context()));
        Picture const result = readPicture(what.output, Depth::uint8);
        // Parts that OpenGL takes in one piece, on corners of the grid. They are right but for the margins,
        // which 5 columns are enough for.
        for (std::size_t const first : {0U, 960U, 1888U}) {
            std::size_t const end = std::min<std::size_t>(first + 212, picture.width);
            Picture const part = inOnePiece(what, context(), columnsOf(picture, first, end));
            std::size_t const left = first == 0 ? 0 : 5;
            std::size_t const right = end - first - (end == picture.width ? 0 : 5);
            EXPECT_EQ(columnsOf(result, first + left, first + right).pixels,
                      columnsOf(part, left, right).pixels)
                << sigma << " from " << first;
        }
    }
    // 15 cells of intensity for each of 4,200 across: more than drivers have texels.
    EXPECT_ANY_THROW(
        inOnePiece(options("FastBilateralBlur", "", "", {{"spatialSigma", "0.5,0.5"}}), context(), picture));
}

TEST_F(ProcessTiles, IsRefusedWhereOpenGLHasNoTexturesForAnyTile) {
    TileOptions what = options("FastBilateralBlur", file("in.tif"), file("out.tif"),
                               {{"spatialSigma", "0.1,0.1"}, {"rangeSigma", "0.01"}});
    what.memoryLimit = 4096;
    writePicture(what.input, scene(100, 4, 3, Depth::uint8));
    try {
        // A tile of 16 pixels and its margins are 48, of 10 cells each, and each of those is 109 of
        // intensity.
        static_cast<void>(processTiles(what, context()));
        ADD_FAILURE() << "accepted";
    } catch (UsageError const& failure) {
        EXPECT_EQ(std::string(failure.what()).find("Tiles of every size are refused: "), 0U)
            << failure.what();
    }
    EXPECT_FALSE(fs::exists(what.output));
}

// Wider than any driver's textures are.
TEST_F(ProcessTiles, GoesOnAfterTilesThatOpenGLRefuses) {
    Picture const picture = scene(std::size_t(1) << 18U, 2, 3, Depth::uint8);
    TileFrame frame(createFilterNamed("scaleDown4channel"),
                    {context(), 1 << 18, 2, 3, Depth::uint8, std::size_t(1) << 30U});
    for (int refusals = 1; refusals <= 3; ++refusals) {
        for (int i = 0; i < refusals; ++i)
            EXPECT_ANY_THROW(frame.tryOut(rectangleBetween(0, 0, 1 << 18, 2)));
        frame.tryOut(rectangleBetween(0, 0, 64, 2));
    }
    Band const band = {0, picture};
    Picture result;
    frame.run(band, rectangleBetween(32, 0, 96, 2), result);
    Picture const part = columnsOf(picture, 32, 96);
    EXPECT_EQ(withoutAlpha(result).pixels,
              inOnePiece(options("scaleDown4channel", "", ""), context(), part).pixels);
}

TEST_F(ProcessTiles, CompressesEXRWhateverItsNameLooksLike) {
    writePicture(file("in.tif"), scene(40, 30, 3, Depth::uint8));
    for (char const* const name : {"out.exr", "out.EXR"}) {
        ASSERT_TRUE(processTiles(options("RGBToLABCPU", file("in.tif"), file(name)), nullptr));
        EXPECT_EQ(OIIO::ImageInput::open(file(name))->spec().get_string_attribute("compression"), "zip")
            << name;
    }
}

// A compressed TIFF file of strips, from floats.
void writeStrips(std::string const& path, Picture const& picture, OIIO::TypeDesc const& type, int rows) {
    OIIO::ImageSpec spec(static_cast<int>(picture.width), static_cast<int>(picture.height),
                         static_cast<int>(picture.channels), type);
    spec["tiff:RowsPerStrip"] = rows;
    spec["compression"] = "zip";
    auto const output = OIIO::ImageOutput::create(path);
    ASSERT_TRUE(output && output->open(path, spec) &&
                output->write_image(OIIO::TypeDesc::FLOAT, picture.pixels.data()) && output->close());
}

TEST_F(ProcessTiles, ReadsStripsOfEveryTypeAndHeight) {
    Picture const picture = scene(97, 133, 3, Depth::float32);
    TileOptions const what =
        options("FastBilateralBlur", file("in.tif"), file("out.tif"), {{"spatialSigma", "2,2"}});
    for (OIIO::TypeDesc const type :
         {OIIO::TypeDesc::UINT8, OIIO::TypeDesc::UINT16, OIIO::TypeDesc::FLOAT, OIIO::TypeDesc::DOUBLE}) {
        bool const bytes = type == OIIO::TypeDesc::UINT8;
        for (int const rows : {1, 7, 32, 133}) {
            writeStrips(what.input, picture, type, rows);
            ASSERT_TRUE(processTiles(what, nullptr));
            Depth const depth = bytes ? Depth::uint8 : Depth::float32;
            auto const got = pictureToFloats(readPicture(what.output, depth));
            auto const wanted = pictureToFloats(inOnePiece(what, nullptr, readPicture(what.input, depth)));
            // A file of 16 bits takes the nearest of its values.
            float const step = type == OIIO::TypeDesc::UINT16 ? 0.51F / 65535.0F : 0.0F;
            ASSERT_EQ(got.size(), wanted.size());
            for (std::size_t i = 0; i < got.size(); ++i)
                ASSERT_NEAR(got[i], wanted[i], step) << type << " in strips of " << rows << " at " << i;
        }
    }
}

TEST_F(ProcessTiles, TakesPicturesThatAreNarrowerThanATile) {
    for (auto const& [width, height] : {std::pair(1, 1), {5, 300}, {300, 5}, {17, 16}, {64, 79}}) {
        Picture const picture =
            scene(static_cast<std::size_t>(width), static_cast<std::size_t>(height), 3, Depth::uint8);
        TileOptions const what = options("FastBilateralBlur", "", "", {{"spatialSigma", "2,2"}});
        EXPECT_EQ(difference(what, nullptr, picture), 0) << width << " x " << height;
        EXPECT_EQ(difference(what, context(), picture), 0) << width << " x " << height;
    }
}

TEST_F(ProcessTiles, ReadsTiledFilesAndAssociatedAlpha) {
    Picture const picture = scene(150, 133, 4, Depth::uint8);
    writePicture(file("in.tif"), picture);
    // What was written in tiles is read in tiles.
    TileOptions what = options("RGBToLABCPU", file("in.tif"), file("tiled.tif"));
    ASSERT_TRUE(processTiles(what, nullptr));
    EXPECT_EQ(OIIO::ImageInput::open(what.output)->spec().tile_width, 64);
    what.input = what.output;
    what.output = file("again.tif");
    ASSERT_TRUE(processTiles(what, nullptr));
    Picture const once = readPicture(what.input, Depth::uint8);
    EXPECT_EQ(readPicture(what.output, Depth::uint8).pixels, inOnePiece(what, nullptr, once).pixels);

    // EXR holds colours with alpha multiplied in; the filter sees them without.
    what = options("LABToRGBCPU", file("in.exr"), file("out.exr"));
    Picture floats = scene(90, 70, 4, Depth::float32);
    writePicture(what.input, floats);
    floats = readPicture(what.input, Depth::float32);
    ASSERT_TRUE(processTiles(what, nullptr));
    Picture const result = readPicture(what.output, Depth::float32);
    Picture const expected = inOnePiece(what, nullptr, floats);
    auto const* const got = reinterpret_cast<float const*>(result.pixels.data());
    auto const* const wanted = reinterpret_cast<float const*>(expected.pixels.data());
    for (std::size_t i = 0; i < 4 * 90 * 70; ++i)
        ASSERT_NEAR(got[i], wanted[i], 1e-5F * std::max(1.0F, std::abs(wanted[i]))) << i;
}

TEST_F(ProcessTiles, ComesToTheSameWithEverySizeOfTile) {
    Picture const picture = scene(301, 219, 3, Depth::uint8);
    for (int const size : {16, 100, 4096}) {
        TileOptions what = options("FastBilateralBlur", "", "", {{"spatialSigma", "3,3"}});
        what.tile = size;
        EXPECT_EQ(difference(what, nullptr, picture), 0) << size;
    }
}

TEST_F(ProcessTiles, LeavesNothingAfterAFailure) {
    writePicture(file("in.tif"), scene(300, 300, 3, Depth::uint8));
    fs::resize_file(file("in.tif"), fs::file_size(file("in.tif")) / 2);
    std::ofstream(file("out.tif")) << "what was there";
    EXPECT_THROW(static_cast<void>(
                     processTiles(options("FastBilateralBlur", file("in.tif"), file("out.tif")), nullptr)),
                 PictureError);
    EXPECT_EQ(fs::file_size(file("out.tif")), 14U);
    EXPECT_EQ(std::distance(fs::directory_iterator(fs::path(file("in.tif")).parent_path()),
                            fs::directory_iterator()),
              2);
}

} // namespace
} // namespace example
