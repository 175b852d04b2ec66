// Colour transforms as the program runs them: codes from text, the file's own profile, photographs there and
// back.
#include "apply_filter/FileProfile.h"
#include "apply_filter/FilterList.h"
#include "apply_filter/FilterValues.h"
#include "apply_filter/FrameRunner.h"
#include "common/Engine.h"
#include "orvo/orvo.h"
#include "tests/examples/support/PictureDifference.h"

#include <OpenImageIO/imageio.h>
#include <gtest/gtest.h>
#include <lcms2.h>

#include <algorithm>
#include <cmath>
#include <cstring>
#include <filesystem>
#include <memory>
#include <string>
#include <vector>

namespace example {
namespace {

namespace fs = std::filesystem;
using FilterPtr = std::shared_ptr<ORVO::FilterGraph::IFilter>;

class ColourFrames : public testing::Test {
protected:
    ColourFrames() {
        filter_ = createFilterNamed("ColorspaceTransformer");
        file_ = (fs::temp_directory_path() /
                 ("orvo-colour-" +
                  std::string(testing::UnitTest::GetInstance()->current_test_info()->name()) + ".png"))
                    .string();
    }
    ~ColourFrames() override { fs::remove(file_); }

    int code(char const* name) const { return filter_->parameter(name)->as<int>().value(); }
    void setCodes(char const* source, char const* destination) const {
        EXPECT_EQ("", setValue(*filter_, "srcProfile", source));
        EXPECT_EQ("", setValue(*filter_, "dstProfile", destination));
    }
    Picture run(Picture const& source, ORVO::OGL::Context const* context = nullptr) const {
        Picture result(source.width, source.height, source.channels, source.depth);
        EXPECT_TRUE(runFrames(filter_, source, result, {context, 1, false}));
        return result;
    }
    ORVO::OGL::Context const* context() const { return engine_.context.get(); }

