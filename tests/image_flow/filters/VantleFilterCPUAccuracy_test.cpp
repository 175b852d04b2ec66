// The CPU road against the colour library used directly, in double precision, without optimisation.
#include "orvo/image_flow/filters/VantleFilterCPU.h"

#include "orvo/colour_engine/ColourEngine.h"
#include "orvo/image_flow/colour/CVantle.h"
#include "tests/colour_engine/support/ICCProfiles.h"
#include "tests/image_flow/support/FilterRoad.h"
#include "tests/support/ImageFlowLayers.h"

#include <gtest/gtest.h>
#include <lcms2.h>

#include <array>
#include <cstdint>
#include <cstring>
#include <random>

namespace {

using namespace ORVO;
using namespace ORVO::Test;
using ColourEngine::profileCode;

struct CloseProfile {
    using pointer = cmsHPROFILE;
    void operator()(cmsHPROFILE pProfile) const { cmsCloseProfile(pProfile); }
};
using LcmsProfile = std::unique_ptr<void, CloseProfile>;

struct DeleteTransform {
    using pointer = cmsHTRANSFORM;
    void operator()(cmsHTRANSFORM pTransform) const { cmsDeleteTransform(pTransform); }
};
using LcmsTransform = std::unique_ptr<void, DeleteTransform>;

struct FreeCurve {
    void operator()(cmsToneCurve* pCurve) const { cmsFreeToneCurve(pCurve); }
};
using LcmsCurve = std::unique_ptr<cmsToneCurve, FreeCurve>;

/// A space as it is published, made here and not by the engine.
struct Space {
    char const* name;
    std::uint32_t code;
    bool gray;
    std::array<double, 6> primaries; ///< x and y of red, green and blue; white is D65
    int curve;                       ///< of the colour library: 1 a power, 4 a power with a linear foot
    std::array<double, 5> parameters;
};

constexpr std::array<double, 5> kSRGBCurve = {2.4, 1 / 1.055, 0.055 / 1.055, 1 / 12.92, 0.04045};

constexpr Space kSpaces[] = {
    {"wide gamut", 0x41533938, false, {0.64, 0.33, 0.21, 0.71, 0.15, 0.06}, 1, {563.0 / 256.0}},
    {"sRGB", profileCode("sRGB"), false, {0.64, 0.33, 0.30, 0.60, 0.15, 0.06}, 4, kSRGBCurve},
    {"Display P3", profileCode("P3  "), false, {0.680, 0.320, 0.265, 0.690, 0.150, 0.060}, 4, kSRGBCurve},
    {"BT.2020",
     profileCode("2020"),
     false,
     {0.708, 0.292, 0.170, 0.797, 0.131, 0.046},
     4,
     {1 / 0.45, 1 / 1.09929682680944, 0.09929682680944 / 1.09929682680944, 1 / 4.5, 4.5 * 0.018053968510807}},
    {"linear", profileCode("LnRG"), false, {0.64, 0.33, 0.30, 0.60, 0.15, 0.06}, 1, {1.0}},
    {"grey", profileCode("GRAY"), true, {}, 1, {2.2}},
};

Space const& spaceOf(std::uint32_t code) {
    for (Space const& space : kSpaces) {
        if (space.code == code) {
            return space;
        }
    }
    throw std::logic_error("no such space");
}

LcmsProfile profileOf(Space const& space) {
    cmsCIExyY const white = {0.3127, 0.3290, 1.0};
    LcmsCurve const spCurve(cmsBuildParametricToneCurve(nullptr, space.curve, space.parameters.data()));
    if (space.gray) {
        return LcmsProfile(cmsCreateGrayProfile(&white, spCurve.get()));
    }
    auto const& p = space.primaries;
    cmsCIExyYTRIPLE const primaries = {{p[0], p[1], 1.0}, {p[2], p[3], 1.0}, {p[4], p[5], 1.0}};
    cmsToneCurve* const curves[] = {spCurve.get(), spCurve.get(), spCurve.get()};
    return LcmsProfile(cmsCreateRGBProfile(&white, &primaries, curves));
}

/// A profile as it comes from a device: three different tables of 256 entries as curves, primaries of its
/// own, written out and read again, so that its numbers are those of a file. They are not steep at black: the
/// colour library looks such curves up in steps of 1/65535 of the light, and a steep one becomes a staircase
/// whose steps are larger than what is asked here.
std::vector<unsigned char> measuredProfile() {
    LcmsCurve aCurves[3];
    cmsToneCurve* pCurves[3];
    for (std::size_t c = 0; c < 3; ++c) {
        std::vector<cmsUInt16Number> aTable;
        for (int i = 0; i < 256; ++i) {
            double const x = i / 255.0;
            double const y = 0.2 * x + 0.8 * std::pow(x, 1.7 + 0.2 * static_cast<double>(c));
            aTable.push_back(static_cast<cmsUInt16Number>(std::lround(65535.0 * y)));
        }
        aCurves[c].reset(cmsBuildTabulatedToneCurve16(nullptr, 256, aTable.data()));
        pCurves[c] = aCurves[c].get();
    }
    cmsCIExyY const white = {0.3457, 0.3585, 1.0};
    cmsCIExyYTRIPLE const primaries = {{0.66, 0.32, 1.0}, {0.25, 0.65, 1.0}, {0.14, 0.08, 1.0}};
    LcmsProfile const spProfile(cmsCreateRGBProfile(&white, &primaries, pCurves));
    cmsUInt32Number nBytes = 0;
    EXPECT_TRUE(cmsSaveProfileToMem(spProfile.get(), nullptr, &nBytes));
    std::vector<unsigned char> aBytes(nBytes);
    EXPECT_TRUE(cmsSaveProfileToMem(spProfile.get(), aBytes.data(), &nBytes));
    return aBytes;
}

constexpr std::uint32_t kMeasured = profileCode("Meas");

struct EngineTransform {
    EngineTransform(std::uint32_t source, std::uint32_t destination) {
        VantleProfile* pSource = nullptr;
        VantleProfile* pDestination = nullptr;
        VantleTransform* pRaw = nullptr;
        EXPECT_EQ(0U, CVantle::ProfileFromCode(&pSource, source));
        EXPECT_EQ(0U, CVantle::ProfileFromCode(&pDestination, destination));
        EXPECT_EQ(0U, CVantle::MakeColorTransform(&pRaw, pSource, pDestination, 0, 0));
        EXPECT_EQ(0U, CVantle::OptimizeTransform(&pTransform, pRaw, 0));
        CVantle::UnReferenceTransform(pRaw);
        CVantle::UnReferenceProfile(pSource);
        CVantle::UnReferenceProfile(pDestination);
    }
    ~EngineTransform() { CVantle::UnReferenceTransform(pTransform); }
    EngineTransform(EngineTransform const&) = delete;
    EngineTransform& operator=(EngineTransform const&) = delete;

