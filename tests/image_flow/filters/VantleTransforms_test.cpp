// Transforms of the embedded engine on the GPU against the same on the CPU: a dense lattice over the RGB
// cube, random colours, and the grey axis. Among the spaces is one whose curves are given as tables.
#include "orvo/image_flow/filters/VantleFilterGPU.h"

#include "tests/image_flow/support/ShaderRoad.h"

#include "orvo/colour_engine/ProfileCodes.h"
#include "orvo/colour_engine/ProfileRegistry.h"
#include "orvo/colour_engine/VantlePackingSpec.h"
#include "orvo/colour_engine/internal/Applier.h"
#include "orvo/colour_engine/internal/ResolvedTransform.h"
#include "orvo/colour_engine/internal/ShaderDescription.h"
#include "orvo/image_flow/colour/CVantle.h"
#include "orvo/image_flow/filters/VantleShaderAdapter.h"
#include "tests/colour_engine/support/ICCProfiles.h"
#include "tests/colour_engine/support/TableProfiles.h"
#include "tests/support/RecordingEngine.h"

#include <limits>

namespace {

using namespace ORVO;
using namespace ORVO::Test;
using namespace ORVO::ColourEngine;

/// A transform of the engine's, with the perceptual intent.
class EngineTransform {
public:
    EngineTransform(std::uint32_t source, std::uint32_t destination) {
        VantleProfile* pSource = nullptr;
        VantleProfile* pDestination = nullptr;
        VantleTransform* pRaw = nullptr;
        EXPECT_EQ(0U, CVantle::ProfileFromCode(&pSource, source));
        EXPECT_EQ(0U, CVantle::ProfileFromCode(&pDestination, destination));
        EXPECT_EQ(0U, CVantle::MakeColorTransform(&pRaw, pSource, pDestination, VANTLE_INTENT_PERCEPTUAL, 0));
        EXPECT_EQ(0U, CVantle::OptimizeTransform(&pTransform_, pRaw, 0));
        CVantle::UnReferenceTransform(pRaw);
        CVantle::UnReferenceProfile(pSource);
        CVantle::UnReferenceProfile(pDestination);
    }
    ~EngineTransform() { CVantle::UnReferenceTransform(pTransform_); }
    EngineTransform(EngineTransform const&) = delete;
    EngineTransform& operator=(EngineTransform const&) = delete;

