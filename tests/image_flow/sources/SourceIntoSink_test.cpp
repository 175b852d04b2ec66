// A source whose output is bound copies its compute region into the client's image.

#include "orvo/core/math/Half.h"
#include "tests/image_flow/support/TestNodes.h"
#include "tests/support/Expect.h"
#include "tests/support/ImageFlowLayers.h"

#include <cmath>
#include <cstring>

namespace ORVO {

namespace {

using Test::pixels;
using Test::world;

enum class Type { BYTE, WORD, HALF, FLOAT };

/// A pixel format as a test sees it.
struct Format {
    ImageCPU::tePixelFormat eFormat;
    int nChannels;
    Type eType;
    bool bBlueFirst;
};

Format const aFormats[] = {{ImageCPU::PIXEL_FORMAT_BGR8, 3, Type::BYTE, true},
                           {ImageCPU::PIXEL_FORMAT_BGRA8, 4, Type::BYTE, true},
                           {ImageCPU::PIXEL_FORMAT_RGB8, 3, Type::BYTE, false},
                           {ImageCPU::PIXEL_FORMAT_RGBA8, 4, Type::BYTE, false},
                           {ImageCPU::PIXEL_FORMAT_RGB16, 3, Type::WORD, false},
                           {ImageCPU::PIXEL_FORMAT_RGBA16, 4, Type::WORD, false},
                           {ImageCPU::PIXEL_FORMAT_RGB32F, 3, Type::FLOAT, false},
                           {ImageCPU::PIXEL_FORMAT_RGBA32F, 4, Type::FLOAT, false},
                           {ImageCPU::PIXEL_FORMAT_LUMINANCE8, 1, Type::BYTE, false},
                           {ImageCPU::PIXEL_FORMAT_LUMINANCE16, 1, Type::WORD, false},
                           {ImageCPU::PIXEL_FORMAT_LUMINANCE32F, 1, Type::FLOAT, false},
                           {ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, 2, Type::BYTE, false},
                           {ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA16, 2, Type::WORD, false},
                           {ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F, 2, Type::FLOAT, false},
                           {ImageCPU::PIXEL_FORMAT_RGB16F, 3, Type::HALF, false},
                           {ImageCPU::PIXEL_FORMAT_RGBA16F, 4, Type::HALF, false}};

std::size_t bytesOf(Type type) { return type == Type::BYTE ? 1 : type == Type::FLOAT ? 4 : 2; }

/// An image of known storage, every byte of which is the given one at first.
struct Picture {
    Picture(Format const& format, PositionExtentInPixelSpace const& region, int capacityWidth,
            unsigned char fill)
        : oFormat_(format),
          oImage_(format.eFormat, region, PixelExtentInWorldSpace(),
                  ExtentInPixelSpace(capacityWidth, region.extent().height() + 1)) {
        std::memset(oImage_.pixels(), fill, bytes());
    }

    std::size_t bytes() const {
        return std::size_t(oImage_.capacityExtent().width()) *
               std::size_t(oImage_.capacityExtent().height()) * std::size_t(oFormat_.nChannels) *
               bytesOf(oFormat_.eType);
    }

    /// The address of a channel, 0 to 3 for R, G, B, A or L, A.
    unsigned char* at(int x, int y, int channel) {
        int const swapped = oFormat_.bBlueFirst && channel < 3 ? 2 - channel : channel;
        std::ptrdiff_t const pixel =
            std::ptrdiff_t(y - oImage_.position().y()) * oImage_.capacityExtent().width() + x -
            oImage_.position().x();
        return oImage_.pixels() +
               (pixel * oFormat_.nChannels + swapped) * std::ptrdiff_t(bytesOf(oFormat_.eType));
    }

    template <typename T>
    T get(int x, int y, int channel) {
        T value;
        std::memcpy(&value, at(x, y, channel), sizeof(T));
        return value;
    }