    VantleTransform* pTransform = nullptr;
};

using Triple = std::array<double, 3>;

/// The colour library itself; grey in and out as three equal values.
class Reference {
public:
    Reference(LcmsProfile const& spSource, LcmsProfile const& spDestination)
        : bGrayIn_(cmsGetColorSpace(spSource.get()) == cmsSigGrayData),
          bGrayOut_(cmsGetColorSpace(spDestination.get()) == cmsSigGrayData),
          spTransform_(cmsCreateTransform(spSource.get(), bGrayIn_ ? TYPE_GRAY_DBL : TYPE_RGB_DBL,
                                          spDestination.get(), bGrayOut_ ? TYPE_GRAY_DBL : TYPE_RGB_DBL,
                                          INTENT_PERCEPTUAL, cmsFLAGS_NOOPTIMIZE | cmsFLAGS_NOCACHE)) {}

    Triple operator()(Triple const& colour) const {
        Triple const input = bGrayIn_ ? Triple{colour[1], 0.0, 0.0} : colour;
        Triple result{};
        cmsDoTransform(spTransform_.get(), input.data(), result.data(), 1);
        if (bGrayOut_) {
            result = {result[0], result[0], result[0]};
        }
        for (double& value : result) {
            value = std::min(std::max(value, 0.0), 1.0);
        }
        return result;
    }

private:
    bool bGrayIn_;
    bool bGrayOut_;
    LcmsTransform spTransform_;
};

struct Layout {
    ImageCPU::tePixelFormat format;
    bool words;
    int channels; ///< of colour
};

constexpr Layout kLayouts[] = {
    {ImageCPU::PIXEL_FORMAT_RGB8, false, 3},       {ImageCPU::PIXEL_FORMAT_RGBA8, false, 3},
    {ImageCPU::PIXEL_FORMAT_RGB16, true, 3},       {ImageCPU::PIXEL_FORMAT_RGBA16, true, 3},
    {ImageCPU::PIXEL_FORMAT_LUMINANCE8, false, 1}, {ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA8, false, 1},
    {ImageCPU::PIXEL_FORMAT_LUMINANCE16, true, 1}, {ImageCPU::PIXEL_FORMAT_LUMINANCE_ALPHA16, true, 1},
};

constexpr int kWidth = 61;
constexpr int kHeight = 48;

class Picture16 {
public:
    explicit Picture16(Layout const& layout)
        : layout_(layout),
          oImage_(layout.format, pixels(0, 0, kWidth, kHeight), PixelExtentInWorldSpace(1.0F, 1.0F),
                  ExtentInPixelSpace(kWidth + 3, kHeight)) {
        oImage_.initializeToTransparentBlack();
    }

