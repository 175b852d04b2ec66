// What becomes of the ICC profile that stands in a file.
#include "apply_filter/FileProfile.h"

#include "apply_filter/FilterList.h"
#include "common/Engine.h"
#include "common/Picture.h"
#include "process_tiles/TileRunner.h"
#include "tests/examples/support/PictureDifference.h"

#include <gtest/gtest.h>
#include <lcms2.h>

#include <filesystem>
#include <string>
#include <utility>
#include <vector>

namespace example {
namespace {

namespace fs = std::filesystem;

class FileProfile : public testing::Test {
protected:
    FileProfile() { fs::create_directories(folder_); }
    ~FileProfile() override { fs::remove_all(folder_); }

    std::string file(std::string const& name) const { return (folder_ / name).string(); }

    // Every red with every green, in a file of its own.
    static Picture colours(std::size_t channels, std::vector<unsigned char> profile) {
        Picture picture(64, 64, channels, Depth::uint8);
        for (std::size_t i = 0; i < picture.pixels.size(); ++i) {
            std::size_t const pixel = i / channels;
            std::size_t const value = i % channels == 0 ? pixel % 64 : i % channels == 1 ? pixel / 64 : 20;
            picture.pixels[i] = static_cast<unsigned char>(4 * value);
        }
        picture.profile = std::move(profile);
        return picture;
    }

    static std::vector<unsigned char> sRGB() { return bytesOf(cmsCreate_sRGBProfile()); }
    static std::vector<unsigned char> grey() {
        cmsToneCurve* const curve = cmsBuildGamma(nullptr, 2.2);
        cmsHPROFILE const profile = cmsCreateGrayProfile(cmsD50_xyY(), curve);
        cmsFreeToneCurve(curve);
        return bytesOf(profile);
    }

    Picture throughTiles(std::string const& filter,
                         std::vector<std::pair<std::string, std::string>> const& values,
                         Picture const& picture) const {
        TileOptions options;
        options.filter = filter;
        options.values = values;
        options.input = file("in.tif");
        options.output = file("out.tif");
        writePicture(options.input, picture);
        EXPECT_TRUE(processTiles(options, nullptr));
        return readPicture(options.output, Depth::uint8);
    }

private:
    static std::vector<unsigned char> bytesOf(cmsHPROFILE profile) {
        cmsUInt32Number size = 0;
        cmsSaveProfileToMem(profile, nullptr, &size);
        std::vector<unsigned char> bytes(size);
        cmsSaveProfileToMem(profile, bytes.data(), &size);
        cmsCloseProfile(profile);
        return bytes;
    }

    Engine engine_{noContext};
    fs::path folder_ = fs::temp_directory_path() / "orvo-file-profile";
};

TEST_F(FileProfile, StandsInTheFileThatIsWritten) {
    for (char const* const name : {"a.png", "a.tif", "a.jpg"}) {
        writePicture(file(name), colours(3, sRGB()));
        EXPECT_EQ(readPicture(file(name), Depth::uint8).profile, sRGB()) << name;
        writePicture(file(name), colours(1, grey()));
        EXPECT_EQ(readPicture(file(name), Depth::uint8).profile, grey()) << name;
    }
    writePicture(file("a.exr"), colours(3, sRGB()));
    EXPECT_TRUE(readPicture(file("a.exr"), Depth::uint8).profile.empty());
}

TEST_F(FileProfile, IsLeftOutWhereItIsForOtherColours) {
    writePicture(file("a.tif"), colours(1, sRGB()));
    EXPECT_TRUE(readPicture(file("a.tif"), Depth::uint8).profile.empty());
    writePicture(file("a.tif"), colours(3, grey()));
    EXPECT_TRUE(readPicture(file("a.tif"), Depth::uint8).profile.empty());
    writePicture(file("a.tif"), colours(3, std::vector<unsigned char>(200, 7)));
    EXPECT_TRUE(readPicture(file("a.tif"), Depth::uint8).profile.empty());
}

TEST_F(FileProfile, IsThatOfTheResultUnlessTheFilterChangesColours) {
    Picture const picture = colours(3, sRGB());
    EXPECT_EQ(profileOfResult(*createFilterNamed("FastBilateralBlur"), picture), sRGB());
    EXPECT_TRUE(profileOfResult(*createFilterNamed("ColorspaceTransformer"), picture).empty());
    for (char const* const name : {"RGBToLABCPU", "LABToRGBCPU"})
        EXPECT_TRUE(profileOfResult(*createFilterNamed(name), picture).empty()) << name;
    EXPECT_EQ(throughTiles("FastBilateralBlur", {{"spatialSigma", "2,2"}}, picture).profile, sRGB());
    EXPECT_TRUE(throughTiles("ColorspaceTransformer", {{"dstProfile", "P3"}}, picture).profile.empty());
}

TEST_F(FileProfile, IsTheSourceOfATransformThroughTiles) {
    std::vector<std::pair<std::string, std::string>> const toP3 = {{"dstProfile", "P3"}};
    Picture const result = throughTiles("ColorspaceTransformer", toP3, colours(3, sRGB()));
    // The same as where the source is said; without one it is the wide gamut.
    Picture const said =
        throughTiles("ColorspaceTransformer", {{"srcProfile", "sRGB"}, {"dstProfile", "P3"}}, colours(3, {}));
    EXPECT_LE(largestDifference(result, said), 1);
    EXPECT_GT(largestDifference(result, throughTiles("ColorspaceTransformer", toP3, colours(3, {}))), 20);
}

// Not of colours, but kept in the same places.
TEST_F(FileProfile, GoesWithTheOrientation) {
    Picture picture = colours(3, {});
    picture.orientation = 6;
    for (char const* const name : {"a.tif", "a.jpg"}) {
        writePicture(file(name), picture);
        EXPECT_EQ(readPicture(file(name), Depth::uint8).orientation, 6) << name;
    }
    EXPECT_EQ(throughTiles("FastBilateralBlur", {{"spatialSigma", "2,2"}}, picture).orientation, 6);
    picture.orientation = 1;
    EXPECT_EQ(throughTiles("FastBilateralBlur", {{"spatialSigma", "2,2"}}, picture).orientation, 1);
}

} // namespace
} // namespace example
