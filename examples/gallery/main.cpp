// gallery PHOTOGRAPH CONTACT_SHEET: every filter of the library on one photograph, on the CPU and on OpenGL,
// two filters in a row of the sheet. Prints a table, in Markdown, of what stands where.
#include "apply_filter/FilterList.h"
#include "apply_filter/FrameRunner.h"
#include "common/Engine.h"
#include "common/Picture.h"
#include "common/Program.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace {

using example::Depth;
using example::Picture;

constexpr std::size_t reduction = 3; // pixels of the photograph for one of the sheet, in either direction
constexpr std::size_t gap = 6;
constexpr std::size_t filtersInARow = 2;
constexpr unsigned char grey = 225; // where a filter does not run

/// What a filter makes of the photograph; nothing where it does not run.
using Sample = std::optional<Picture>;

float channelOf(Picture const& picture, std::size_t index) {
    if (picture.depth == Depth::uint8)
        return picture.pixels[index];
    float value = 0.0F;
    std::memcpy(&value, &picture.pixels[index * sizeof value], sizeof value);
    return std::clamp(value * 255.0F, 0.0F, 255.0F);
}

/// The mean of square blocks of pixels, in three channels of 8 bits.
Picture reduced(Picture const& picture) {
    Picture small(picture.width / reduction, picture.height / reduction, 3, Depth::uint8);
    for (std::size_t y = 0; y < small.height; ++y) {
        for (std::size_t x = 0; x < small.width; ++x) {
            for (std::size_t c = 0; c < 3; ++c) {
                float sum = 0.0F;
                for (std::size_t i = 0; i < reduction * reduction; ++i) {
                    std::size_t const row = y * reduction + i / reduction;
                    std::size_t const column = x * reduction + i % reduction;
                    sum += channelOf(picture, (row * picture.width + column) * picture.channels + c);
                }
                small.pixels[(y * small.width + x) * 3 + c] =
                    static_cast<unsigned char>(std::lround(sum / float(reduction * reduction)));
            }
        }
    }
    return small;
}

/// The photograph in the depth that a converter takes.
Picture inDepth(Picture const& photograph, Depth depth) {
    if (depth == photograph.depth)
        return photograph;
    Picture floats(photograph.width, photograph.height, photograph.channels, depth);
    for (std::size_t i = 0; i < photograph.pixels.size(); ++i) {
        float const value = float(photograph.pixels[i]) / 255.0F;
        std::memcpy(&floats.pixels[i * sizeof value], &value, sizeof value);
    }
    return floats;
}

Sample sampleOf(std::string const& name, Picture const& photograph, ORVO::OGL::Context const* context) {
    auto const filter = example::createFilterNamed(name);
    if (auto* const colorize = filter->parameter("colorize"))
        colorize->as<bool>().setValue(true);
    if (auto* const source = filter->parameter("srcProfile"))
        source->as<int>().setValue(static_cast<int>(ORVO::ColourEngine::profileCode("sRGB")));
    if (auto* const opacity = filter->parameter("opacity")) {
        // Without these, the marks of what lies outside a gamut are transparent.
        opacity->as<float>().setValue(1.0F);
        filter->parameter("color")->as<ORVO::float4>().setValue(ORVO::float4(0.0F, 0.0F, 1.0F, 1.0F));
    }
    for (auto const& [from, to] : {std::pair(Depth::uint8, Depth::uint8),
                                   {Depth::uint8, Depth::float32},
                                   {Depth::float32, Depth::uint8}}) {
        Picture result(photograph.width, photograph.height, photograph.channels, to);
        try {
            if (example::runFrames(filter, inDepth(photograph, from), result, {context, 1, false}))
                return reduced(result);
        } catch (std::exception const&) {
            // The converters take one of the other pairs, and most filters have one target.
        }
    }
    return {};
}