    VantleTransform* get() const { return pTransform_; }

private:
    VantleTransform* pTransform_ = nullptr;
};

constexpr int nWidth = 128;
constexpr int nHeight = 64;
constexpr std::size_t nLatticeEdge = 17;

/// Colours in integers from 0 to white: the lattice, the grey axis, and random ones.
template <typename T>
std::vector<T> colours(unsigned white) {
    std::vector<T> aValues;
    std::mt19937 random(41);
    for (std::size_t i = 0; i < std::size_t(nWidth) * nHeight; ++i) {
        std::size_t const iGrey = i - nLatticeEdge * nLatticeEdge * nLatticeEdge;
        for (std::size_t c = 0; c < 3; ++c) {
            std::size_t const aIndex[] = {i % nLatticeEdge, i / nLatticeEdge % nLatticeEdge,
                                          i / nLatticeEdge / nLatticeEdge};
            unsigned value = 0;
            if (i < nLatticeEdge * nLatticeEdge * nLatticeEdge)
                value = static_cast<unsigned>(aIndex[c] * white / (nLatticeEdge - 1));
            else if (iGrey < 512)
                value = static_cast<unsigned>(iGrey * white / 511);
            else
                value = random() % (white + 1);
            aValues.push_back(static_cast<T>(value));
        }
    }
    return aValues;
}

/// The colours, through a function that transforms packed pixels.
template <typename T, typename Apply>
std::vector<T> packed(std::vector<T> const& aColours, Apply const& apply) {
    std::vector<T> aResult(aColours.size());
    auto const specOf = [](std::vector<T> const& aPixels) {
        _t_Vantle_PackingSpec spec{};
        spec.space = _t_Vantle_PackingSpec::SPACE_RGB;
        spec.channels = 3;
        spec.bytesPerChannel = sizeof(T);
        for (std::size_t c = 0; c < 3; ++c) {
            spec.planes[c].base = const_cast<T*>(aPixels.data() + c);
            spec.planes[c].columnBytes = 3 * sizeof(T);
            spec.planes[c].rowBytes = static_cast<std::int32_t>(nWidth * 3 * sizeof(T));
        }
        return spec;
    };
    _t_Vantle_PackingSpec const source = specOf(aColours);
    _t_Vantle_PackingSpec const destination = specOf(aResult);
    apply(source, destination);
    return aResult;
}

template <typename T>
std::vector<T> onCPU(std::vector<T> const& aColours, EngineTransform const& transform) {
    return packed(aColours, [&](auto const& source, auto const& destination) {
        EXPECT_EQ(0U,
                  CVantle::ApplyGeneral(transform.get(), &source, &destination, nHeight, nWidth, nullptr));
    });
}

template <typename T>
Texels pictureOf(std::vector<T> const& aColours, double white) {
    return Texels(pixels(0, 0, nWidth, nHeight)).fill([&](int x, int y) {
        std::size_t const i = 3 * (std::size_t(y) * nWidth + std::size_t(x));
        return Pixel{aColours[i] / white, aColours[i + 1] / white, aColours[i + 2] / white, 0.75};
    });
}

/// sRGB, with sampled curves.
constexpr std::uint32_t kSampled = profileCode("File");

class VantleTransformsTest : public ShaderFlowTest {
protected:
    VantleTransformsTest() {
        RecordingEngine::install();
        Bytes const aBytes = sampledProfile();
        registerProfile(kSampled, aBytes.data(), aBytes.size());
    }
    ~VantleTransformsTest() override { unregisterProfile(kSampled); }

    /// One filter, to whose changing transforms the colours are shown.
    struct Road {
        Road(OGL::Context const& context, Texels const& picture, ImageGPU::tePixelFormat format,
             ImageFilter::teOutputPrecisionHint hint)
            : upInput_(textureOf(picture, format)), oRoad_(context, oFilter_) {
            oFilter_.outputPrecisionHintParameter().setValue(hint);
            oRoad_.setInput(0, *upInput_);
        }
        Texels run(VantleTransform* pTransform) {
            oFilter_.transform()->setValue(pTransform);
            return Texels(*oRoad_.run(world(0, 0, nWidth, nHeight)));
        }

        ImageGPUPtr upInput_;
        VantleFilterGPU oFilter_;
        ShaderRoad oRoad_;
    };

