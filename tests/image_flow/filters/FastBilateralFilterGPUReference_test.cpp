// The bilateral filter on OpenGL against its formulas in double precision.
#include "orvo/image_flow/filters/FastBilateralFilterGPU.h"
#include "orvo/ogl/ExtensionManager.h"
#include "tests/image_flow/support/GPUBilateralReference.h"

namespace {

using namespace ORVO;
using namespace ORVO::Test;
using gpuBilateral::filtered;
using gpuBilateral::halfTowardZero;
using gpuBilateral::largestDifference;
using gpuBilateral::scene;
using gpuBilateral::Settings;
using gpuBilateral::vividScene;
using OGL::ExtensionManager;

constexpr double kByteTolerance = 2.0 / 255.0;
constexpr double kHalfTolerance = 0.004;
// The way back from Lab multiplies the rounding of the grid.
constexpr double kLabHalfTolerance = 0.0055;
// Where the reference rounds alike: the rounding of the result, of 8 bits to the nearest, and of what the
// driver computes in 32-bit floats.
constexpr double kByteStep = 0.5 / 255.0 + 0.001;
constexpr double kHalfStep = 0.001;

/// One filter in a graph of its own, for either way to read the grid.
class BilateralRoad {
public:
    BilateralRoad(OGL::Context const& context, bool bHardwareFilters)
        : oVendor_(bHardwareFilters), oRoad_(context, oFilter_) {}

    FastBilateralFilterGPU& filter() { return oFilter_; }
    ShaderRoad& road() { return oRoad_; }

    ImageGPU const& run(ImageGPU& image, PositionExtentInPixelSpace const& region, Settings const& s,
                        bool bHalf) {
        oFilter_.spatialSigma().setValue(float2(float(s.sigmaX), float(s.sigmaY)));
        oFilter_.rangeSigma().setValue(s.rangeSigma);
        oFilter_.colorize().setValue(s.colorize);
        oFilter_.outputPrecisionHintParameter().setValue(bHalf ? ImageFilter::OUTPUT_PRECISION_16_BIT_FLOAT
                                                               : ImageFilter::OUTPUT_PRECISION_8_BIT_INT);
        oRoad_.setInput(0, image);
        ImageGPU const* const pResult = oRoad_.run(pixelToWorldSpace(region, image.pixelExtent()));
        EXPECT_NE(nullptr, pResult);
        EXPECT_EQ(bHalf ? ImageGPU::PIXEL_FORMAT_RGBA16F : ImageGPU::PIXEL_FORMAT_RGBA8,
                  pResult->pixelFormat());
        return *pResult;
    }

private:
    /// In force while the filter is made, which is when it chooses.
    struct Vendor {
        explicit Vendor(bool bHardwareFilters) {
            ExtensionManager::Instance()->overrideVendor(bHardwareFilters ? ExtensionManager::VENDOR_NVIDIA
                                                                          : ExtensionManager::VENDOR_MESA);
        }
        ~Vendor() { ExtensionManager::Instance()->clearOverrides(); }
    };

