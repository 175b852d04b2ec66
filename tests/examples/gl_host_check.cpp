// gl_host_check PHOTOGRAPH SCREENSHOT: compares what the window host shows with the same picture computed
// here in double precision. Tolerance: 1 of 255 in each channel of each pixel. Before that it shows, on
// screenshots that were spoilt on purpose, that the comparison finds a small fault.
#include "common/Picture.h"
#include "tests/examples/support/PictureDifference.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdio>
#include <cstdlib>
#include <exception>
#include <utility>

namespace {

using example::Picture;

constexpr int tolerance = 1;
constexpr double strength = 0.75;

// The vignette's factor for one channel of one pixel, whose place is that of its middle.
double gain(Picture const& picture, std::size_t x, std::size_t y, std::size_t channel) {
    constexpr double warm[] = {1.15, 1.0, 0.8};
    double const u = (static_cast<double>(x) + 0.5) / static_cast<double>(picture.width) - 0.5;
    double const v = (static_cast<double>(y) + 0.5) / static_cast<double>(picture.height) - 0.5;
    double const radiusSquared = 2.0 * (u * u + v * v);
    return 1.0 - strength + strength * warm[channel] * (1.0 - 0.8 * radiusSquared);
}

Picture filtered(Picture const& photograph) {
    Picture result = photograph;
    for (std::size_t i = 0; i < result.pixels.size(); ++i) {
        std::size_t const pixel = i / 3;
        double const factor = gain(photograph, pixel % result.width, pixel / result.width, i % 3);
        double const value = std::fmin(255.0, photograph.pixels[i] * factor);
        result.pixels[i] = static_cast<unsigned char>(std::lround(value));
    }
    return result;
}

// Every value taken from another place of the picture.
template <typename Place>
Picture rearranged(Picture const& picture, Place place) {
    Picture result = picture;
    for (std::size_t i = 0; i < picture.pixels.size(); ++i)
        result.pixels[i] = picture.pixels[place(i) % picture.pixels.size()];
    return result;
}

Picture brighter(Picture picture) {
    for (unsigned char& value : picture.pixels)
        value = static_cast<unsigned char>(std::lround(std::fmin(255.0, value * 1.01)));
    return picture;
}

Picture withoutLastRow(Picture picture) {
    for (std::size_t i = picture.pixels.size() - picture.rowBytes(); i < picture.pixels.size(); ++i)
        picture.pixels[i] = 0;
    return picture;
}

} // namespace

int main(int argc, char** argv) {
    if (argc != 3)
        return 2;
    try {
        Picture const photograph = example::readPicture(argv[1], example::Depth::uint8);
        Picture const screenshot = example::readPicture(argv[2], example::Depth::uint8);
        Picture const expected = filtered(photograph);
        std::size_t const row = photograph.rowBytes();
        std::pair<char const*, Picture> const faults[] = {
            {"the photograph itself", photograph},
            {"shifted by one column", rearranged(expected, [](std::size_t i) { return i + 3; })},
            {"shifted by one row", rearranged(expected, [row](std::size_t i) { return i + row; })},
            {"red and blue swapped",
             rearranged(expected, [](std::size_t i) { return i / 3 * 3 + 2 - i % 3; })},
            {"upside down", example::upsideDown(expected)},
            {"1 % brighter", brighter(expected)},
            {"last row lost", withoutLastRow(expected)}};
        int failures = 0;
        for (auto const& [name, picture] : faults) {
            int const difference = largestDifference(picture, expected);
            if (difference <= tolerance) {
                std::printf("FAILED: \"%s\" passes: %d of 255\n", name, difference);
                ++failures;
            }
        }
        int const difference = largestDifference(screenshot, expected);
        std::printf("%s: largest difference %d of 255\n", difference > tolerance ? "FAILED" : "passed",
                    difference);
        return failures > 0 || difference > tolerance ? 1 : 0;
    } catch (std::exception const& failure) {
        std::printf("FAILED: %s\n", failure.what());
        return 1;
    }
}