    template <typename T>
    void put(int x, int y, int channel, T value) {
        std::memcpy(at(x, y, channel), &value, sizeof(T));
    }

    /// The channel as a number on the 0.0 to 1.0 scale.
    double number(int x, int y, int channel) {
        switch (oFormat_.eType) {
        case Type::BYTE:
            return get<std::uint8_t>(x, y, channel) / 255.0;
        case Type::WORD:
            return get<std::uint16_t>(x, y, channel) / 32768.0;
        case Type::HALF:
            return double(float(half::fromBits(get<std::uint16_t>(x, y, channel))));
        case Type::FLOAT:
            break;
        }
        return double(get<float>(x, y, channel));
    }

    Format oFormat_;
    ImageCPU oImage_;
};

/// Puts a pattern of black, white and values in between into a picture.
void paint(Picture& picture) {
    PositionInPixelSpace const origin = picture.oImage_.position();
    for (int y = 0; y < picture.oImage_.extent().height(); ++y) {
        for (int x = 0; x < picture.oImage_.extent().width(); ++x) {
            for (int c = 0; c < picture.oFormat_.nChannels; ++c) {
                int const step = (x * 7 + y * 3 + c * 5) % 9; // eighths
                int const px = origin.x() + x;
                int const py = origin.y() + y;
                switch (picture.oFormat_.eType) {
                case Type::BYTE:
                    picture.put(px, py, c, std::uint8_t(step == 8 ? 255 : step * 32));
                    break;
                case Type::WORD:
                    picture.put(px, py, c, std::uint16_t(step * 4096));
                    break;
                case Type::HALF:
                    picture.put(px, py, c, half(float(step) / 8).bits());
                    break;
                case Type::FLOAT:
                    picture.put(px, py, c, float(step) / 8);
                    break;
                }
            }
        }
    }
}

/// What a channel of that type can say at best about a number within 0..1.
double tolerance(Type type, double value) {
    switch (type) {
    case Type::BYTE:
        return 0.5 / 255 + 1e-6;
    case Type::WORD:
        return 0.5 / 32768 + 1e-6;
    case Type::HALF:
        return value / 2048 + 1e-7;
    case Type::FLOAT:
        break;
    }
    return 1e-7;
}

class SourceIntoSinkTest : public testing::Test {
protected:
    /// Runs the source alone, bound to the image, for a region in world space (pixels of 1).
    static void run(ImageCPU& from, ImageCPU& to, PositionExtentInWorldSpace const& region) {
        ImageFlowController controller;
        ImageCPUInput source;
        controller.addNode(&source);
        controller.setImageSink(source);
        source.setImageCPUWithNoOwnership(&from);
        source.setBoundOutputImage(&to);
        source.emit();
        source.setGeneratedRegion(region);
        controller.computeRegions(region);
        controller.process();
    }
    ORVO::Test::ImageFlowLayers oLayers_;
};

TEST_F(SourceIntoSinkTest, convertsEveryFormatToEveryOtherOfTheSameChannels) {
    for (Format const& from : aFormats) {
        for (Format const& to : aFormats) {
            SCOPED_TRACE(testing::Message() << from.eFormat << " to " << to.eFormat);
            Picture source(from, pixels(-3, 2, 9, 7), 11, 0);
            Picture target(to, pixels(-5, 0, 14, 12), 17, 0x2A);
            Picture const untouched(to, pixels(-5, 0, 14, 12), 17, 0x2A);
            paint(source);
            auto const region = world(-2, 4, 6, 4);
            if (from.nChannels != to.nChannels) {
                ORVO_EXPECT_PARAMETER(run(source.oImage_, target.oImage_, region),
                                      "Source and bound output image differ in their channels");
                EXPECT_EQ(0,
                          std::memcmp(target.oImage_.pixels(), untouched.oImage_.pixels(), target.bytes()));
                continue;
            }
            run(source.oImage_, target.oImage_, region);
            for (int y = 4; y < 8; ++y) {
                for (int x = -2; x < 4; ++x) {
                    for (int c = 0; c < to.nChannels; ++c) {
                        double const expected = source.number(x, y, c);
                        EXPECT_NEAR(expected, target.number(x, y, c), tolerance(to.eType, expected))
                            << "at " << x << ", " << y << ", channel " << c;
                        std::memset(target.at(x, y, c), 0x2A, bytesOf(to.eType));
                    }
                }
            }
            EXPECT_EQ(0, std::memcmp(target.oImage_.pixels(), untouched.oImage_.pixels(), target.bytes()))
                << "pixels outside the region were touched";
        }
    }
}

TEST_F(SourceIntoSinkTest, blackAndWhiteAreExactAndTheRestIsRounded) {
    struct Row {
        int byte;
        int word;
    };
    // 128 / 255 * 32768 is 16448.25, 1 / 255 * 32768 is 128.5 and a little, 254 / 255 * 32768 is 32639.498.
    for (Row const& row : {Row{0, 0}, Row{1, 129}, Row{128, 16448}, Row{254, 32639}, Row{255, 32768}}) {
        Picture byte(aFormats[8], pixels(0, 0, 1, 1), 1, 0);
        Picture word(aFormats[9], pixels(0, 0, 1, 1), 1, 0);
        byte.put(0, 0, 0, std::uint8_t(row.byte));
        run(byte.oImage_, word.oImage_, world(0, 0, 1, 1));
        EXPECT_EQ(row.word, word.get<std::uint16_t>(0, 0, 0));
        run(word.oImage_, byte.oImage_, world(0, 0, 1, 1));
        EXPECT_EQ(row.byte, byte.get<std::uint8_t>(0, 0, 0));
    }
}

TEST_F(SourceIntoSinkTest, integersSaturate) {
    float const nan = std::nanf("");
    float const infinity = std::numeric_limits<float>::infinity();
    struct Row {
        float value;
        int byte;
        int word;
    };
    for (Row const& row : {Row{-0.5f, 0, 0}, Row{1.5f, 255, 32768}, Row{nan, 0, 0}, Row{infinity, 255, 32768},
                           Row{-infinity, 0, 0}, Row{0.5f, 128, 16384}, Row{1e30f, 255, 32768}}) {
        Picture source(aFormats[10], pixels(0, 0, 1, 1), 1, 0);
        source.put(0, 0, 0, row.value);
        Picture byte(aFormats[8], pixels(0, 0, 1, 1), 1, 0x11);
        run(source.oImage_, byte.oImage_, world(0, 0, 1, 1));
        EXPECT_EQ(row.byte, byte.get<std::uint8_t>(0, 0, 0)) << row.value;
        Picture word(aFormats[9], pixels(0, 0, 1, 1), 1, 0x11);
        run(source.oImage_, word.oImage_, world(0, 0, 1, 1));
        EXPECT_EQ(row.word, word.get<std::uint16_t>(0, 0, 0)) << row.value;
    }
    // A word above white is white in a byte, and itself in a word.
    Picture bright(aFormats[9], pixels(0, 0, 1, 1), 1, 0xFF);
    Picture byte(aFormats[8], pixels(0, 0, 1, 1), 1, 0);
    run(bright.oImage_, byte.oImage_, world(0, 0, 1, 1));
    EXPECT_EQ(255, byte.get<std::uint8_t>(0, 0, 0));
    Picture word(aFormats[9], pixels(0, 0, 1, 1), 1, 0);
    run(bright.oImage_, word.oImage_, world(0, 0, 1, 1));
    EXPECT_EQ(65535, word.get<std::uint16_t>(0, 0, 0));
}

TEST_F(SourceIntoSinkTest, equalFormatsAreCopiedBitByBit) {
    Picture source(aFormats[7], pixels(0, 0, 5, 3), 8, 0);
    std::uint32_t const signallingNaN = 0x7F812345;
    std::memcpy(source.at(2, 1, 3), &signallingNaN, 4);
    source.put(1, 1, 0, -7.0f);
    source.put(1, 1, 1, 1e20f);
    Picture target(aFormats[7], pixels(0, 0, 5, 3), 6, 0);
    run(source.oImage_, target.oImage_, world(0, 0, 5, 3));
    EXPECT_EQ(signallingNaN, target.get<std::uint32_t>(2, 1, 3));
    EXPECT_EQ(-7.0f, target.get<float>(1, 1, 0));
    EXPECT_EQ(1e20f, target.get<float>(1, 1, 1));
}

TEST_F(SourceIntoSinkTest, copiesOnlyWhatItsImageCovers) {
    Picture source(aFormats[10], pixels(2, 2, 3, 3), 3, 0);
    paint(source);
    Picture target(aFormats[10], pixels(0, 0, 8, 8), 8, 0x2A);
    Picture const untouched(aFormats[10], pixels(0, 0, 8, 8), 8, 0x2A);
    run(source.oImage_, target.oImage_, world(0, 0, 4, 8));
    for (int y = 2; y < 5; ++y) {
        for (int x = 2; x < 4; ++x) {
            EXPECT_EQ(source.number(x, y, 0), target.number(x, y, 0));
            std::memset(target.at(x, y, 0), 0x2A, 4);
        }
    }
    EXPECT_EQ(0, std::memcmp(target.oImage_.pixels(), untouched.oImage_.pixels(), target.bytes()));
    run(source.oImage_, target.oImage_, world(5, 5, 3, 3)); // apart from the image
    run(source.oImage_, target.oImage_, world(0, 0, 2, 8));
    EXPECT_EQ(0, std::memcmp(target.oImage_.pixels(), untouched.oImage_.pixels(), target.bytes()));
}

TEST_F(SourceIntoSinkTest, neverWritesOutsideTheClientsImage) {
    Picture source(aFormats[10], pixels(0, 0, 8, 8), 8, 0);
    Picture target(aFormats[10], pixels(0, 0, 4, 4), 4, 0x2A);
    Picture const untouched(aFormats[10], pixels(0, 0, 4, 4), 4, 0x2A);
    ORVO_EXPECT_INTERNAL(run(source.oImage_, target.oImage_, world(0, 0, 5, 4)),
                         "Compute region lies outside the bound output image");
    EXPECT_EQ(0, std::memcmp(target.oImage_.pixels(), untouched.oImage_.pixels(), target.bytes()));
}

TEST_F(SourceIntoSinkTest, anImageMayBeItsOwnSink) {
    Picture both(aFormats[10], pixels(0, 0, 4, 4), 4, 0);
    paint(both);
    double const before = both.number(3, 2, 0);
    run(both.oImage_, both.oImage_, world(0, 0, 4, 4));
    EXPECT_EQ(before, both.number(3, 2, 0));
}

TEST_F(SourceIntoSinkTest, withoutAnImageTheBoundOneStays) {
    ImageFlowController controller;
    ImageCPUInput source;
    Picture target(aFormats[10], pixels(0, 0, 4, 4), 4, 0x2A);
    controller.addNode(&source);
    controller.setImageSink(source);
    source.setBoundOutputImage(&target.oImage_);
    source.computeRegionParameter().setValue(world(0, 0, 4, 4));
    source.emit();
    ORVO_EXPECT_INTERNAL(controller.process(), "No ImageCPU set yet.");
    EXPECT_EQ(0x2A2A2A2Au, target.get<std::uint32_t>(0, 0, 0));
    // The frame after the failed one is right.
    Picture image(aFormats[10], pixels(0, 0, 4, 4), 4, 0);
    controller.flushGraph();
    source.setImageCPUWithNoOwnership(&image.oImage_);
    source.emit();
    controller.process();
    EXPECT_EQ(0.0f, target.get<float>(3, 3, 0));
}

} // namespace

} // namespace ORVO