std::vector<std::string> namesOfFilters() {
    std::vector<std::string> names;
    auto& factory = *ORVO::FilterGraph::FilterFactory::Instance();
    for (auto prototype = factory.prototypes(); prototype.isValid(); ++prototype)
        names.push_back(prototype->identifier().name());
    return names;
}

std::vector<Sample> samplesOf(std::vector<std::string> const& names, Picture const& photograph,
                              ORVO::OGL::Context const* context) {
    std::vector<Sample> samples;
    samples.reserve(names.size());
    for (std::string const& name : names)
        samples.push_back(sampleOf(name, photograph, context));
    return samples;
}

void place(Picture& sheet, Sample const& sample, std::size_t width, std::size_t height, std::size_t column,
           std::size_t row) {
    std::size_t const left = gap + column * (width + gap);
    std::size_t const top = gap + row * (height + gap);
    for (std::size_t y = 0; y < height; ++y) {
        unsigned char* const line = &sheet.pixels[((top + y) * sheet.width + left) * 3];
        if (sample)
            std::memcpy(line, &sample->pixels[y * width * 3], width * 3);
        else
            std::memset(line, grey, width * 3);
    }
}

Picture sheetOf(std::vector<Sample> const& onCPU, std::vector<Sample> const& onOpenGL, std::size_t width,
                std::size_t height) {
    std::size_t const rows = (onCPU.size() + filtersInARow - 1) / filtersInARow;
    Picture sheet(gap + 2 * filtersInARow * (width + gap), gap + rows * (height + gap), 3, Depth::uint8);
    std::fill(sheet.pixels.begin(), sheet.pixels.end(), static_cast<unsigned char>(255));
    for (std::size_t i = 0; i < onCPU.size(); ++i) {
        std::size_t const column = 2 * (i % filtersInARow);
        place(sheet, onCPU[i], width, height, column, i / filtersInARow);
        place(sheet, onOpenGL[i], width, height, column + 1, i / filtersInARow);
    }
    return sheet;
}

void printTable(std::vector<std::string> const& names, std::vector<Sample> const& onCPU,
                std::vector<Sample> const& onOpenGL) {
    auto const cell = [&](std::size_t i) {
        if (i >= names.size())
            return std::string();
        return "`" + names[i] + "` (" +
               (onCPU[i] && onOpenGL[i] ? "both"
                : onCPU[i]              ? "CPU"
                : onOpenGL[i]           ? "OpenGL"
                                        : "neither") +
               ")";
    };
    std::puts("| row | columns 1 and 2: CPU, OpenGL | columns 3 and 4: CPU, OpenGL |\n|---|---|---|");
    for (std::size_t i = 0; i < names.size(); i += filtersInARow)
        std::printf("| %zu | %s | %s |\n", i / filtersInARow + 1, cell(i).c_str(), cell(i + 1).c_str());
}

void makeGallery(std::string const& photographFile, std::string const& sheetFile) {
    example::checkWritable(sheetFile);
    Picture const photograph = example::widenedToColour(example::readPicture(photographFile, Depth::uint8));
    std::vector<std::string> names;
    std::vector<Sample> onCPU;
    {
        // By itself: some types of filters run on OpenGL alone where there is a context.
        example::Engine const engine(example::noContext);
        names = namesOfFilters();
        onCPU = samplesOf(names, photograph, nullptr);
    }
    example::Engine const engine(example::makeContext);
    std::vector<Sample> const onOpenGL = samplesOf(names, photograph, engine.context.get());
    example::writePicture(
        sheetFile, sheetOf(onCPU, onOpenGL, photograph.width / reduction, photograph.height / reduction));
    printTable(names, onCPU, onOpenGL);
}

} // namespace

int main(int argc, char** argv) {
    if (argc != 3) {
        std::fprintf(stderr, "Usage: %s PHOTOGRAPH CONTACT_SHEET\n", argv[0]);
        return 2;
    }
    return example::runProgram("gallery", [&] {
        makeGallery(argv[1], argv[2]);
        return true;
    });
}