    ImageCPU& image() { return oImage_; }
    int allChannels() const { return static_cast<int>(nChannels(layout_.format)); }
    int white() const { return layout_.words ? 32768 : 255; }

    int get(int x, int y, int channel) const {
        std::uint16_t value = 0;
        std::memcpy(&value, sample(x, y, channel), layout_.words ? 2 : 1);
        return value;
    }
    void set(int x, int y, int channel, int value) {
        auto const word = static_cast<std::uint16_t>(value);
        std::memcpy(const_cast<unsigned char*>(sample(x, y, channel)), &word, layout_.words ? 2 : 1);
    }
    Triple colour(int x, int y) const {
        Triple result{};
        for (int c = 0; c < 3; ++c) {
            result[static_cast<std::size_t>(c)] =
                static_cast<double>(get(x, y, layout_.channels == 1 ? 0 : c)) / white();
        }
        return result;
    }

    /// A lattice over the cube in the first rows, a ramp of greys, then colours at random; alpha at random.
    void fill() {
        std::mt19937 random(5);
        for (int i = 0; i < kWidth * kHeight; ++i) {
            for (int c = 0; c < allChannels(); ++c) {
                constexpr int divisors[] = {1, 9, 81};
                int value = static_cast<int>(random() % static_cast<unsigned>(white() + 1));
                if (c < layout_.channels && i < 729) {
                    value = i / divisors[c] % 9 * white() / 8;
                } else if (c < layout_.channels && i < 1240) {
                    value = (i - 729) * white() / 510;
                }
                set(i % kWidth, i / kWidth, c, value);
            }
        }
    }

private:
    unsigned char const* sample(int x, int y, int channel) const {
        return oImage_.pixels() + (y * (kWidth + 3) + x) * static_cast<int>(pixelSizeBytes(layout_.format)) +
               channel * (layout_.words ? 2 : 1);
    }