    // A picture of all greys and of some colours, with this profile in the file.
    void writeFile(std::vector<unsigned char> const& profile) const {
        Picture const picture = colours();
        auto const output = OIIO::ImageOutput::create(file_);
        OIIO::ImageSpec spec(int(picture.width), int(picture.height), 3, OIIO::TypeDesc::UINT8);
        spec.attribute("ICCProfile", OIIO::TypeDesc(OIIO::TypeDesc::UINT8, int(profile.size())),
                       profile.data());
        ASSERT_TRUE(output->open(file_, spec));
        ASSERT_TRUE(output->write_image(OIIO::TypeDesc::UINT8, picture.pixels.data()));
        ASSERT_TRUE(output->close());
    }
    static Picture colours() {
        Picture picture(16, 16, 3, Depth::uint8);
        for (std::size_t i = 0; i < picture.pixels.size(); ++i)
            picture.pixels[i] = static_cast<unsigned char>(i % 3 == 1 ? 255 - i / 3 : i * 5 / 3);
        return picture;
    }

private:
    Engine engine_{makeContext}; // down after the filter

protected:
    FilterPtr filter_;
    std::string file_;
};

// The bytes of an RGB profile with the primaries of P3 and a gamma.
std::vector<unsigned char> profileWithGamma(double gamma) {
    cmsCIExyY const white{0.3127, 0.3290, 1.0};
    cmsCIExyYTRIPLE const primaries{{0.680, 0.320, 1.0}, {0.265, 0.690, 1.0}, {0.150, 0.060, 1.0}};
    cmsToneCurve* const curve = cmsBuildGamma(nullptr, gamma);
    cmsToneCurve* const curves[] = {curve, curve, curve};
    cmsHPROFILE const profile = cmsCreateRGBProfile(&white, &primaries, curves);
    cmsFreeToneCurve(curve);
    cmsUInt32Number size = 0;
    cmsSaveProfileToMem(profile, nullptr, &size);
    std::vector<unsigned char> bytes(size);
    cmsSaveProfileToMem(profile, bytes.data(), &size);
    cmsCloseProfile(profile);
    return bytes;
}

TEST_F(ColourFrames, ColourSpacesAreFourCharactersOrANumber) {
    struct Row {
        char const* text;
        int code;
    };
    for (Row const& row :
         {Row{"sRGB", 0x73524742}, Row{"P3  ", 0x50332020}, Row{"P3", 0x50332020}, Row{"2020", 0x32303230},
          Row{"0x41533938", 0x41533938}, Row{"1095973176", 0x41533938}, Row{"0XFFFFFFFF", -1}, Row{"7", 7},
          Row{"0x12", 0x12}, Row{"GRAY", 0x47524159}}) {
        EXPECT_EQ("", setValue(*filter_, "srcProfile", row.text)) << row.text;
        EXPECT_EQ(row.code, code("srcProfile")) << row.text;
    }
    EXPECT_EQ("0x47524159", valueText(*filter_->parameter("srcProfile")));
    for (char const* text : {"", "wide gamut", "99999999999", "0xGG000000", "-5000"}) {
        EXPECT_THROW(static_cast<void>(setValue(*filter_, "srcProfile", text)), ValueError) << text;
        EXPECT_EQ(0x47524159, code("srcProfile")) << text;
    }
}

TEST_F(ColourFrames, TheProfileOfTheFileIsTheSource) {
    // Linear light, which makes the picture much lighter than any other source would.
    writeFile(profileWithGamma(1.0));
    Picture const file = readPicture(file_, Depth::uint8);
    ASSERT_FALSE(file.profile.empty());
    EXPECT_EQ(colours().pixels, file.pixels);
    setCodes("sRGB", "P3  ");
    useProfileOfFile(*filter_, file, {{"dstProfile", "P3  "}});
    EXPECT_EQ(0x66696c65, code("srcProfile")); // "file"
    for (auto const* target : {context(), static_cast<ORVO::OGL::Context const*>(nullptr)}) {
        Picture const result = run(file, target);
        Picture expected = file;
        for (unsigned char& value : expected.pixels) {
            // The primaries are the same: what is left is the curve of P3, which is that of sRGB.
            double const light = value / 255.0;
            double const encoded =
                light <= 0.0031308 ? 12.92 * light : 1.055 * std::pow(light, 1.0 / 2.4) - 0.055;
            value = static_cast<unsigned char>(std::lround(255.0 * encoded));
        }
        EXPECT_LE(largestDifference(expected, result), 1);
    }
}

TEST_F(ColourFrames, TheCommandLineStandsAboveTheFile) {
    writeFile(profileWithGamma(1.0));
    Picture const file = readPicture(file_, Depth::uint8);
    setCodes("sRGB", "P3  ");
    useProfileOfFile(*filter_, file, {{"srcProfile", "sRGB"}});
    EXPECT_EQ(0x73524742, code("srcProfile"));
    // Files without a profile, and filters without a source, are left alone.
    Picture plain = file;
    plain.profile.clear();
    useProfileOfFile(*filter_, plain, {});
    EXPECT_EQ(0x73524742, code("srcProfile"));
    useProfileOfFile(*createFilterNamed("premultiply"), file, {});
}

TEST_F(ColourFrames, AProfileThatIsNoneIsRefused) {
    Picture file = colours();
    file.profile.assign(200, 7);
    try {
        useProfileOfFile(*filter_, file, {});
        ADD_FAILURE() << "accepted";
    } catch (ValueError const& failure) {
        EXPECT_STREQ("The colour profile in the file cannot be used (Not an ICC profile); --set "
                     "srcProfile=sRGB or another one stands in for it",
                     failure.what());
    }
    EXPECT_EQ(0x41533938, code("srcProfile"));
}

// Every sixth row and column of the photograph.
Picture thinned(Picture const& picture) {
    Picture result(picture.width / 6, picture.height / 6, picture.channels, picture.depth);
    std::size_t const pixel = picture.rowBytes() / picture.width;
    for (std::size_t y = 0; y < result.height; ++y)
        for (std::size_t x = 0; x < result.width; ++x)
            std::memcpy(&result.pixels[(y * result.width + x) * pixel],
                        &picture.pixels[6 * (y * picture.width + x) * pixel], pixel);
    return result;
}

// To bytes, rounded.
Picture inBytes(Picture const& picture) {
    Picture result(picture.width, picture.height, picture.channels, Depth::uint8);
    for (std::size_t i = 0; i < result.pixels.size(); ++i) {
        float value = 0.0F;
        if (picture.depth == Depth::float32) {
            std::memcpy(&value, &picture.pixels[4 * i], sizeof value);
        } else {
            std::uint16_t word = 0;
            std::memcpy(&word, &picture.pixels[2 * i], sizeof word);
            value = static_cast<float>(word) / 32768.0F;
        }
        result.pixels[i] = static_cast<unsigned char>(std::clamp(value, 0.0F, 1.0F) * 255.0F + 0.5F);
    }
    return result;
}

TEST_F(ColourFrames, APhotographComesBackFromTheWideGamut) {
    std::string const photograph = std::string(ORVO_EXAMPLE_DATA) + "/astronaut.png";
    Picture const bytes = thinned(readPicture(photograph, Depth::uint8));
    struct Row {
        ORVO::OGL::Context const* target;
        Depth depth;
    };
    for (Row const& row : {Row{nullptr, Depth::uint15_1}, Row{context(), Depth::float32}}) {
        Picture const source = thinned(readPicture(photograph, row.depth));
        setCodes("sRGB", "0x41533938");
        Picture const wide = run(source, row.target);
        EXPECT_GT(largestDifference(bytes, inBytes(wide)), 5);
        setCodes("0x41533938", "sRGB");
        EXPECT_LE(largestDifference(bytes, inBytes(run(wide, row.target))), 1);
    }
}

} // namespace
} // namespace example
