// side_by_side OUTPUT INPUT...: the pictures in one row, with a white gap between them.
#include "common/Picture.h"

#include <algorithm>
#include <cstdio>
#include <cstring>
#include <vector>

namespace {

constexpr std::size_t gap = 8;

example::Picture joined(std::vector<example::Picture> const& pictures) {
    std::size_t width = gap * (pictures.size() - 1);
    std::size_t height = 0;
    for (auto const& picture : pictures) {
        width += picture.width;
        height = std::max(height, picture.height);
    }
    example::Picture row(width, height, 3, example::Depth::uint8);
    std::fill(row.pixels.begin(), row.pixels.end(), static_cast<unsigned char>(255));
    std::size_t left = 0;
    for (auto const& picture : pictures) {
        for (std::size_t y = 0; y < picture.height; ++y) {
            for (std::size_t x = 0; x < picture.width; ++x)
                std::memcpy(&row.pixels[(y * width + left + x) * 3],
                            &picture.pixels[(y * picture.width + x) * picture.channels], 3);
        }
        left += picture.width + gap;
    }
    return row;
}

} // namespace

int main(int argc, char** argv) {
    if (argc < 3) {
        std::fprintf(stderr, "Usage: %s OUTPUT INPUT...\n", argv[0]);
        return 2;
    }
    try {
        std::vector<example::Picture> pictures;
        for (int i = 2; i < argc; ++i)
            pictures.push_back(
                example::widenedToColour(example::readPicture(argv[i], example::Depth::uint8)));
        example::writePicture(argv[1], joined(pictures));
    } catch (std::exception const& failure) {
        std::fprintf(stderr, "side_by_side: %s\n", failure.what());
        return 1;
    }
    return 0;
}