    Layout layout_;
    ImageCPU oImage_;
};

/// How far a result may be from the exact value, which has a fraction, on the scale of the samples.
struct Tolerance {
    double bytes;
    double words;
};

/// Rounding to the nearest, and light that lies between two entries of a table.
constexpr Tolerance kRounding = {0.6, 1.0};

/// Runs a frame from one layout to another and compares every pixel.
void expectAccuracy(VantleTransform* pTransform, Reference const& reference, Layout const& from,
                    Layout const& to, Tolerance const& tolerance) {
    Picture16 source(from);
    Picture16 target(to);
    source.fill();
    FilterRoad<VantleFilterCPU> road;
    road.filter().transform()->setValue(pTransform);
    road.runInto(source.image(), target.image(), world(0, 0, kWidth, kHeight));
    double worst = 0.0;
    for (int y = 0; y < kHeight; ++y) {
        for (int x = 0; x < kWidth; ++x) {
            Triple const exact = reference(source.colour(x, y));
            for (int c = 0; c < to.channels; ++c) {
                double const value = exact[to.channels == 1 ? 1 : static_cast<std::size_t>(c)];
                worst = std::max(worst, std::abs(value * target.white() - target.get(x, y, c)));
            }
            if (source.allChannels() > from.channels && target.allChannels() > to.channels &&
                from.words == to.words) {
                ASSERT_EQ(source.get(x, y, from.channels), target.get(x, y, to.channels));
            }
        }
    }
    EXPECT_LE(worst, to.words ? tolerance.words : tolerance.bytes);
}

void expectAccuracy(std::uint32_t source, LcmsProfile const& spSource, std::uint32_t destination,
                    LcmsProfile const& spDestination, Tolerance const& tolerance) {
    EngineTransform const transform(source, destination);
    Reference const reference(spSource, spDestination);
    for (Layout const& from : kLayouts) {
        for (Layout const& to : kLayouts) {
            bool const bFromFits =
                (cmsGetColorSpace(spSource.get()) == cmsSigGrayData) == (from.channels == 1);
            bool const bToFits =
                (cmsGetColorSpace(spDestination.get()) == cmsSigGrayData) == (to.channels == 1);
            // An alpha without room lies over the last colour.
            bool const bAlphaFits = nChannels(from.format) == static_cast<std::size_t>(from.channels) ||
                                    nChannels(to.format) > static_cast<std::size_t>(to.channels);
            if (bFromFits && bToFits && bAlphaFits) {
                SCOPED_TRACE(testing::Message() << from.format << " to " << to.format);
                expectAccuracy(transform.pTransform, reference, from, to, tolerance);
            }
        }
    }
}

TEST(VantleFilterCPUAccuracy, BuiltInSpaces) {
    ImageFlowLayers const layers;
    struct Pair {
        std::uint32_t source;
        std::uint32_t destination;
    };
    for (Pair const& pair :
         {Pair{profileCode("sRGB"), 0x41533938}, Pair{0x41533938, profileCode("sRGB")},
          Pair{profileCode("P3  "), profileCode("2020")}, Pair{profileCode("2020"), profileCode("sRGB")},
          Pair{profileCode("LnRG"), profileCode("P3  ")}, Pair{profileCode("sRGB"), profileCode("LnRG")},
          Pair{profileCode("sRGB"), profileCode("GRAY")}, Pair{profileCode("GRAY"), profileCode("sRGB")},
          Pair{profileCode("GRAY"), profileCode("GRAY")}}) {
        Space const& source = spaceOf(pair.source);
        Space const& destination = spaceOf(pair.destination);
        SCOPED_TRACE(std::string(source.name) + " to " + destination.name);
        expectAccuracy(pair.source, profileOf(source), pair.destination, profileOf(destination), kRounding);
    }
}

TEST(VantleFilterCPUAccuracy, ProfilesOfTheHost) {
    ImageFlowLayers const layers;
    auto const aBytes = measuredProfile();
    ColourEngine::registerProfile(kMeasured, aBytes.data(), aBytes.size());
    LcmsProfile const spMeasured(
        cmsOpenProfileFromMem(aBytes.data(), static_cast<cmsUInt32Number>(aBytes.size())));
    Space const& sRGB = spaceOf(profileCode("sRGB"));
    expectAccuracy(kMeasured, spMeasured, sRGB.code, profileOf(sRGB), {0.6, 4.0});
    expectAccuracy(sRGB.code, profileOf(sRGB), kMeasured, spMeasured, {0.6, 4.0});
    EXPECT_TRUE(ColourEngine::unregisterProfile(kMeasured));
}

/// A profile without curves and a matrix goes through its own tables, in the roundings of the colour library.
TEST(VantleFilterCPUAccuracy, TablesOfTheHost) {
    ImageFlowLayers const layers;
    Bytes const aBytes = tableSourceProfile();
    ColourEngine::registerProfile(kMeasured, aBytes.data(), aBytes.size());
    LcmsProfile const spTables(
        cmsOpenProfileFromMem(aBytes.data(), static_cast<cmsUInt32Number>(aBytes.size())));
    Space const& sRGB = spaceOf(profileCode("sRGB"));
    expectAccuracy(kMeasured, spTables, sRGB.code, profileOf(sRGB), {0.6, 4.0});
    EXPECT_TRUE(ColourEngine::unregisterProfile(kMeasured));
}

/// Grey pictures through an RGB transform: (v, v, v) goes in and the green result comes out.
TEST(VantleFilterCPUAccuracy, GreyPicturesThroughTransformsOfColours) {
    ImageFlowLayers const layers;
    Space const& source = spaceOf(profileCode("P3  "));
    Space const& destination = spaceOf(0x41533938);
    EngineTransform const transform(source.code, destination.code);
    Reference const reference(profileOf(source), profileOf(destination));
    for (Layout const& from : kLayouts) {
        for (Layout const& to : kLayouts) {
            bool const bAlphaFits = nChannels(from.format) == static_cast<std::size_t>(from.channels) ||
                                    nChannels(to.format) > static_cast<std::size_t>(to.channels);
            if ((from.channels == 1 || to.channels == 1) && bAlphaFits) {
                SCOPED_TRACE(testing::Message() << from.format << " to " << to.format);
                expectAccuracy(transform.pTransform, reference, from, to, kRounding);
            }
        }
    }
}

TEST(VantleFilterCPUAccuracy, AnyDivisionIntoSlicesGivesTheSameBits) {
    ImageFlowLayers const layers;
    EngineTransform const transform(profileCode("sRGB"), 0x41533938);
    for (Layout const& layout : kLayouts) {
        std::vector<std::vector<int>> aResults;
        for (bool bSingle : {true, false}) {
            Picture16 source(layout);
            Picture16 target(layout);
            source.fill();
            FilterRoad<VantleFilterCPU> road;
            road.controller().setSingleThreadMode(bSingle);
            road.filter().transform()->setValue(transform.pTransform);
            road.runInto(source.image(), target.image(), world(0, 0, kWidth, kHeight));
            std::vector<int> aSamples;
            for (int i = 0; i < kWidth * kHeight * target.allChannels(); ++i) {
                int const pixel = i / target.allChannels();
                aSamples.push_back(target.get(pixel % kWidth, pixel / kWidth, i % target.allChannels()));
            }
            aResults.push_back(std::move(aSamples));
        }
        EXPECT_EQ(aResults[0], aResults[1]);
    }
}

} // namespace