    /// The largest difference of the colours, and the largest one between channels of a grey.
    struct Errors {
        double dLargest_ = 0;
        double dMean_ = 0;
        double dGrey_ = 0;
    };
    template <typename Expected>
    static Errors errorsOf(Texels const& actual, Texels const& input, Expected const& expected) {
        Errors errors;
        for (int y = 0; y < nHeight; ++y)
            for (int x = 0; x < nWidth; ++x) {
                Pixel const a = actual.at(x, y);
                Pixel const e = expected(x, y);
                for (std::size_t c = 0; c < 3; ++c) {
                    errors.dLargest_ = std::max(errors.dLargest_, std::abs(a[c] - e[c]));
                    errors.dMean_ += std::abs(a[c] - e[c]) / (3.0 * nWidth * nHeight);
                }
                EXPECT_NEAR(0.75, a[3], 0.5 / 255.0);
                Pixel const i = input.at(x, y);
                if (i[0] == i[1] && i[1] == i[2])
                    errors.dGrey_ = std::max({errors.dGrey_, std::abs(a[0] - a[1]), std::abs(a[1] - a[2])});
            }
        return errors;
    }
};

// The colour library rounds what sampled curves give to 16 bits. A table interpolates between such steps;
// what that is near black, a destination of a plain gamma magnifies beyond a thousandth: of those, bytes
// alone.
constexpr std::pair<std::uint32_t, std::uint32_t> aPairs[] = {
    {PROFILE_WIDE_GAMUT, PROFILE_SRGB},  {PROFILE_SRGB, PROFILE_WIDE_GAMUT},
    {PROFILE_SRGB, PROFILE_DISPLAY_P3},  {PROFILE_DISPLAY_P3, PROFILE_BT_2020},
    {PROFILE_BT_2020, PROFILE_SRGB},     {PROFILE_LINEAR_SRGB, PROFILE_SRGB},
    {PROFILE_SRGB, PROFILE_LINEAR_SRGB}, {PROFILE_WIDE_GAMUT, PROFILE_LINEAR_SRGB},
    {PROFILE_GRAY, PROFILE_SRGB},        {PROFILE_SRGB, PROFILE_GRAY},
    {PROFILE_SRGB, PROFILE_SRGB},        {kSampled, PROFILE_DISPLAY_P3},
    {PROFILE_WIDE_GAMUT, kSampled},      {kSampled, kSampled},
    {kSampled, PROFILE_WIDE_GAMUT}};

TEST_F(VantleTransformsTest, SampledCurvesAreTablesAndOthersAreNot) {
    struct Row {
        std::uint32_t source_;
        std::uint32_t destination_;
        std::vector<std::string> aParameters_;
    };
    Row const aRows[] = {{PROFILE_SRGB, PROFILE_WIDE_GAMUT, {}},
                         {PROFILE_GRAY, PROFILE_LINEAR_SRGB, {}},
                         {kSampled, PROFILE_WIDE_GAMUT, {"orvoInput0", "orvoMatrix"}},
                         {PROFILE_BT_2020, kSampled, {"orvoMatrix", "orvoOutput0"}},
                         {kSampled, kSampled, {"orvoInput0", "orvoMatrix", "orvoOutput0"}}};
    for (Row const& row : aRows) {
        EngineTransform const transform(row.source_, row.destination_);
        VantleShaderAdapter adapter(transform.get(), nullptr);
        ASSERT_TRUE(adapter.isValid());
        std::vector<std::string> aNames(adapter.numParameters());
        for (unsigned i = 0; i < aNames.size(); ++i)
            adapter.getParameter(i, aNames[i]);
        EXPECT_EQ(row.aParameters_, aNames) << std::hex << row.source_ << " " << row.destination_;
    }
}

TEST_F(VantleTransformsTest, ValuesOutsideAreThoseOfTheEnds) {
    constexpr float nan = std::numeric_limits<float>::quiet_NaN();
    // The driver's clamp() makes 0 of NaN.
    constexpr std::pair<double, double> aValues[] = {
        {-0.25, 0.0}, {-1e30, 0.0}, {1.5, 1.0}, {1e30, 1.0}, {nan, 0.0}};
    // For each value and channel three by three pixels of one colour, as their neighbours are read with a
    // weight of 0, which NaN comes through.
    auto const region = pixels(0, 0, 15, 9);
    auto const colourAt = [&](int x, int y, bool bOutside) {
        Pixel colour{0.25, 0.5, 0.75, 1.5};
        colour[std::size_t(y / 3)] = bOutside ? aValues[x / 3].first : aValues[x / 3].second;
        return colour;
    };
    Texels const outside = Texels(region).fill([&](int x, int y) { return colourAt(x, y, true); });
    Texels const inside = Texels(region).fill([&](int x, int y) { return colourAt(x, y, false); });
    for (auto const& [source, destination] : {std::pair(PROFILE_SRGB, PROFILE_WIDE_GAMUT),
                                              {PROFILE_WIDE_GAMUT, PROFILE_SRGB},
                                              {PROFILE_LINEAR_SRGB, PROFILE_LINEAR_SRGB},
                                              {kSampled, PROFILE_WIDE_GAMUT},
                                              {PROFILE_WIDE_GAMUT, kSampled},
                                              {kSampled, kSampled}}) {
        EngineTransform const transform(source, destination);
        auto const resultOf = [&](Texels const& picture) {
            ImageGPUPtr const upInput = textureOf(picture, ImageGPU::PIXEL_FORMAT_RGBA32F);
            VantleFilterGPU filter;
            filter.outputPrecisionHintParameter().setValue(ImageFilter::OUTPUT_PRECISION_16_BIT_FLOAT);
            filter.transform()->setValue(transform.get());
            ShaderRoad road(frameContext(), filter);
            road.setInput(0, *upInput);
            return Texels(*road.run(world(0, 0, 15, 9)));
        };
        Texels const expected = resultOf(inside);
        Texels const actual = resultOf(outside);
        for (int y = 1; y < 9; y += 3)
            for (int x = 1; x < 15; x += 3)
                EXPECT_EQ(expected.at(x, y), actual.at(x, y))
                    << std::hex << source << " " << destination << " " << x << " " << y;
        // An end is not what its channel would be in the middle.
        EXPECT_NE(expected.at(1, 1)[0], expected.at(7, 1)[0]);
    }
}

TEST_F(VantleTransformsTest, BytesAreWithinOneOfTheCPU) {
    auto const aColours = colours<std::uint8_t>(255);
    Texels const input = pictureOf(aColours, 255.0);
    Road road(frameContext(), input, ImageGPU::PIXEL_FORMAT_RGBA8, ImageFilter::OUTPUT_PRECISION_8_BIT_INT);
    for (auto const& [source, destination] : aPairs) {
        EngineTransform const transform(source, destination);
        Texels const expected = pictureOf(onCPU(aColours, transform), 255.0);
        Errors const errors =
            errorsOf(road.run(transform.get()), input, [&](int x, int y) { return expected.at(x, y); });
        EXPECT_LE(errors.dLargest_ * 255.0, 1.0 + 1e-3) << std::hex << source << " " << destination;
        EXPECT_LE(errors.dGrey_ * 255.0, 1.0 + 1e-3) << std::hex << source << " " << destination;
    }
}

TEST_F(VantleTransformsTest, FloatsAreWithinAThousandthOfTheCPU) {
    auto const aColours = colours<std::uint16_t>(32768);
    Texels const input = pictureOf(aColours, 32768.0);
    Road road(frameContext(), input, ImageGPU::PIXEL_FORMAT_RGBA32F,
              ImageFilter::OUTPUT_PRECISION_16_BIT_FLOAT);
    for (auto const& [source, destination] : aPairs) {
        if (source == kSampled && destination == PROFILE_WIDE_GAMUT)
            continue;
        EngineTransform const transform(source, destination);
        Texels const expected = pictureOf(onCPU(aColours, transform), 32768.0);
        Errors const errors =
            errorsOf(road.run(transform.get()), input, [&](int x, int y) { return expected.at(x, y); });
        EXPECT_LE(errors.dLargest_, 1e-3) << std::hex << source << " " << destination;
        EXPECT_LE(errors.dGrey_, 1e-3) << std::hex << source << " " << destination;
    }
}

/// A cube that bends all colours, with the greys grey.
Internal::ColourCube bentCube() {
    constexpr std::size_t n = Internal::ColourCube::nEdge_;
    Internal::ColourCube cube;
    for (std::size_t i = 0; i < n * n * n; ++i) {
        double const r = double(i % n) / (n - 1);
        double const g = double(i / n % n) / (n - 1);
        double const b = double(i / n / n) / (n - 1);
        for (double const value :
             {0.7 * r * r + 0.3 * g * b, std::sqrt(g) * 0.5 + 0.5 * b * b * g, 0.5 * b + 0.5 * r * g * b})
            cube.aValues_.push_back(float(value));
    }
    return cube;
}

TEST_F(VantleTransformsTest, CubesAreInterpolated) {
    auto const spResolved = std::make_shared<Internal::ResolvedTransform const>(bentCube());
    Internal::ShaderDescription const description(*spResolved);
    RecordingEngine::shader() = {description.entryPoint(), description.code(), {}};
    for (auto const& parameter : description.parameters())
        RecordingEngine::shader().aTables_.push_back({parameter.sName_, parameter.record_, parameter.aData_});
    auto const aColours = colours<std::uint16_t>(32768);
    Texels const input = pictureOf(aColours, 32768.0);
    Road road(frameContext(), input, ImageGPU::PIXEL_FORMAT_RGBA32F,
              ImageFilter::OUTPUT_PRECISION_16_BIT_FLOAT);
    Texels const actual = road.run(RecordingEngine::ownTransform());
    Errors const errors = errorsOf(actual, input, [&](int x, int y) {
        Pixel const c = input.at(x, y);
        auto const e = spResolved->evaluate({c[0], c[1], c[2]});
        return Pixel{e[0], e[1], e[2], c[3]};
    });
    EXPECT_LE(errors.dLargest_, 1e-3);
    EXPECT_LE(errors.dMean_, 2e-4);
    // The CPU interpolates in tetrahedra.
    Internal::Applier const applier(spResolved);
    auto const aOnCPU = packed(aColours, [&](auto const& source, auto const& destination) {
        EXPECT_TRUE(applier.apply(source, destination, nHeight, nWidth));
    });
    Texels const expected = pictureOf(aOnCPU, 32768.0);
    EXPECT_LE(errorsOf(actual, input, [&](int x, int y) { return expected.at(x, y); }).dLargest_, 1e-3);
}

/// Profiles of tables are cubes on the GPU alone. Whose error is stated: mean and largest, against what the
/// CPU makes of the profile's own tables.
TEST_F(VantleTransformsTest, ProfilesOfTablesAreNearTheCPU) {
    struct Row {
        char const* name;
        TableRecipe source;
        std::uint32_t destination;
        double mean;
        double largest;
    };
    auto const aColours = colours<std::uint16_t>(32768);
    Texels const input = pictureOf(aColours, 32768.0);
    Road road(frameContext(), input, ImageGPU::PIXEL_FORMAT_RGBA32F,
              ImageFilter::OUTPUT_PRECISION_16_BIT_FLOAT);
    for (Row const& row : {Row{"camera", {true, 17, labOfCamera}, PROFILE_SRGB, 3e-4, 0.008},
                           Row{"sRGB", {true, 33, labOfSRGB}, PROFILE_SRGB, 4e-4, 0.006},
                           Row{"camera, linear", {true, 17, labOfCamera}, PROFILE_LINEAR_SRGB, 4e-4, 0.015},
                           Row{"sRGB, wide gamut", {true, 33, labOfSRGB}, PROFILE_WIDE_GAMUT, 4e-4, 0.03}}) {
        SCOPED_TRACE(row.name);
        constexpr std::uint32_t iCode = profileCode("Tabl");
        Bytes const aBytes = tableProfile(row.source);
        registerProfile(iCode, aBytes.data(), aBytes.size());
        EngineTransform const transform(iCode, row.destination);
        EXPECT_TRUE(unregisterProfile(iCode));
        Texels const expected = pictureOf(onCPU(aColours, transform), 32768.0);
        Errors const errors =
            errorsOf(road.run(transform.get()), input, [&](int x, int y) { return expected.at(x, y); });
        EXPECT_LE(errors.dMean_, row.mean);
        EXPECT_LE(errors.dLargest_, row.largest);
    }
}

} // namespace
