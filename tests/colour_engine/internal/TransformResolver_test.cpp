#include "orvo/colour_engine/internal/TransformResolver.h"

#include "orvo/colour_engine/ProfileCodes.h"
#include "orvo/colour_engine/internal/Profile.h"
#include "orvo/colour_engine/internal/ResolvedTransform.h"
#include "tests/colour_engine/support/ICCProfiles.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <stdexcept>

namespace {

using namespace ORVO::ColourEngine;
using namespace ORVO::ColourEngine::Internal;
using Colour = std::array<double, 3>;

std::shared_ptr<ResolvedTransform const> resolve(std::uint32_t source, std::uint32_t destination,
                                                 std::uint32_t intent = 0, std::uint32_t options = 0) {
    return resolveTransform(*profileFromCode(source), *profileFromCode(destination), intent, options);
}

void expectColour(Colour const& expected, Colour const& actual, double tolerance) {
    EXPECT_NEAR(expected[0], actual[0], tolerance);
    EXPECT_NEAR(expected[1], actual[1], tolerance);
    EXPECT_NEAR(expected[2], actual[2], tolerance);
}

TEST(TransformResolver, AllBuiltInSpacesAreCurvesAndAMatrix) {
    for (BuiltInProfile const& source : BUILT_IN_PROFILES) {
        for (BuiltInProfile const& destination : BUILT_IN_PROFILES) {
            for (std::uint32_t intent = 0; intent < 4; ++intent) {
                EXPECT_NE(nullptr, resolve(source.code, destination.code, intent)->matrixShaper())
                    << std::hex << source.code << " to " << destination.code << " intent " << intent;
            }
            EXPECT_NE(nullptr, resolve(source.code, destination.code, 1, TRANSFORM_BLACK_POINT_COMPENSATION)
                                   ->matrixShaper());
        }
    }
}

TEST(TransformResolver, ASpaceToItselfChangesNothing) {
    for (BuiltInProfile const& space : BUILT_IN_PROFILES) {
        auto const spTransform = resolve(space.code, space.code);
        Colour const colour = space.bGray ? Colour{0.3, 0.3, 0.3} : Colour{0.9, 0.02, 0.4};
        expectColour(colour, spTransform->evaluate(colour), 2e-6);
        expectColour({0.0, 0.0, 0.0}, spTransform->evaluate({0.0, 0.0, 0.0}), 0.0);
        expectColour({1.0, 1.0, 1.0}, spTransform->evaluate({1.0, 1.0, 1.0}), 2e-6);
    }
}

TEST(TransformResolver, GreysStayNeutralBetweenSpacesOfOneWhite) {
    for (BuiltInProfile const& source : BUILT_IN_PROFILES) {
        for (BuiltInProfile const& destination : BUILT_IN_PROFILES) {
            auto const spTransform = resolve(source.code, destination.code);
            for (double const grey : {0.1, 0.5, 0.8, 1.0}) {
                Colour const result = spTransform->evaluate({grey, grey, grey});
                EXPECT_NEAR(result[1], result[0], 2e-4);
                EXPECT_NEAR(result[1], result[2], 2e-4);
            }
        }
    }
}

TEST(TransformResolver, EncodesAsTheSpacesState) {
    // ((0.5 + 0.055) / 1.055) ^ 2.4 and 0.02 / 12.92
    Colour const linear = resolve(PROFILE_SRGB, PROFILE_LINEAR_SRGB)->evaluate({0.5, 0.5, 0.02});
    expectColour({0.2140411, 0.2140411, 0.0015480}, linear, 2e-6);
    // 0.5 ^ (563 / 256), for greys
    Colour const wide = resolve(PROFILE_WIDE_GAMUT, PROFILE_LINEAR_SRGB)->evaluate({0.5, 0.5, 0.5});
    expectColour({0.2177555, 0.2177555, 0.2177555}, wide, 1e-5);
    // 0.5 ^ 2.2; green alone counts
    Colour const grey = resolve(PROFILE_GRAY, PROFILE_LINEAR_SRGB)->evaluate({0.9, 0.5, 0.1});
    expectColour({0.2176376, 0.2176376, 0.2176376}, grey, 1e-5);
    // ((0.5 + alpha - 1) / alpha) ^ (1 / 0.45) with alpha = 1.0993, and 0.05 / 4.5, for greys
    auto const spFrom2020 = resolve(PROFILE_BT_2020, PROFILE_LINEAR_SRGB);
    expectColour({0.2597194, 0.2597194, 0.2597194}, spFrom2020->evaluate({0.5, 0.5, 0.5}), 1e-5);
    expectColour({0.0111111, 0.0111111, 0.0111111}, spFrom2020->evaluate({0.05, 0.05, 0.05}), 1e-5);
}

TEST(TransformResolver, MovesPrimariesAsPublished) {
    // The red of sRGB in Display P3.
    expectColour({0.9175, 0.2003, 0.1386},
                 resolve(PROFILE_SRGB, PROFILE_DISPLAY_P3)->evaluate({1.0, 0.0, 0.0}), 5e-4);
    // Out of gamut: P3's green has no red and too much green in sRGB.
    Colour const green = resolve(PROFILE_DISPLAY_P3, PROFILE_SRGB)->evaluate({0.0, 1.0, 0.0});
    EXPECT_DOUBLE_EQ(0.0, green[0]);
    EXPECT_DOUBLE_EQ(1.0, green[1]);
    // The luminance of the red of sRGB, adapted to D50, in grey of gamma 2.2: 0.22249 ^ (1 / 2.2).
    Colour const grey = resolve(PROFILE_SRGB, PROFILE_GRAY)->evaluate({1.0, 0.0, 0.0});
    expectColour({0.50504, 0.50504, 0.50504}, grey, 2e-4);
}

/// The colour library's own road.
class Road {
public:
    Road(cmsHPROFILE pSource, cmsHPROFILE pDestination, std::uint32_t intent, std::uint32_t flags = 0)
        : pTransform_(cmsCreateTransform(pSource, TYPE_RGB_DBL, pDestination, TYPE_RGB_DBL, intent,
                                         cmsFLAGS_NOOPTIMIZE | cmsFLAGS_NOCACHE | flags)) {}
    ~Road() { cmsDeleteTransform(pTransform_); }
    Road(Road const&) = delete;
    Road& operator=(Road const&) = delete;

