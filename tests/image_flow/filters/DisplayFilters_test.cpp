// What the filters for previews are besides their formulas: parameters, programs, failures, long runs.

#include "tests/image_flow/support/DisplayFilters.h"

#include <limits>
#include <set>
#include <typeinfo>

#include "orvo/core/memory/AllocationFailure.h"
#include "orvo/core/memory/MemoryStatistics.h"
#include "orvo/core/utility/ScopedPtr.h"
#include "orvo/data_flow/parameters/IntervalParameter.h"
#include "orvo/image_runtime/ShaderManagerOGL.h"
#include "orvo/ogl/ScopedContextWrapper.h"

namespace {

using namespace ORVO;
using namespace ORVO::Test;
using DataFlow::IntervalParameter;
using DataFlow::Parameter;

Precision const oEightBits = Precision::of(ImageGPU::PIXEL_FORMAT_RGBA8);

class DisplayFiltersTest : public ShaderFlowTest {
protected:
    /// A frame of the whole image in 32-bit floats.
    Texels run(ImageFilter& filter, std::vector<ImageGPU*> const& vpInputs) {
        return run(filter, vpInputs, vpInputs.front()->positionExtent());
    }
    Texels run(ImageFilter& filter, std::vector<ImageGPU*> const& vpInputs,
               PositionExtentInPixelSpace const& region) {
        ImageGPUPtr const upTarget = textureImage(region, ImageGPU::PIXEL_FORMAT_RGBA32F);
        ShaderRoad road(frameContext(), filter);
        for (std::size_t i = 0; i < vpInputs.size(); ++i)
            road.setInput(i, *vpInputs[i]);
        road.runInto(*upTarget, pixelToWorldSpace(region, PixelExtentInWorldSpace()));
        return Texels(*upTarget);
    }

