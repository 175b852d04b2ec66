#include "common/Picture.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <filesystem>
#include <fstream>

namespace example {
namespace {

namespace fs = std::filesystem;

class PictureFile : public testing::Test {
protected:
    void SetUp() override {
        folder_ =
            fs::temp_directory_path() /
            ("orvo-picture-" + std::string(testing::UnitTest::GetInstance()->current_test_info()->name()));
        fs::remove_all(folder_);
        fs::create_directories(folder_);
    }
    void TearDown() override { fs::remove_all(folder_); }

    std::string path(std::string const& name) const { return (folder_ / name).string(); }

    std::size_t filesInFolder() const {
        return static_cast<std::size_t>(
            std::distance(fs::directory_iterator(folder_), fs::directory_iterator()));
    }

    fs::path folder_;
};

std::vector<std::uint16_t> words(Picture const& picture) {
    std::vector<std::uint16_t> values(picture.pixels.size() / 2);
    std::memcpy(values.data(), picture.pixels.data(), picture.pixels.size());
    return values;
}

Picture pictureOfWords(std::size_t width, std::vector<std::uint16_t> const& values) {
    Picture picture(width, values.size() / width / 3, 3, Depth::uint15_1);
    std::memcpy(picture.pixels.data(), values.data(), picture.pixels.size());
    return picture;
}

std::string refusalOfReading(std::string const& file) {
    try {
        static_cast<void>(readPicture(file, Depth::uint8));
    } catch (PictureError const& failure) {
        return failure.what();
    }
    return "read";
}

std::string refusalOfWriting(std::string const& file) {
    try {
        writePicture(file, Picture(2, 2, 3, Depth::uint8));
    } catch (PictureError const& failure) {
        return failure.what();
    }
    return "written";
}

TEST_F(PictureFile, EightBitsComeBackExactlyFromEveryLosslessFormat) {
    for (std::string const extension : {"png", "tif"}) {
        for (std::size_t channels = 1; channels <= 4; ++channels) {
            Picture picture(16, 16, channels, Depth::uint8);
            for (std::size_t i = 0; i < picture.pixels.size(); ++i)
                picture.pixels[i] = static_cast<unsigned char>(i * 7);
            std::string const file = path("p." + extension);
            writePicture(file, picture);
            EXPECT_EQ(depthOfFile(file), Depth::uint8);
            Picture const back = readPicture(file, Depth::uint8);
            EXPECT_EQ(back.width, 16u);
            EXPECT_EQ(back.height, 16u);
            ASSERT_EQ(back.channels, channels) << extension;
            EXPECT_EQ(back.pixels, picture.pixels) << extension << " " << channels;
        }
    }
}

// 0..32768 to 0..65535 and back: each value v becomes about 2v in the file, so all of them come back.
TEST_F(PictureFile, SixteenBitsComeBackExactly) {
    std::vector<std::uint16_t> values(32769 / 3 * 3);
    for (std::size_t i = 0; i < values.size(); ++i)
        values[i] = static_cast<std::uint16_t>(32768 - i);
    writePicture(path("p.png"), pictureOfWords(values.size() / 3, values));
    EXPECT_EQ(depthOfFile(path("p.png")), Depth::uint15_1);
    EXPECT_EQ(words(readPicture(path("p.png"), Depth::uint15_1)), values);
}

TEST_F(PictureFile, BlackAndWhiteAreExactAcrossDepths) {
    writePicture(path("p.png"), pictureOfWords(2, {0, 0, 0, 32768, 32768, 32768}));
    EXPECT_EQ(readPicture(path("p.png"), Depth::uint8).pixels,
              (std::vector<unsigned char>{0, 0, 0, 255, 255, 255}));
    Picture const floats = readPicture(path("p.png"), Depth::float32);
    float values[6];
    std::memcpy(values, floats.pixels.data(), sizeof(values));
    EXPECT_EQ(values[0], 0.0F);
    EXPECT_EQ(values[3], 1.0F);
}

TEST_F(PictureFile, FloatsComeBackExactlyAlsoOutsideZeroToOne) {
    float const values[6] = {-1.5F, 0.25F, 3.0F, 0.1F, 100.0F, 0.0F};
    Picture picture(2, 1, 3, Depth::float32);
    std::memcpy(picture.pixels.data(), values, sizeof(values));
    for (std::string const name : {"p.exr", "p.tif"}) {
        writePicture(path(name), picture);
        EXPECT_EQ(depthOfFile(path(name)), Depth::float32);
        EXPECT_EQ(readPicture(path(name), Depth::float32).pixels, picture.pixels) << name;
    }
}

// EXR files hold colour multiplied by alpha; in memory it is not: 0.5 with alpha 0.5 is 0.25 in the file.
TEST_F(PictureFile, AlphaIsNotMultipliedInMemory) {
    float const values[4] = {0.5F, 1.0F, 0.25F, 0.5F};
    Picture picture(1, 1, 4, Depth::float32);
    std::memcpy(picture.pixels.data(), values, sizeof(values));
    for (std::string const name : {"p.exr", "p.tif"}) {
        writePicture(path(name), picture);
        EXPECT_EQ(readPicture(path(name), Depth::float32).pixels, picture.pixels) << name;
    }
}

// Over black, half covered white is grey: 255 * 0.5 = 127.5, to 127 or 128, and JPEG loses little of a flat
// picture.
TEST_F(PictureFile, JpegGetsThePictureOverBlack) {
    Picture picture(16, 16, 4, Depth::float32);
    std::vector<float> values(16 * 16 * 4, 1.0F);
    for (std::size_t alpha = 3; alpha < values.size(); alpha += 4)
        values[alpha] = 0.5F;
    std::memcpy(picture.pixels.data(), values.data(), picture.pixels.size());
    writePicture(path("p.jpg"), picture);
    Picture const back = readPicture(path("p.jpg"), Depth::uint8);
    ASSERT_EQ(back.channels, 3u);
    for (unsigned char const value : back.pixels)
        EXPECT_NEAR(value, 127.5, 2.5);
}

TEST_F(PictureFile, FailuresSayOneLineAndLeaveNothingBehind) {
    EXPECT_EQ(refusalOfReading(path("none.png")), "Cannot read " + path("none.png") + ": no such file");
    std::ofstream(path("text.png")) << "this is no picture";
    EXPECT_EQ(refusalOfReading(path("text.png")).rfind("Cannot read " + path("text.png") + ": ", 0), 0u);
    EXPECT_EQ(refusalOfReading(path("text.png")).find('\n'), std::string::npos);
    EXPECT_EQ(refusalOfWriting(path("none/p.png")),
              "Cannot write " + path("none/p.png") + ": no such folder");
    EXPECT_EQ(refusalOfWriting(path("p.unknown")).rfind("Cannot write " + path("p.unknown") + ": ", 0), 0u);
    fs::create_directory(path("folder.png"));
    EXPECT_EQ(refusalOfWriting(path("folder.png")),
              "Cannot write " + path("folder.png") + ": it is a folder");
    EXPECT_EQ(filesInFolder(), 2u);
}

TEST(Picture, GreyIsWidenedAndReduced) {
    Picture grey(1, 2, 2, Depth::uint8);
    grey.pixels = {10, 20, 30, 40};
    Picture const colour = widenedToColour(grey);
    EXPECT_EQ(colour.channels, 4u);
    EXPECT_EQ(colour.pixels, (std::vector<unsigned char>{10, 10, 10, 20, 30, 30, 30, 40}));
    EXPECT_EQ(reducedToGrey(colour).pixels, grey.pixels);
    EXPECT_EQ(widenedToColour(colour).pixels, colour.pixels);
    EXPECT_EQ(reducedToGrey(grey).pixels, grey.pixels);
}

TEST(Picture, AlphaIsAddedOpaqueAndTakenAway) {
    Picture bytes(2, 1, 3, Depth::uint8);
    bytes.pixels = {10, 20, 30, 40, 50, 60};
    Picture const opaque = withAlpha(bytes);
    EXPECT_EQ(opaque.channels, 4u);
    EXPECT_EQ(opaque.pixels, (std::vector<unsigned char>{10, 20, 30, 255, 40, 50, 60, 255}));
    EXPECT_EQ(withAlpha(opaque).pixels, opaque.pixels);
    EXPECT_EQ(withoutAlpha(opaque).pixels, bytes.pixels);
    EXPECT_EQ(withoutAlpha(bytes).pixels, bytes.pixels);

    EXPECT_EQ(words(withAlpha(pictureOfWords(1, {1, 2, 3}))), (std::vector<std::uint16_t>{1, 2, 3, 32768}));

    Picture grey(1, 1, 1, Depth::float32);
    float const value = 0.25F;
    std::memcpy(grey.pixels.data(), &value, sizeof value);
    Picture const opaqueGrey = withAlpha(grey);
    ASSERT_EQ(opaqueGrey.pixels.size(), 2 * sizeof(float));
    float both[2];
    std::memcpy(both, opaqueGrey.pixels.data(), sizeof both);
    EXPECT_EQ(both[0], 0.25F);
    EXPECT_EQ(both[1], 1.0F);
}

TEST(Picture, RowsAreTurnedUpsideDown) {
    Picture picture(2, 3, 1, Depth::uint8);
    picture.pixels = {1, 2, 3, 4, 5, 6};
    EXPECT_EQ(upsideDown(picture).pixels, (std::vector<unsigned char>{5, 6, 3, 4, 1, 2}));
}

} // namespace
} // namespace example