    Colour operator()(Colour const& colour) const {
        Colour result{};
        cmsDoTransform(pTransform_, colour.data(), result.data(), 1);
        for (double& value : result) {
            value = std::clamp(value, 0.0, 1.0);
        }
        return result;
    }

private:
    cmsHTRANSFORM pTransform_;
};

/// The largest difference over colours off the nodes of any table, none of them near black.
double largestDifference(ResolvedTransform const& transform, Road const& road) {
    double largest = 0.0;
    for (int r = 1; r < 10; ++r) {
        for (int g = 1; g < 10; ++g) {
            for (int b = 1; b < 10; ++b) {
                Colour const colour = {0.31 + 0.06 * r, 0.33 + 0.06 * g, 0.35 + 0.06 * b};
                Colour const ours = transform.evaluate(colour);
                Colour const theirs = road(colour);
                for (std::size_t i = 0; i < 3; ++i) {
                    largest = std::max(largest, std::abs(ours[i] - theirs[i]));
                }
            }
        }
    }
    return largest;
}

TEST(TransformResolver, TakesAForeignWhiteIntoAccountWhereColoursAreAbsolute) {
    // Not a display, and of version 2: its media white counts.
    cmsHPROFILE const pScanner = ORVO::Test::gammaProfile(1.8);
    cmsSetDeviceClass(pScanner, cmsSigInputClass);
    cmsSetProfileVersion(pScanner, 2.4);
    cmsCIEXYZ const white = {0.9, 0.93, 0.7};
    cmsWriteTag(pScanner, cmsSigMediaWhitePointTag, &white);
    auto const aScanner = ORVO::Test::bytesOf(pScanner);
    auto const aScreen = ORVO::Test::bytesOf(ORVO::Test::gammaProfile(2.4));
    Profile const scanner(aScanner.data(), aScanner.size());
    Profile const screen(aScreen.data(), aScreen.size());
    for (std::uint32_t intent = 0; intent < 4; ++intent) {
        auto const spTransform = resolveTransform(scanner, screen, intent, 0);
        EXPECT_NE(nullptr, spTransform->matrixShaper()) << intent;
        Road const road(scanner.handle(), screen.handle(), intent);
        EXPECT_LT(largestDifference(*spTransform, road), 3e-6) << intent;
    }
    Colour const relative = resolveTransform(scanner, screen, 1, 0)->evaluate({1.0, 1.0, 1.0});
    Colour const absolute = resolveTransform(scanner, screen, 3, 0)->evaluate({1.0, 1.0, 1.0});
    expectColour({1.0, 1.0, 1.0}, relative, 1e-4);
    EXPECT_LT(absolute[2], 0.97);
}

TEST(TransformResolver, TakesCurvesThatAreGivenAsTables) {
    auto const aBytes = ORVO::Test::sampledProfile();
    Profile const file(aBytes.data(), aBytes.size());
    auto const spSRGB = profileFromCode(PROFILE_SRGB);
    for (std::uint32_t intent = 0; intent < 4; ++intent) {
        auto const spThere = resolveTransform(file, *spSRGB, intent, 0);
        auto const spBack = resolveTransform(*spSRGB, file, intent, 0);
        EXPECT_NE(nullptr, spThere->matrixShaper()) << intent;
        EXPECT_NE(nullptr, spBack->matrixShaper()) << intent;
        // The same space: the table has 16 bits, the colorants of a file have 16 binary places.
        expectColour({0.2, 0.7, 0.9}, spThere->evaluate({0.2, 0.7, 0.9}), 2e-4);
        expectColour({0.2, 0.7, 0.9}, spBack->evaluate({0.2, 0.7, 0.9}), 2e-4);
    }
}

TEST(TransformResolver, TakesTheStepsOfTables) {
    auto const aBytes = ORVO::Test::tableSourceProfile();
    Profile const tables(aBytes.data(), aBytes.size());
    EXPECT_TRUE(tables.canBeSource());
    EXPECT_FALSE(tables.canBeDestination());
    auto const spSRGB = profileFromCode(PROFILE_SRGB);
    for (std::uint32_t intent = 0; intent < 4; ++intent) {
        for (std::uint32_t const options : {0U, TRANSFORM_BLACK_POINT_COMPENSATION}) {
            SCOPED_TRACE(testing::Message() << "intent " << intent << " options " << options);
            auto const spTransform = resolveTransform(tables, *spSRGB, intent, options);
            EXPECT_EQ(nullptr, spTransform->matrixShaper());
            // Its table, out of Lab, a matrix, the curves of sRGB; a black point is part of the matrix.
            auto const& aStages = spTransform->stages();
            ASSERT_EQ(4u, aStages.size());
            EXPECT_TRUE(std::holds_alternative<GridStage>(aStages[0]));
            EXPECT_TRUE(std::holds_alternative<ConnectionStage>(aStages[1]));
            EXPECT_TRUE(std::holds_alternative<MatrixStage>(aStages[2]));
            EXPECT_TRUE(std::holds_alternative<CurveStage>(aStages[3]));
            Road const road(tables.handle(), spSRGB->handle(), intent,
                            options != 0 ? cmsFLAGS_BLACKPOINTCOMPENSATION : 0);
            EXPECT_LT(largestDifference(*spTransform, road), 2.0 / 32768.0);
        }
    }
    EXPECT_THROW(resolveTransform(*spSRGB, tables, 0, 0), std::runtime_error);
}

/// A grey device with a table: L is the square of the grey.
ORVO::Test::Bytes greyTableProfile() {
    cmsHPROFILE const pProfile = cmsCreateProfilePlaceholder(nullptr);
    cmsSetProfileVersion(pProfile, 4.3);
    cmsSetDeviceClass(pProfile, cmsSigInputClass);
    cmsSetColorSpace(pProfile, cmsSigGrayData);
    cmsSetPCS(pProfile, cmsSigLabData);
    std::vector<cmsUInt16Number> aEntries;
    for (int i = 0; i <= 64; ++i) {
        double const grey = i / 64.0;
        aEntries.push_back(static_cast<cmsUInt16Number>(std::lround(65535.0 * grey * grey)));
        aEntries.push_back(0x8080); // a and b are 0
        aEntries.push_back(0x8080);
    }
    cmsToneCurve* const pStraight = cmsBuildGamma(nullptr, 1.0);
    cmsToneCurve* const aCurves[3] = {pStraight, pStraight, pStraight};
    cmsPipeline* const pPipeline = cmsPipelineAlloc(nullptr, 1, 3);
    cmsPipelineInsertStage(pPipeline, cmsAT_END, cmsStageAllocToneCurves(nullptr, 1, aCurves));
    cmsPipelineInsertStage(pPipeline, cmsAT_END, cmsStageAllocCLut16bit(nullptr, 65, 1, 3, aEntries.data()));
    cmsPipelineInsertStage(pPipeline, cmsAT_END, cmsStageAllocToneCurves(nullptr, 3, aCurves));
    ORVO::Test::demand(cmsWriteTag(pProfile, cmsSigAToB0Tag, pPipeline));
    cmsPipelineFree(pPipeline);
    cmsFreeToneCurve(pStraight);
    return ORVO::Test::bytesOf(pProfile);
}

TEST(TransformResolver, FitsACubeWhereTheStepsAreOthers) {
    auto const aBytes = greyTableProfile();
    Profile const tables(aBytes.data(), aBytes.size());
    auto const spTransform = resolveTransform(tables, *profileFromCode(PROFILE_LINEAR_SRGB), 1, 0);
    EXPECT_EQ(nullptr, spTransform->matrixShaper());
    ColourCube const* const pCube = spTransform->colourCube();
    ASSERT_NE(nullptr, pCube);
    EXPECT_EQ(3u * 33 * 33 * 33, pCube->aValues_.size());
    // L = 100 * 0.8^2 = 64: ((64 + 16) / 116)^3; the red and the blue sample do not count. Between nodes that
    // are 1 / 32 apart a line leaves the curve, whose second derivative is 10.3 there, by 10.3 / 32^2 / 8.
    double const light = 80.0 / 116.0 * (80.0 / 116.0) * (80.0 / 116.0);
    expectColour({light, light, light}, spTransform->evaluate({0.1, 0.8, 0.9}), 1.3e-3);
    // L = 6.25: 6.25 / 903.3
    expectColour({0.00692, 0.00692, 0.00692}, spTransform->evaluate({0.25, 0.25, 0.25}), 5e-4);
}

} // namespace