    static ImageGPUPtr plain(Pixel const& pixel,
                             PositionExtentInPixelSpace const& region = pixels(0, 0, 3, 2)) {
        return textureOf(Texels(region).fill([&](int, int) { return pixel; }),
                         ImageGPU::PIXEL_FORMAT_RGBA32F);
    }
};

template <typename T>
void expectParameter(ImageFilter& filter, std::size_t i, char const* pName, T const& value) {
    ASSERT_LT(i, filter.numberOfParameters());
    auto const* const pParameter = dynamic_cast<Parameter<T> const*>(filter.parameter(i));
    ASSERT_NE(nullptr, pParameter) << pName;
    EXPECT_EQ(pName, pParameter->name());
    EXPECT_TRUE(pParameter->value() == value) << pName;
    EXPECT_NE("", pParameter->description()) << pName;
}

template <typename T>
void expectInterval(ImageFilter& filter, std::size_t i, char const* pName, T const& value, T const& lower,
                    T const& upper) {
    expectParameter(filter, i, pName, value);
    auto const* const pInterval = dynamic_cast<IntervalParameter<T> const*>(filter.parameter(i));
    ASSERT_NE(nullptr, pInterval) << pName;
    EXPECT_TRUE(pInterval->lowerBound() == lower) << pName;
    EXPECT_TRUE(pInterval->upperBound() == upper) << pName;
}

TEST_F(DisplayFiltersTest, HaveTheStatedNamesAndParameters) {
    MirelCheckerBoardGPU checker;
    EXPECT_EQ("MirelCheckerBoardGPU", checker.name());
    ASSERT_EQ(6U, checker.numberOfParameters());
    expectParameter(checker, 2, "colorA", float4(1, 1, 1, 1));
    expectParameter(checker, 3, "colorB", float4(0.8f, 0.8f, 0.8f, 1));
    expectParameter(checker, 4, "checkerSize", float2(16, 16));
    expectInterval(checker, 5, "compositeGamma", 1.0f, 0.1f, 9.99f);

    MirelToneMappingGPU tone;
    EXPECT_EQ("MirelToneMappingGPU", tone.name());
    ASSERT_EQ(6U, tone.numberOfParameters());
    expectParameter(tone, 2, "exposureGammaOrHDRCompression", true);
    expectInterval(tone, 3, "exposure", 0.0f, -20.0f, 20.0f);
    expectInterval(tone, 4, "gamma", 1.0f, 0.1f, 9.99f);
    expectInterval(tone, 5, "luminanceFactor", float3(0.3f, 0.59f, 0.11f), float3(0, 0, 0), float3(1, 1, 1));

    MirelGamutTestCompositeGPU gamut;
    EXPECT_EQ("MirelGamutTestCompositeGPU", gamut.name());
    ASSERT_EQ(4U, gamut.numberOfParameters());
    expectInterval(gamut, 2, "color", float4(0, 0, 0, 0), float4(1, 1, 1, 1), float4(1, 0, 0, 1));
    expectInterval(gamut, 3, "opacity", 0.0f, 1.0f, 1.0f);

    for (ImageFilter* pFilter : std::initializer_list<ImageFilter*>{&checker, &tone, &gamut}) {
        EXPECT_EQ(pFilter == &gamut ? 2U : 1U, pFilter->numberOfImageInputs()) << pFilter->name();
        EXPECT_EQ("InputImage", pFilter->imageInput(0)->name());
        EXPECT_EQ("OutputImage", pFilter->imageOutput()->name());
        EXPECT_TRUE(pFilter->willRunInHardware()) << pFilter->name();
    }
    EXPECT_EQ("GamutTestResultInputImage", gamut.imageInput(1)->name());
}

/// A checkerboard with parameters of the test's own.
class CheckerBoardOf : public MirelCheckerBoardGPU {
public:
    CheckerBoardOf(Parameter<float4>* pColorA, Parameter<float4>* pColorB, Parameter<float2>* pCheckerSize)
        : MirelCheckerBoardGPU(ScopedPtr<Parameter<float4>>(pColorA), ScopedPtr<Parameter<float4>>(pColorB),
                               ScopedPtr<Parameter<float2>>(pCheckerSize)) {}
};

TEST_F(DisplayFiltersTest, ACheckerBoardNeedsItsParameters) {
    auto const colour = [] { return ORVO_NEW Parameter<float4>(float4(), "colour"); };
    auto const size = [] { return ORVO_NEW Parameter<float2>(float2(), "size"); };
    ORVO_EXPECT_INTERNAL(CheckerBoardOf(nullptr, colour(), size()), "apColorA.get() != NULL");
    ORVO_EXPECT_INTERNAL(CheckerBoardOf(colour(), nullptr, size()), "apColorB.get() != NULL");
    ORVO_EXPECT_INTERNAL(CheckerBoardOf(colour(), colour(), nullptr), "apCheckerSize.get() != NULL");
    CheckerBoardOf const filter(colour(), colour(), size());
    EXPECT_EQ("colour", filter.colorA().name());
}

/// What the driver was given for the size of a cell.
class ObservedCheckerBoard : public MirelCheckerBoardGPU {
public:
    void setUniforms(OGL::Program& program) override {
        MirelCheckerBoardGPU::setUniforms(program);
        GLint nProgram = 0;
        glGetIntegerv(GL_CURRENT_PROGRAM, &nProgram);
        glGetUniformfv(static_cast<GLuint>(nProgram), program.getUniformLocation("checkerSize"),
                       aSize_.data());
    }
    std::array<float, 2> aSize_{};
};

TEST_F(DisplayFiltersTest, CellsAreCountedInTextureCoordinates) {
    ObservedCheckerBoard filter;
    ImageGPUPtr const upInput = textureImage(pixels(0, 0, 256, 8), ImageGPU::PIXEL_FORMAT_RGBA8);
    run(filter, {upInput.get()});
    EXPECT_EQ((std::array<float, 2>{1.0f / 16.0f, 2.0f}), filter.aSize_);
}

TEST_F(DisplayFiltersTest, ATransparentImageShowsTheCheckerBoard) {
    ImageGPUPtr const upInput = plain({0, 0, 0, 0}, pixels(0, 0, 4, 1));
    for (float const gamma : {1.0f, 2.0f}) {
        MirelCheckerBoardGPU filter;
        filter.checkerSize().setValue(float2(2, 2));
        filter.colorA().setValue(float4(0.25f, 0.5f, 0.75f, 1));
        filter.colorB().setValue(float4(0.5f, 0.125f, 0.25f, 1));
        filter.compositeGamma().setValue(gamma);
        Texels const expected = Texels(pixels(0, 0, 4, 1)).fill([](int x, int) {
            return x < 2 ? Pixel{0.25, 0.5, 0.75, 1} : Pixel{0.5, 0.125, 0.25, 1};
        });
        EXPECT_EQ("", differences(run(filter, {upInput.get()}), expected, oEightBits)) << gamma;
    }
}

TEST_F(DisplayFiltersTest, TheGammaProgramServesEveryGammaButExactlyOne) {
    // Colour without alpha: the plain program adds it, the gamma program takes it away.
    ImageGPUPtr const upInput = plain({0.25, 0.25, 0.25, 0});
    MirelCheckerBoardGPU filter;
    filter.colorA().setValue(float4(0.5f, 0.5f, 0.5f, 1));
    EXPECT_EQ(0.75, run(filter, {upInput.get()}).at(0, 0)[0]);
    for (float const gamma : {std::nextafter(1.0f, 2.0f), std::nextafter(1.0f, 0.0f)}) {
        filter.compositeGamma().setValue(gamma);
        EXPECT_NEAR(0.5, run(filter, {upInput.get()}).at(0, 0)[0], 1e-4);
    }
    filter.compositeGamma().setValue(1.0f);
    EXPECT_EQ(0.75, run(filter, {upInput.get()}).at(0, 0)[0]);
}

TEST_F(DisplayFiltersTest, AColourWithoutAlphaCountsAsBlackInTheGammaProgram) {
    ImageGPUPtr const upInput = plain({0.5, 0.25, 0.125, 0.5});
    MirelCheckerBoardGPU filter;
    filter.colorA().setValue(float4(0.75f, 0.75f, 0.75f, 0));
    filter.compositeGamma().setValue(2.0f);
    Texels const expected = Texels(pixels(0, 0, 3, 2)).fill([](int, int) {
        return Pixel{0.5, 0.25, 0.125, 0.5};
    });
    EXPECT_EQ("", differences(run(filter, {upInput.get()}), expected, oEightBits));
}

TEST_F(DisplayFiltersTest, ToneMappingLeavesAnImageByDefaultButForTheClamp) {
    ImageGPUPtr const upInput = plain({0.25, 1.5, -0.5, 2});
    MirelToneMappingGPU filter;
    Pixel const pixel = run(filter, {upInput.get()}).at(1, 1);
    EXPECT_NEAR(0.25, pixel[0], 1e-4);
    EXPECT_EQ(1.0, pixel[1]);
    EXPECT_EQ(0.0, pixel[2]);
    EXPECT_EQ(1.0, pixel[3]);
}

TEST_F(DisplayFiltersTest, ToneMappingOfBlackIsTheDriversAndSpoilsNoNeighbour) {
    // 0 / 0 in red, green and blue; what a clamp makes of that is 0, 1 or still no number.
    Texels const picture = Texels(pixels(0, 0, 3, 1)).fill([](int x, int) {
        return x == 1 ? Pixel{0, 0, 0, 0.5} : Pixel{0.25, 0.5, 0.75, 1};
    });
    ImageGPUPtr const upInput = textureOf(picture, ImageGPU::PIXEL_FORMAT_RGBA32F);
    for (bool const bExposure : {true, false}) {
        MirelToneMappingGPU filter;
        filter.exposureGammaOrHDRCompression().setValue(bExposure);
        Texels const result = run(filter, {upInput.get()});
        // 0.3 * 0.25 + 0.59 * 0.5 + 0.11 * 0.75 = 0.4525
        double const gain = bExposure ? 1.0 : 1.0 / 1.4525;
        for (int const x : {0, 2})
            for (std::size_t c = 0; c < 3; ++c)
                EXPECT_NEAR(picture.at(x, 0)[c] * gain, result.at(x, 0)[c], 1e-4);
        Pixel const black = result.at(1, 0);
        EXPECT_EQ(0.5, black[3]);
        for (std::size_t c = 0; c < 3; ++c)
            EXPECT_TRUE(std::isnan(black[c]) || black[c] == 0.0 || black[c] == 1.0) << black[c];
    }
}

TEST_F(DisplayFiltersTest, AGamutOfOneLeavesTheImageAndOneOfZeroGivesTheColour) {
    ImageGPUPtr const upInput = plain({0.25, 1.5, -0.5, 0.75});
    ImageGPUPtr const upInside = plain({1, 1, 1, 1});
    ImageGPUPtr const upOutside = plain({0, 0, 0, 0});
    MirelGamutTestCompositeGPU filter;
    filter.color().setValue(float4(1, 0.5f, 0.25f, 0.125f));
    filter.opacity().setValue(1.0f);
    EXPECT_EQ((Pixel{0.25, 1.5, -0.5, 0.75}), run(filter, {upInput.get(), upInside.get()}).at(2, 1));
    EXPECT_EQ((Pixel{1, 0.5, 0.25, 0.125}), run(filter, {upInput.get(), upOutside.get()}).at(2, 1));
}

TEST_F(DisplayFiltersTest, OneImageServesBothInputs) {
    ImageGPUPtr const upInput = plain({0.25, 0.5, 0.75, 1});
    MirelGamutTestCompositeGPU filter;
    filter.color().setValue(float4(1, 1, 1, 1));
    filter.opacity().setValue(1.0f);
    // p * p + (1 - p) * 1
    EXPECT_EQ((Pixel{0.8125, 0.75, 0.8125, 1}), run(filter, {upInput.get(), upInput.get()}).at(0, 0));
    EXPECT_EQ(-1, upInput->boundTexUnit());
}

TEST_F(DisplayFiltersTest, TheGamutIsThatOfThePlaceWhateverTheTexturesSizes) {
    // The mask is 1 in the columns and rows where both are odd.
    auto const isInside = [](int x, int y) { return x % 2 != 0 && y % 2 != 0; };
    PositionExtentInPixelSpace const drawn = pixels(2, 1, 5, 3);
    struct Case {
        PositionExtentInPixelSpace input_;
        bool bInputExact_;
        PositionExtentInPixelSpace mask_;
        bool bMaskExact_;
    };
    for (Case const& c : {Case{drawn, true, drawn, false}, Case{drawn, false, drawn, true},
                          Case{pixels(-3, -2, 11, 8), true, drawn, true},
                          Case{drawn, false, pixels(-40, -1, 100, 7), true}}) {
        ImageGPUPtr const upInput = textureOf(Texels(c.input_).fill([](int x, int y) {
            return Pixel{x / 8.0, y / 8.0, 0.5, 1};
        }),
                                              ImageGPU::PIXEL_FORMAT_RGBA32F, c.bInputExact_);
        ImageGPUPtr const upMask = textureOf(Texels(c.mask_).fill([&](int x, int y) {
            return isInside(x, y) ? Pixel{1, 1, 1, 1} : Pixel{};
        }),
                                             ImageGPU::PIXEL_FORMAT_RGBA8, c.bMaskExact_);
        EXPECT_NE(upInput->capacityExtent(), upMask->capacityExtent());
        MirelGamutTestCompositeGPU filter;
        filter.color().setValue(float4(1, 0.25F, 0.75F, 0.5F));
        filter.opacity().setValue(1.0F);
        Texels const result = run(filter, {upInput.get(), upMask.get()}, drawn);
        for (int y = 1; y < 4; ++y) {
            for (int x = 2; x < 7; ++x) {
                Pixel const inside{x / 8.0, y / 8.0, 0.5, 1};
                Pixel const outside{1, 0.25, 0.75, 0.5};
                EXPECT_EQ(isInside(x, y) ? inside : outside, result.at(x, y)) << x << ", " << y;
            }
        }
    }
}

TEST_F(DisplayFiltersTest, TheGamutMayHaveAnotherPixelGrid) {
    // Pixels of the mask are two by one of the image's: 1 in every second column.
    Texels mask(pixels(-1, 0, 6, 4), PixelExtentInWorldSpace(2.0F, 1.0F));
    mask.fill([](int x, int) { return x % 2 != 0 ? Pixel{1, 1, 1, 1} : Pixel{}; });
    ImageGPUPtr const upMask = textureOf(mask, ImageGPU::PIXEL_FORMAT_RGBA8);
    ImageGPUPtr const upInput = plain({0.25, 0.5, 0.75, 1}, pixels(0, 0, 8, 2));
    MirelGamutTestCompositeGPU filter;
    filter.color().setValue(float4(1, 1, 1, 1));
    filter.opacity().setValue(1.0F);
    Texels const result = run(filter, {upInput.get(), upMask.get()});
    for (int x = 0; x < result.width(); ++x) {
        EXPECT_EQ(x / 2 % 2 != 0 ? 0.25 : 1.0, result.at(result.left() + x, result.top())[0]) << x;
    }
}

TEST_F(DisplayFiltersTest, KeepTheFormatOfTheirInputAndObeyTheHint) {
    for (DisplayFilterRow const& row : aDisplayFilters) {
        SCOPED_TRACE(row.pName_);
        DisplayFilterRoad road(frameContext(), row);
        road.setPictures(pixels(-1, 2, 5, 3));
        PositionExtentInWorldSpace const region = world(-1, 2, 5, 3);
        EXPECT_EQ(ImageGPU::PIXEL_FORMAT_RGBA8, road.road().run(region)->pixelFormat());
        road.filter().outputPrecisionHintParameter().setValue(ImageFilter::OUTPUT_PRECISION_16_BIT_FLOAT);
        EXPECT_EQ(ImageGPU::PIXEL_FORMAT_RGBA16F, road.road().run(region)->pixelFormat());
        road.filter().outputPrecisionHintParameter().setValue(ImageFilter::OUTPUT_PRECISION_32_BIT_FLOAT);
        ORVO_EXPECT_INTERNAL(road.road().run(region), "Not implemented: Unknown outputPrecisionHint");
    }
}

TEST_F(DisplayFiltersTest, LeaveTheStateOfTheirContextFromFrameToFrame) {
    // Viewport and projection stay from the last frame of the same size; all else is put back, also after a
    // failure.
    for (DisplayFilterRow const& row : aDisplayFilters) {
        SCOPED_TRACE(row.pName_);
        DisplayFilterRoad road(frameContext(), row);
        road.setPictures(pixels(0, 0, 5, 3));
        road.run(pixels(0, 0, 5, 3));
        OGL::ScopedContextWrapper const restore;
        frameContext().makeCurrent();
        auto const before = GLState::capture();
        road.run(pixels(0, 0, 5, 3));
        EXPECT_EQ("", before.differencesTo(GLState::capture()));
        for (char const* pName : {"glFramebufferTexture2D", "glCheckFramebufferStatus"}) {
            {
                GLCallFailure const failure(pName, 1);
                EXPECT_THROW(road.run(pixels(0, 0, 5, 3)), OGL::ExceptionOGL) << pName;
            }
            EXPECT_EQ("", before.differencesTo(GLState::capture())) << pName;
        }
    }
}

TEST_F(DisplayFiltersTest, WithoutAContextTheyStandAndRunLater) {
    for (DisplayFilterRow const& row : aDisplayFilters) {
        SCOPED_TRACE(row.pName_);
        DisplayFilterRoad usual(frameContext(), row);
        usual.setPictures(pixels(0, 0, 5, 3));
        Texels const expected = usual.run(pixels(0, 0, 5, 3));
        host().release();
        std::unique_ptr<DisplayFilterGPU> const upFilter = row.pMake_();
        EXPECT_FALSE(upFilter->willRunInHardware());
        host().makeCurrent();
        ShaderRoad road(frameContext(), *upFilter);
        for (std::size_t i = 0; i < upFilter->numberOfImageInputs(); ++i)
            road.setInput(i, const_cast<ImageGPU&>(usual.image(i)));
        EXPECT_EQ("", differences(Texels(*road.run(world(0, 0, 5, 3))), expected, oEightBits));
    }
}

TEST_F(DisplayFiltersTest, AProgramThatTheDriverRefusesShowsInWillRunInHardware) {
    for (DisplayFilterRow const& row : aDisplayFilters) {
        std::set<std::string> aFailed;
        for (std::uint64_t n = 1; n < 100; ++n) {
            ObjectCounts const before = GLHooks::objects();
            GLCallFailure const failure(n);
            {
                std::unique_ptr<DisplayFilterGPU> const upFilter = row.pMake_();
                EXPECT_EQ(!failure.hasFired(), upFilter->willRunInHardware()) << row.pName_ << " " << n;
            }
            EXPECT_EQ(before, GLHooks::objects());
            if (!failure.hasFired())
                break;
            aFailed.insert(failure.name());
        }
        EXPECT_GE(aFailed.size(), 2U) << row.pName_;
        drainErrors();
    }
}

TEST_F(DisplayFiltersTest, AnInputWithoutAnImageIsRefusedAndLeavesNothingLocked) {
    struct Exposed : MirelToneMappingGPU {
        using MirelToneMappingGPU::oProgram_;
        using MirelToneMappingGPU::preProcess;
    };
    Exposed filter;
    ImageGPUInput source;
    feed(filter, 0, source);
    ORVO_EXPECT_INTERNAL(filter.preProcess(), "Enforce pImage != NULL");
    filter.oProgram_.add(FragmentShaderSourceOGL("")); // refused for a locked program
    filter.disconnect();
}

TEST_F(DisplayFiltersTest, EveryCallThatFailsLeavesTheNextFrameRight) {
    for (DisplayFilterRow const& row : aDisplayFilters) {
        DisplayFilterRoad road(frameContext(), row);
        road.setPictures(pixels(-2, 1, 5, 3));
        Texels const expected = road.run(pixels(-2, 1, 5, 3));
        road.run(pixels(-2, 1, 5, 3));
        ObjectCounts const before = GLHooks::objects();
        std::uint64_t n = 1;
        for (; n < 100; ++n) {
            std::string sFailed;
            {
                GLCallFailure const failure(n);
                try {
                    road.run(pixels(-2, 1, 5, 3));
                } catch (LogicalException const&) {
                    EXPECT_TRUE(failure.hasFired());
                }
                sFailed = failure.name();
            }
            host().makeCurrent();
            drainErrors();
            if (sFailed.empty())
                break;
            EXPECT_EQ(-1, road.image(0).boundTexUnit()) << sFailed;
            EXPECT_EQ("", differences(road.run(pixels(-2, 1, 5, 3)), expected, oEightBits)) << sFailed;
            EXPECT_EQ(before, GLHooks::objects()) << row.pName_ << " after " << sFailed;
        }
        EXPECT_GT(n, 2U) << row.pName_;
        EXPECT_LT(n, 100U) << row.pName_;
    }
}

TEST_F(DisplayFiltersTest, EveryAllocationThatFailsLeavesTheNextFrameRight) {
    for (DisplayFilterRow const& row : aDisplayFilters) {
        DisplayFilterRoad road(frameContext(), row);
        road.setPictures(pixels(0, 0, 5, 3));
        Texels const expected = road.run(pixels(0, 0, 5, 3));
        bool bMore = true;
        std::uint64_t n = 1;
        for (; bMore && n < 200; ++n) {
            {
                Core::AllocationFailure const failure(n);
                try {
                    row.pMake_();
                    road.road().launch(world(0, 0, 5, 3));
                } catch (std::bad_alloc const&) {
                    EXPECT_TRUE(failure.hasFired());
                }
                bMore = failure.hasFired();
            }
            host().makeCurrent();
            EXPECT_EQ("", differences(road.run(pixels(0, 0, 5, 3)), expected, oEightBits)) << n;
        }
        EXPECT_GT(n, 3U) << row.pName_;
        EXPECT_FALSE(bMore) << row.pName_;
    }
}

TEST_F(DisplayFiltersTest, AThousandFramesOfChangingSizesTakeNothingMore) {
    for (DisplayFilterRow const& row : aDisplayFilters) {
        DisplayFilterRoad road(frameContext(), row);
        road.setPictures(pixels(0, 0, 16, 16));
        auto const frames = [&](int nFrames) {
            for (int i = 0; i < nFrames; ++i)
                road.road().run(world(float(i % 3), 0, float(1 + i % 7), float(1 + i % 5)));
        };
        frames(105); // all sizes
        ObjectCounts const objects = GLHooks::objects();
        std::size_t const nBlocks = Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT);
        std::size_t const nBytes = Core::MemoryStatistics::bytes(MEMORY_TYPE_OBJECT);
        std::uint64_t const nPrograms = GLHooks::calls("glCreateProgram");
        frames(105);
        frames(790);
        frames(105); // ends as the measurement began
        EXPECT_EQ(objects, GLHooks::objects()) << row.pName_;
        EXPECT_EQ(nBlocks, Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT)) << row.pName_;
        EXPECT_EQ(nBytes, Core::MemoryStatistics::bytes(MEMORY_TYPE_OBJECT)) << row.pName_;
        EXPECT_EQ(nPrograms, GLHooks::calls("glCreateProgram")) << row.pName_;
    }
}