    Vendor oVendor_;
    FastBilateralFilterGPU oFilter_;
    ShaderRoad oRoad_;
};

class FastBilateralFilterGPUReferenceTest : public ShaderFlowTest {
protected:
    /// Both output formats, and both ways to read the grid, against the reference that rounds as the software
    /// driver does, and, with bExactly, against the one that does not round.
    void expectAsReference(ImageGPU& image, PositionExtentInPixelSpace const& region, Settings const& s,
                           bool bExactly = true) {
        Texels const input(image);
        Texels const rounded = filtered(input, region, s, halfTowardZero);
        Texels const exact = filtered(input, region, s);
        for (bool const bHardwareFilters : {false, true}) {
            BilateralRoad road(frameContext(), bHardwareFilters);
            for (bool const bHalf : {false, true}) {
                SCOPED_TRACE(testing::Message()
                             << (bHardwareFilters ? "filtered by the texture unit" : "mixed by the program")
                             << (bHalf ? ", 16-bit float" : ", 8 bits"));
                Texels const result(road.run(image, region, s, bHalf));
                EXPECT_LE(largestDifference(result, rounded, !bHalf), bHalf ? kHalfStep : kByteStep);
                if (bExactly) {
                    double const dHalf = s.colorize ? kLabHalfTolerance : kHalfTolerance;
                    EXPECT_LE(largestDifference(result, exact, !bHalf), bHalf ? dHalf : kByteTolerance);
                }
                EXPECT_EQ(image.pixelExtent(), result.pixelExtent());
            }
        }
    }
};

TEST_F(FastBilateralFilterGPUReferenceTest, SmoothsPicturesAsTheFormulasSay) {
    PositionExtentInPixelSpace const region = pixels(0, 0, 45, 37);
    ImageGPUPtr const upImage = textureOf(scene(region, 1), ImageGPU::PIXEL_FORMAT_RGBA32F, false);
    ImageGPUPtr const upVivid = textureOf(vividScene(region, 1), ImageGPU::PIXEL_FORMAT_RGBA32F, false);
    for (Settings const& s :
         {Settings{5, 5, 0.15F, false}, Settings{5, 5, 0.15F, true}, Settings{1, 2.5, 0.06F, false},
          Settings{3.3, 1, 0.3F, true}, Settings{4, 2, 1.0F, false}, Settings{0.5, 0.7, 0.2F, true}}) {
        SCOPED_TRACE(testing::Message()
                     << s.sigmaX << ", " << s.sigmaY << ", " << s.rangeSigma << ", " << s.colorize);
        expectAsReference(*upImage, region, s);
        // Vivid colours multiply the rounding further on the way back from Lab.
        expectAsReference(*upVivid, region, s, !s.colorize);
    }
}

TEST_F(FastBilateralFilterGPUReferenceTest, TheComparisonSeesMistakes) {
    PositionExtentInPixelSpace const region = pixels(0, 0, 45, 37);
    Settings const s{3, 3, 0.15F, true};
    Texels const expected = filtered(scene(region, 1), region, s);
    for (auto const& [sName, mistake] : mistakesIn(expected)) {
        EXPECT_GT(largestDifference(mistake, expected, false), kHalfTolerance) << sName;
    }
    for (Settings const& other : {Settings{3.2, 3, 0.15F, true}, Settings{3, 3.2, 0.15F, true},
                                  Settings{3, 3, 0.17F, true}, Settings{3, 3, 0.15F, false}}) {
        EXPECT_GT(largestDifference(filtered(scene(region, 1), region, other), expected, false),
                  kHalfTolerance);
    }
}

TEST_F(FastBilateralFilterGPUReferenceTest, FiltersEveryFormat) {
    PositionExtentInPixelSpace const region = pixels(0, 0, 19, 17);
    for (ImageGPU::tePixelFormat const format : aTextureFormats) {
        SCOPED_TRACE(testing::Message() << format);
        ImageGPUPtr const upImage = textureOf(scene(region, 2), format, false);
        BilateralRoad road(frameContext(), false);
        Settings const s{3, 2, 0.15F, true};
        Texels const result(road.run(*upImage, region, s, true));
        Texels input(*upImage);
        if (format >= ImageGPU::PIXEL_FORMAT_LUMINANCE8) {
            // Read back, a luminance is red alone; drawn, it is grey.
            input.fill([&](int x, int y) {
                Pixel const p = input.at(x, y);
                return Pixel{p[0], p[0], p[0], p[3]};
            });
        }
        EXPECT_LE(largestDifference(result, filtered(input, region, s), false), kHalfTolerance);
    }
}

TEST_F(FastBilateralFilterGPUReferenceTest, PicturesBeyondOneAreFilteredAsFarAsTheGridReaches) {
    PositionExtentInPixelSpace const region = pixels(0, 0, 31, 26);
    for (bool const bColorize : {false, true}) {
        // Cells of up to 1.6 lie on the padding, those of values around 2.5 do not exist. At the end of the
        // grid, results come from the far ends of the bell, where 16-bit floats have few digits left.
        for (double const high : {1.3, 1.6, 2.6}) {
            ImageGPUPtr const upImage =
                textureOf(scene(region, 3, -0.2, high), ImageGPU::PIXEL_FORMAT_RGBA32F);
            expectAsReference(*upImage, region, Settings{4, 4, 0.2F, bColorize}, high < 1.5);
        }
    }
    Texels bright(region);
    bright.fill([](int, int) { return Pixel{3, 3, 3, 1}; });
    ImageGPUPtr const upImage = textureOf(bright, ImageGPU::PIXEL_FORMAT_RGBA32F);
    BilateralRoad road(frameContext(), false);
    EXPECT_EQ((Pixel{0, 0, 0, 1}), Texels(road.run(*upImage, region, {}, true)).at(5, 5));
}

TEST_F(FastBilateralFilterGPUReferenceTest, ColoursOfTransparentPixelsCountAsTheyStand) {
    PositionExtentInPixelSpace const region = pixels(0, 0, 33, 21);
    ImageGPUPtr const upImage =
        textureOf(scene(region, 4, 0, 1, false), ImageGPU::PIXEL_FORMAT_RGBA32F, false);
    for (bool const bColorize : {false, true}) {
        expectAsReference(*upImage, region, Settings{3, 4, 0.15F, bColorize});
    }
}

TEST_F(FastBilateralFilterGPUReferenceTest, RegionsMayCoverAPartOrReachBeyondTheInput) {
    for (auto const& input : {pixels(0, 0, 40, 30), pixels(-7, 12, 40, 30)}) {
        ImageGPUPtr const upImage =
            textureOf(scene(input, 5, 0, 1, false), ImageGPU::PIXEL_FORMAT_RGBA32F, false);
        int const x = input.position().x();
        int const y = input.position().y();
        for (auto const& region :
             {pixels(x + 8, y + 9, 13, 11), pixels(x - 5, y - 3, 50, 36), pixels(x + 33, y + 22, 12, 13),
              pixels(x - 6, y + 2, 9, 1), pixels(x + 20, y + 3, 1, 9), pixels(x + 3, y + 4, 1, 1)}) {
            SCOPED_TRACE(testing::Message()
                         << x << ", " << y << ": " << region.position().x() << ", " << region.position().y());
            expectAsReference(*upImage, region, Settings{3, 2, 0.15F, true});
        }
    }
}

TEST_F(FastBilateralFilterGPUReferenceTest, SigmasCountPixelsOfAnySize) {
    for (auto const& pixelExtent :
         {PixelExtentInWorldSpace(2.0F, 0.5F), PixelExtentInWorldSpace(0.25F, 3.0F)}) {
        PositionExtentInPixelSpace const input = pixels(4, -6, 36, 28);
        ImageGPUPtr const upImage =
            textureOf(scene(input, 6, 0, 1, true, pixelExtent), ImageGPU::PIXEL_FORMAT_RGBA32F, false);
        for (auto const& region : {input, pixels(10, 2, 17, 15)}) {
            expectAsReference(*upImage, region, Settings{4, 3, 0.15F, true});
        }
    }
}

TEST_F(FastBilateralFilterGPUReferenceTest, LargeSigmasRoundAsTheDriversBlendingDoes) {
    PositionExtentInPixelSpace const region = pixels(0, 0, 96, 80);
    ImageGPUPtr const upImage = textureOf(scene(region, 7, 0, 0.6), ImageGPU::PIXEL_FORMAT_RGBA32F);
    for (Settings const& s :
         {Settings{10, 10, 0.15F, false}, Settings{20, 20, 0.15F, true}, Settings{40, 30, 0.3F, false}}) {
        SCOPED_TRACE(testing::Message() << s.sigmaX);
        expectAsReference(*upImage, region, s, false);
    }
    // The rounding is what makes the difference.
    Settings const s{40, 40, 0.3F, false};
    Texels const input(*upImage);
    EXPECT_GT(
        largestDifference(filtered(input, region, s, halfTowardZero), filtered(input, region, s), false),
        2 * kHalfTolerance);
}

TEST_F(FastBilateralFilterGPUReferenceTest, RandomFramesInARowAreAsTheFormulasSay) {
    BilateralRoad mixing(frameContext(), false);
    BilateralRoad filtering(frameContext(), true);
    std::mt19937 random(5);
    auto const pick = [&](int low, int high) { return low + int(random() % unsigned(high - low + 1)); };
    for (int frame = 0; frame < 60; ++frame) {
        PositionExtentInPixelSpace const input =
            pixels(pick(-30, 30), pick(-30, 30), pick(1, 24), pick(1, 24));
        PixelExtentInWorldSpace const pixelExtent =
            pick(0, 3) == 0 ? PixelExtentInWorldSpace(0.5F, 2.0F) : PixelExtentInWorldSpace();
        ImageGPUPtr const upImage = textureOf(
            scene(input, unsigned(frame), 0, 1, pick(0, 1) == 0, pixelExtent, 0.1 * pick(0, 10)),
            pick(0, 1) == 0 ? ImageGPU::PIXEL_FORMAT_RGBA8 : ImageGPU::PIXEL_FORMAT_RGBA16F, pick(0, 1) == 0);
        // Anywhere on the input and one pixel around it, which every sigma reaches.
        int const left = pick(-1, input.extent().width() - 1);
        int const top = pick(-1, input.extent().height() - 1);
        PositionExtentInPixelSpace const region =
            pixels(input.position().x() + left, input.position().y() + top,
                   pick(1, input.extent().width() - left), pick(1, input.extent().height() - top));
        Settings const s{0.1 * pick(10, 80), 0.1 * pick(10, 80), 0.01F * float(pick(6, 100)),
                         pick(0, 1) == 0};
        bool const bHalf = pick(0, 1) == 0;
        BilateralRoad& road = pick(0, 1) == 0 ? mixing : filtering;
        EXPECT_LE(largestDifference(Texels(road.run(*upImage, region, s, bHalf)),
                                    filtered(Texels(*upImage), region, s, halfTowardZero), !bHalf),
                  bHalf ? kHalfStep : kByteStep)
            << "frame " << frame;
    }
}

TEST_F(FastBilateralFilterGPUReferenceTest, PixelsOutsideTheRegionHaveNoInfluence) {
    PositionExtentInPixelSpace const input = pixels(-4, 3, 30, 24);
    PositionExtentInPixelSpace const region = pixels(3, 9, 12, 10);
    Texels const clean = scene(input, 10);
    Texels poisoned = clean;
    double const nan = std::numeric_limits<double>::quiet_NaN();
    poisoned.fill([&](int x, int y) {
        return Texels(region).contains(x, y) ? clean.at(x, y) : Pixel{nan, nan, nan, nan};
    });
    ImageGPUPtr const upClean = textureOf(clean, ImageGPU::PIXEL_FORMAT_RGBA32F, false);
    ImageGPUPtr const upPoisoned = textureOf(poisoned, ImageGPU::PIXEL_FORMAT_RGBA32F, false);
    for (bool const bHardwareFilters : {false, true}) {
        for (bool const bColorize : {false, true}) {
            BilateralRoad road(frameContext(), bHardwareFilters);
            Settings const s{3, 2, 0.15F, bColorize};
            Texels const expected(road.run(*upClean, region, s, true));
            EXPECT_EQ(0.0,
                      largestDifference(Texels(road.run(*upPoisoned, region, s, true)), expected, false));
        }
    }
}

TEST_F(FastBilateralFilterGPUReferenceTest, ABoundImageGetsItsRegionAndNothingElse) {
    PositionExtentInPixelSpace const input = pixels(0, 0, 30, 24);
    ImageGPUPtr const upImage = textureOf(scene(input, 8), ImageGPU::PIXEL_FORMAT_RGBA32F, false);
    PositionExtentInPixelSpace const region = pixels(5, 6, 14, 9);
    Settings const s{2, 3, 0.15F, true};
    Texels const expected = filtered(Texels(*upImage), region, s);
    for (bool const bHardwareFilters : {false, true}) {
        for (ImageGPU::tePixelFormat const format :
             {ImageGPU::PIXEL_FORMAT_RGBA8, ImageGPU::PIXEL_FORMAT_RGBA16F, ImageGPU::PIXEL_FORMAT_RGBA32F}) {
            Texels const before = scene(pixels(2, 3, 25, 20), 9);
            ImageGPUPtr const upTarget = textureOf(before, format, false);
            Texels const stored(*upTarget);
            BilateralRoad road(frameContext(), bHardwareFilters);
            road.filter().spatialSigma().setValue(float2(2.0F, 3.0F));
            road.filter().colorize().setValue(true);
            road.road().setInput(0, *upImage);
            road.road().runInto(*upTarget, world(5, 6, 14, 9));
            Texels const after(*upTarget);
            Texels wanted = stored;
            Texels part(region);
            part.fill([&](int x, int y) { return after.at(x, y); });
            EXPECT_LE(largestDifference(part, expected, format == ImageGPU::PIXEL_FORMAT_RGBA8),
                      kByteTolerance);
            wanted.fill([&](int x, int y) { return part.contains(x, y) ? part.at(x, y) : stored.at(x, y); });
            EXPECT_EQ(0.0, largestDifference(after, wanted, false)) << "pixels outside the region changed";
        }
    }
}

} // namespace