TEST_F(DisplayFiltersTest, PixelsOutsideTheirRegionHaveNoInfluence) {
    auto const region = pixels(-1, 2, 4, 3);
    Texels const inside(region);
    Texels const clean = randomTexels(pixels(-3, 0, 9, 8), 17);
    double const none = std::numeric_limits<double>::quiet_NaN();
    Texels const poisoned = Texels(clean.region()).fill([&](int x, int y) {
        return inside.contains(x, y) ? clean.at(x, y) : Pixel{none, none, none, none};
    });
    ImageGPUPtr const upClean = textureOf(clean, ImageGPU::PIXEL_FORMAT_RGBA16F);
    ImageGPUPtr const upPoisoned = textureOf(poisoned, ImageGPU::PIXEL_FORMAT_RGBA16F);
    for (DisplayFilterRow const& row : aDisplayFilters) {
        std::vector<Texels> aResults;
        for (ImageGPU* pImage : {upClean.get(), upPoisoned.get()}) {
            std::unique_ptr<DisplayFilterGPU> const upFilter = row.pMake_();
            ShaderRoad road(frameContext(), *upFilter);
            for (std::size_t i = 0; i < upFilter->numberOfImageInputs(); ++i)
                road.setInput(i, *pImage);
            aResults.emplace_back(*road.run(pixelToWorldSpace(region, PixelExtentInWorldSpace())));
        }
        // Negative colours have no power: what is no number must be none in both.
        for (int y = inside.top(); y < inside.top() + inside.height(); ++y)
            for (int x = inside.left(); x < inside.left() + inside.width(); ++x)
                for (std::size_t c = 0; c < 4; ++c) {
                    double const a = aResults[0].at(x, y)[c];
                    double const b = aResults[1].at(x, y)[c];
                    EXPECT_TRUE(a == b || (std::isnan(a) && std::isnan(b))) << row.pName_ << a << " " << b;
                }
    }
}

TEST_F(DisplayFiltersTest, ProgramsThatWereDiscardedAreLinkedAgain) {
    for (DisplayFilterRow const& row : aDisplayFilters) {
        DisplayFilterRoad road(frameContext(), row);
        road.setPictures(pixels(0, 0, 5, 3));
        Texels const expected = road.run(pixels(0, 0, 5, 3));
        ShaderManagerOGL::Instance()->clearAll();
        EXPECT_EQ("", differences(road.run(pixels(0, 0, 5, 3)), expected, oEightBits)) << row.pName_;
    }
}

} // namespace
