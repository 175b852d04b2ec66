// The bilateral filter on OpenGL: its interface, its choice of what runs, its resources, and its failures.
#include "orvo/image_flow/filters/FastBilateralFilterGPU.h"

#include "orvo/core/memory/AllocationFailure.h"
#include "orvo/core/memory/MemoryStatistics.h"
#include "orvo/image_runtime/TexturePool.h"
#include "orvo/ogl/ExtensionManager.h"
#include "orvo/ogl/NativeContext.h"
#include "orvo/ogl/ScopedContextWrapper.h"
#include "tests/image_flow/support/GPUBilateralReference.h"

namespace {

using namespace ORVO;
using namespace ORVO::Test;
using gpuBilateral::filtered;
using gpuBilateral::largestDifference;
using gpuBilateral::scene;
using gpuBilateral::Settings;
using OGL::ExtensionManager;

float const kNaN = std::numeric_limits<float>::quiet_NaN();
float const kInfinity = std::numeric_limits<float>::infinity();

long objects(char const* kind) {
    ObjectCounts const counts = GLHooks::objects();
    auto const found = counts.find(kind);
    return found == counts.end() ? 0 : found->second;
}

/// What is in use: tracked objects, their bytes, and objects of OpenGL.
struct Usage {
    std::size_t nBlocks_ = Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT);
    std::size_t nBytes_ = Core::MemoryStatistics::bytes(MEMORY_TYPE_OBJECT);
    ObjectCounts oObjects_ = GLHooks::objects();
};

void expectSame(Usage const& before, Usage const& after) {
    EXPECT_EQ(before.nBlocks_, after.nBlocks_);
    EXPECT_EQ(before.nBytes_, after.nBytes_);
    EXPECT_EQ(before.oObjects_, after.oObjects_);
}

class FastBilateralFilterGPUTest : public ShaderFlowTest {
protected:
    /// Whether the pool holds a texture of just this size, so that none has to be made.
    static bool poolHasGrid(unsigned width, unsigned height) {
        TexturePool& pool = *TexturePool::Instance();
        std::uint64_t const nMade = GLHooks::calls("glGenTextures");
        OGL::Texture2D* const pTexture =
            pool.getTexture2DFromPool(width, height, OGL::Texture::INTERNAL_FORMAT_RGBA16F, true);
        pool.returnTexture2DToPool(pTexture);
        return GLHooks::calls("glGenTextures") == nMade;
    }
};

TEST_F(FastBilateralFilterGPUTest, HasItsNameConnectorsAndTargets) {
    FastBilateralFilterGPU filter;
    EXPECT_EQ("ImageFilter", filter.name());
    EXPECT_EQ(ORVO_TARGET_GL, filter.getInputTargetPlatform());
    EXPECT_EQ(ORVO_TARGET_GL, filter.getOutputTargetPlatform());
    ASSERT_EQ(1U, filter.numberOfImageInputs());
    EXPECT_EQ("InputImage", filter.imageInput(0)->name());
    ASSERT_NE(nullptr, filter.imageOutput());
    EXPECT_EQ("OutputImage", filter.imageOutput()->name());
    EXPECT_TRUE(filter.willRunInHardware());
    EXPECT_FALSE(filter.isSIMD());
}

TEST_F(FastBilateralFilterGPUTest, HasItsParameters) {
    FastBilateralFilterGPU filter;
    EXPECT_EQ(&filter.spatialSigma(), filter.parameter("spatialSigma"));
    EXPECT_EQ(float2(10.0F, 10.0F), filter.spatialSigma().value());
    EXPECT_EQ(float2(0.1F, 0.1F), filter.spatialSigma().lowerBound());
    EXPECT_EQ(float2(100.0F, 100.0F), filter.spatialSigma().upperBound());
    EXPECT_EQ(&filter.rangeSigma(), filter.parameter("rangeSigma"));
    EXPECT_EQ(0.15F, filter.rangeSigma().value());
    EXPECT_EQ(0.01F, filter.rangeSigma().lowerBound());
    EXPECT_EQ(1.0F, filter.rangeSigma().upperBound());
    EXPECT_EQ(&filter.colorize(), filter.parameter("colorize"));
    EXPECT_FALSE(filter.colorize().value());
    for (char const* name : {"spatialSigma", "rangeSigma", "colorize"}) {
        EXPECT_FALSE(filter.parameter(name)->description().empty());
    }
}

TEST_F(FastBilateralFilterGPUTest, RegionsGrowByTheReachOfTheSigmas) {
    FastBilateralFilterGPU filter;
    // ceil(21.46) and ceil(6.438).
    filter.spatialSigma().setValue(float2(10.0F, 3.0F));
    EXPECT_EQ(world(-22, -7, 144, 64), filter.needed(world(0, 0, 100, 50), "InputImage", {}));
    EXPECT_EQ(world(-22, -7, 144, 64), filter.changed(world(0, 0, 100, 50), "InputImage", {}));
    filter.spatialSigma().setValue(float2(kNaN, kNaN));
    EXPECT_EQ(world(1, 2, 3, 4), filter.needed(world(1, 2, 3, 4), "InputImage", {}));
    filter.spatialSigma().setValue(float2(kInfinity, 1.0F));
    EXPECT_TRUE(filter.changed(world(1, 2, 3, 4), "InputImage", {}).isInfinite());
    EXPECT_FALSE(filter.needed(PositionExtentInWorldSpace(), "InputImage", {}).extent().isDefined());
}

TEST_F(FastBilateralFilterGPUTest, SaysWhetherTheGridFitsIntoATexture) {
    GLint nLargest = 0;
    glGetIntegerv(GL_MAX_TEXTURE_SIZE, &nLargest);
    FastBilateralFilterGPU filter;
    filter.rangeSigma().setValue(1.0F); // ten levels
    filter.spatialSigma().setValue(float2(0.5F, 0.5F));
    // Of (n - 1) / 0.5 + 9 cells the most that fit.
    int const highest = (nLargest - 9) / 2 + 1;
    EXPECT_TRUE(filter.canCreateTextureForRender(world(3, 4, 1, float(highest))));
    EXPECT_FALSE(filter.canCreateTextureForRender(world(3, 4, 1, float(highest + 1))));
    int const widest = (nLargest / 10 - 9) / 2 + 1;
    EXPECT_TRUE(filter.canCreateTextureForRender(world(3, 4, float(widest), 1)));
    EXPECT_FALSE(filter.canCreateTextureForRender(world(3, 4, float(widest + 1), 1)));
    filter.spatialSigma().setValue(float2(0.1F, 0.1F));
    EXPECT_FALSE(filter.canCreateTextureForRender(world(0, 0, 3840, 2160)));
    filter.spatialSigma().setValue(float2(10.0F, 10.0F));
    EXPECT_TRUE(filter.canCreateTextureForRender(world(0, 0, 3840, 2160)));
    filter.rangeSigma().setValue(0.0F);
    EXPECT_FALSE(filter.canCreateTextureForRender(world(0, 0, 1, 1)));
}

TEST_F(FastBilateralFilterGPUTest, StandsWithoutAContextAndDoesNotRun) {
    host().release();
    {
        FastBilateralFilterGPU filter;
        EXPECT_FALSE(filter.willRunInHardware());
        ORVO_EXPECT_OGL(filter.canCreateTextureForRender(world(0, 0, 1, 1)), "No OpenGL context is current");
    }
    host().makeCurrent();
}

TEST_F(FastBilateralFilterGPUTest, DoesNotRunOnDriversWithoutFloatTargets) {
    ExtensionManager& manager = *ExtensionManager::Instance();
    auto const runsWithout = [&](std::vector<OGL::teExtension> const& absent) {
        for (OGL::teExtension const extension : absent) {
            manager.overrideSupport(extension, false);
        }
        bool const bRuns = FastBilateralFilterGPU().willRunInHardware();
        manager.clearOverrides();
        return bRuns;
    };
    EXPECT_FALSE(runsWithout({OGL::EXTENSION_ARB_TEXTURE_FLOAT, OGL::EXTENSION_APPLE_FLOAT_PIXELS,
                              OGL::EXTENSION_ATI_TEXTURE_FLOAT}));
    EXPECT_FALSE(runsWithout({OGL::EXTENSION_ARB_FRAMEBUFFER_OBJECT, OGL::EXTENSION_ATI_TEXTURE_FLOAT}));
    manager.overrideSupport(OGL::EXTENSION_ATI_TEXTURE_FLOAT, true);
    EXPECT_TRUE(runsWithout({OGL::EXTENSION_ARB_FRAMEBUFFER_OBJECT}));
    EXPECT_TRUE(runsWithout({OGL::EXTENSION_ATI_TEXTURE_FLOAT}));
    EXPECT_TRUE(runsWithout({}));
}

TEST_F(FastBilateralFilterGPUTest, EveryCallThatFailsWhileItIsMadeOnlyKeepsItFromRunning) {
    ObjectCounts const before = GLHooks::objects();
    std::set<std::string> aFailed;
    for (std::uint64_t n = 1;; ++n) {
        ASSERT_LT(n, 200U);
        GLCallFailure const failure(n);
        bool bRuns = false;
        ASSERT_NO_THROW(bRuns = FastBilateralFilterGPU().willRunInHardware()) << failure.name();
        GLint nBound = -1;
        glGetIntegerv(GL_FRAMEBUFFER_BINDING, &nBound);
        EXPECT_EQ(0, nBound);
        EXPECT_EQ(before, GLHooks::objects()) << failure.name();
        drainErrors();
        if (!failure.hasFired()) {
            EXPECT_TRUE(bRuns);
            break;
        }
        EXPECT_FALSE(bRuns) << failure.name();
        aFailed.insert(failure.name());
    }
    for (char const* name : {"glGenFramebuffers", "glTexImage2D", "glFramebufferTexture2D",
                             "glCheckFramebufferStatus", "glCompileShader", "glLinkProgram"}) {
        EXPECT_EQ(1U, aFailed.count(name)) << name;
    }
}

TEST_F(FastBilateralFilterGPUTest, EveryAllocationThatFailsWhileItIsMadeKeepsItFromRunning) {
    Usage const before;
    int nFailed = 0;
    bool bMore = true;
    for (std::uint64_t n = 1; bMore; ++n) {
        SCOPED_TRACE(n);
        ASSERT_LT(n, 200U);
        bool bRuns = false;
        {
            Core::AllocationFailure const failure(n);
            try {
                bRuns = FastBilateralFilterGPU().willRunInHardware();
            } catch (std::bad_alloc const&) {
                EXPECT_TRUE(failure.hasFired());
            }
            bMore = failure.hasFired();
        }
        EXPECT_EQ(!bMore, bRuns);
        nFailed += bMore ? 1 : 0;
        expectSame(before, Usage());
        EXPECT_EQ(GLenum(GL_NO_ERROR), glGetError());
    }
    EXPECT_GE(nFailed, 6); // a program each
}

TEST_F(FastBilateralFilterGPUTest, AnUndefinedRegionMakesAnEmptyImageOverTheLeastGrid) {
    ImageGPUPtr const upImage = textureOf(scene(pixels(0, 0, 8, 8), 1), ImageGPU::PIXEL_FORMAT_RGBA8);
    FastBilateralFilterGPU filter;
    ShaderRoad road(frameContext(), filter);
    road.setInput(0, *upImage);
    // Nine cells a side, and trunc(1 / 0.15) + 9 = 15 levels.
    EXPECT_FALSE(poolHasGrid(9 * 15 + 1, 9));
    ImageGPU const* const pResult = road.run(PositionExtentInWorldSpace());
    ASSERT_NE(nullptr, pResult);
    EXPECT_EQ(pixels(0, 0, 0, 0), pResult->positionExtent());
    EXPECT_EQ(ExtentInPixelSpace(0, 0), pResult->capacityExtent());
    std::uint64_t const nMade = GLHooks::calls("glGenTextures");
    EXPECT_TRUE(poolHasGrid(9 * 15, 9));
    EXPECT_EQ(nMade, GLHooks::calls("glGenTextures"));
    // The next frame has pixels again.
    Texels const result(*road.run(world(0, 0, 8, 8)));
    EXPECT_LE(largestDifference(result,
                                filtered(Texels(*upImage), pixels(0, 0, 8, 8), {10, 10, 0.15F, false}), true),
              2.0 / 255.0);
}

TEST_F(FastBilateralFilterGPUTest, TheGridHasTheStatedSize) {
    ImageGPUPtr const upImage = textureOf(scene(pixels(0, 0, 40, 30), 1), ImageGPU::PIXEL_FORMAT_RGBA8);
    struct Case {
        PositionExtentInWorldSpace region_;
        float2 sigma_;
        float rangeSigma_;
        unsigned width_;
        unsigned height_;
    };
    // trunc(39 / 3) + 9, trunc(29 / 4) + 9, trunc(1 / rangeSigma) + 9.
    for (Case const& c : {Case{world(0, 0, 40, 30), float2(3.0F, 4.0F), 0.25F, 22 * 13, 16},
                          Case{world(0, 0, 1, 30), float2(3.0F, 2.0F), 0.5F, 9 * 11, 23},
                          Case{world(0, 0, 40, 1), float2(2.0F, 3.0F), 1.0F, 28 * 10, 9}}) {
        FastBilateralFilterGPU filter;
        filter.spatialSigma().setValue(c.sigma_);
        filter.rangeSigma().setValue(c.rangeSigma_);
        ShaderRoad road(frameContext(), filter);
        road.setInput(0, *upImage);
        ASSERT_NE(nullptr, road.run(c.region_));
        EXPECT_TRUE(poolHasGrid(c.width_, c.height_)) << c.width_ << " by " << c.height_;
    }
}

TEST_F(FastBilateralFilterGPUTest, AGridThatNoTextureHoldsIsRefused) {
    ImageGPUPtr const upImage = textureOf(scene(pixels(0, 0, 8, 8), 1), ImageGPU::PIXEL_FORMAT_RGBA8);
    FastBilateralFilterGPU filter;
    ShaderRoad road(frameContext(), filter);
    road.setInput(0, *upImage);
    for (float const rangeSigma : {0.0F, 1e-30F, 1e-5F}) {
        filter.rangeSigma().setValue(rangeSigma);
        EXPECT_ANY_THROW(road.run(world(0, 0, 8, 8))) << rangeSigma;
        drainErrors();
    }
    filter.spatialSigma().setValue(float2(0.0F, 0.0F));
    EXPECT_ANY_THROW(road.run(world(0, 0, 8, 8)));
    drainErrors();
    // What is no number counts as nothing; and after all that, a frame is right.
    filter.spatialSigma().setValue(float2(kNaN, kNaN));
    filter.rangeSigma().setValue(kNaN);
    EXPECT_NE(nullptr, road.run(world(0, 0, 8, 8)));
    filter.spatialSigma().setValue(float2(2.0F, 2.0F));
    filter.rangeSigma().setValue(0.15F);
    Texels const result(*road.run(world(0, 0, 8, 8)));
    EXPECT_LE(
        largestDifference(result, filtered(Texels(*upImage), pixels(0, 0, 8, 8), {2, 2, 0.15F, false}), true),
        2.0 / 255.0);
}

TEST_F(FastBilateralFilterGPUTest, ValuesThatAreNoNumbersStayWhereTheyAre) {
    // Rows of four pixels of each value; the rest of the picture is grey.
    Texels picture(pixels(0, 0, 24, 24));
    picture.fill([&](int x, int y) {
        double const special = y < 4 ? double(kNaN) : y < 8 ? double(kInfinity) : -double(kInfinity);
        return x < 4 && y < 12 ? Pixel{special, special, special, 1} : Pixel{0.5, 0.5, 0.5, 1};
    });
    ImageGPUPtr const upImage = textureOf(picture, ImageGPU::PIXEL_FORMAT_RGBA32F);
    for (bool const bColorize : {false, true}) {
        FastBilateralFilterGPU filter;
        filter.spatialSigma().setValue(float2(2.0F, 2.0F));
        filter.colorize().setValue(bColorize);
        filter.outputPrecisionHintParameter().setValue(ImageFilter::OUTPUT_PRECISION_16_BIT_FLOAT);
        ShaderRoad road(frameContext(), filter);
        road.setInput(0, *upImage);
        Texels const result(*road.run(world(0, 0, 24, 24)));
        EXPECT_NEAR(0.5, result.at(20, 20)[0], 0.01);
    }
}

TEST_F(FastBilateralFilterGPUTest, AnInputWithoutPixelsIsTransparentBlack) {
    ImageGPUPtr const upEmpty = textureImage(pixels(0, 0, 0, 0), ImageGPU::PIXEL_FORMAT_RGBA8);
    FastBilateralFilterGPU filter;
    {
        ShaderRoad road(frameContext(), filter);
        road.setInput(0, *upEmpty);
        ImageGPUPtr const upTarget = textureOf(Texels(pixels(0, 0, 9, 9)).fill([](int, int) {
            return Pixel{1, 1, 1, 1};
        }),
                                               ImageGPU::PIXEL_FORMAT_RGBA8);
        // An empty rectangle, grown by the reach of the sigmas.
        road.runInto(*upTarget, world(2, 3, 4, 4));
        Texels const result(*upTarget);
        EXPECT_EQ((Pixel{0, 0, 0, 0}), result.at(2, 3));
        EXPECT_EQ((Pixel{0, 0, 0, 0}), result.at(5, 6));
        EXPECT_EQ((Pixel{1, 1, 1, 1}), result.at(1, 3));
        EXPECT_EQ((Pixel{1, 1, 1, 1}), result.at(6, 6));
    }
}

TEST_F(FastBilateralFilterGPUTest, RefusesARegionOutsideTheBoundImage) {
    ImageGPUPtr const upImage = textureOf(scene(pixels(0, 0, 8, 8), 1), ImageGPU::PIXEL_FORMAT_RGBA8);
    ImageGPUPtr const upTarget = textureOf(scene(pixels(0, 0, 6, 8), 2), ImageGPU::PIXEL_FORMAT_RGBA8);
    Texels const before(*upTarget);
    FastBilateralFilterGPU filter;
    ShaderRoad road(frameContext(), filter);
    road.setInput(0, *upImage);
    ORVO_EXPECT_INTERNAL(road.runInto(*upTarget, world(0, 0, 8, 8)),
                         "Compute region lies outside the bound output image");
    EXPECT_EQ(0.0, largestDifference(Texels(*upTarget), before, false));
    EXPECT_EQ(-1, upImage->boundTexUnit());
    road.runInto(*upTarget, world(0, 0, 6, 8));
    EXPECT_NE(0.0, largestDifference(Texels(*upTarget), before, false));
}

TEST_F(FastBilateralFilterGPUTest, BuffersAreKeptWhileTheSizeStays) {
    ImageGPUPtr const upImage = textureOf(scene(pixels(0, 0, 40, 30), 1), ImageGPU::PIXEL_FORMAT_RGBA8);
    FastBilateralFilterGPU filter;
    ShaderRoad road(frameContext(), filter);
    road.setInput(0, *upImage);
    road.run(world(0, 0, 20, 16));
    std::uint64_t nMade = GLHooks::calls("glBufferData");
    // Other sigmas, another place: the same pixels to draw.
    filter.spatialSigma().setValue(float2(4.0F, 2.0F));
    road.run(world(0, 0, 20, 16));
    Texels const moved(*road.run(world(7, 9, 20, 16)));
    EXPECT_EQ(nMade, GLHooks::calls("glBufferData"));
    EXPECT_LE(largestDifference(moved, filtered(Texels(*upImage), pixels(7, 9, 20, 16), {4, 2, 0.15F, false}),
                                true),
              2.0 / 255.0);
    // Another size: both buffers anew, also where the number of pixels is the same.
    for (auto const& size : {ExtentInPixelSpace(16, 20), ExtentInPixelSpace(20, 15)}) {
        Texels const other(*road.run(world(0, 0, float(size.width()), float(size.height()))));
        EXPECT_EQ(nMade + 2, GLHooks::calls("glBufferData"));
        nMade += 2;
        EXPECT_LE(largestDifference(
                      other,
                      filtered(Texels(*upImage), pixels(0, 0, size.width(), size.height()), {4, 2, 0.15F}),
                      true),
                  2.0 / 255.0);
    }
    EXPECT_EQ(2, objects("buffer"));
}

TEST_F(FastBilateralFilterGPUTest, DestroyedWithoutAContextItLeavesNothingForLong) {
    ImageGPUPtr const upImage = textureOf(scene(pixels(0, 0, 8, 8), 1), ImageGPU::PIXEL_FORMAT_RGBA8);
    constexpr char const* aKinds[] = {"buffer", "framebuffer", "program", "shader"};
    std::map<std::string, long> before;
    for (char const* kind : aKinds) {
        before[kind] = objects(kind);
    }
    auto upFilter = std::make_unique<FastBilateralFilterGPU>();
    auto upRoad = std::make_unique<ShaderRoad>(frameContext(), *upFilter);
    upRoad->setInput(0, *upImage);
    upRoad->run(world(0, 0, 8, 8));
    EXPECT_EQ(before["buffer"] + 2, objects("buffer"));
    EXPECT_LT(before["program"], objects("program"));
    upRoad.reset();
    host().release();
    upFilter.reset();
    EXPECT_EQ(before["buffer"] + 2, objects("buffer"));
    // The first context of their group that is made current takes the shared ones along, each context its
    // own framebuffer.
    context().makeCurrent();
    EXPECT_EQ(before["buffer"], objects("buffer"));
    frameContext().makeCurrent();
    host().makeCurrent();
    for (char const* kind : aKinds) {
        EXPECT_EQ(before[kind], objects(kind)) << kind;
    }
}

TEST_F(FastBilateralFilterGPUTest, WhatAHostHasBoundToTheGridsUnitIsNotSeen) {
    PositionExtentInPixelSpace const region = pixels(0, 0, 16, 16);
    ImageGPUPtr const upImage = textureOf(scene(region, 1), ImageGPU::PIXEL_FORMAT_RGBA8);
    FastBilateralFilterGPU filter;
    filter.spatialSigma().setValue(float2(2.0F, 2.0F));
    filter.colorize().setValue(true);
    ShaderRoad road(frameContext(), filter);
    road.setInput(0, *upImage);
    std::array<unsigned char, 4> aBlack{};
    OGL::Texture2D texture(OGL::Texture::INTERNAL_FORMAT_RGBA8, 1, 1, false, aBlack.data());
    {
        OGL::ScopedContextWrapper const wrapper;
        frameContext().makeCurrent();
        OGL::TextureUnit::Unit(1).bind(&texture);
    }
    EXPECT_LE(largestDifference(Texels(*road.run(world(0, 0, 16, 16))),
                                filtered(Texels(*upImage), region, {2, 2, 0.15F, true}), true),
              2.0 / 255.0);
}

/// Draws its input with fixed function.
class PlainCopy : public SimpleFilterGPU {
public:
    PlainCopy() : SimpleFilterGPU("PlainCopy") {}
    ~PlainCopy() override { disconnect(); }

protected:
    void internalProcess() override {
        preRender();
        inputImageGPU(0)->bind(0);
        renderAndTearDown();
    }
};

TEST_F(FastBilateralFilterGPUTest, APassOfFixedFunctionMayFollow) {
    PositionExtentInPixelSpace const region = pixels(0, 0, 16, 16);
    ImageGPUPtr const upImage = textureOf(scene(region, 1), ImageGPU::PIXEL_FORMAT_RGBA8);
    FastBilateralFilterGPU filter;
    filter.spatialSigma().setValue(float2(2.0F, 2.0F));
    filter.colorize().setValue(true);
    PlainCopy copy;
    ImageGPUOutput sink;
    ShaderRoad road(frameContext(), filter);
    road.setInput(0, *upImage);
    feed(copy, 0, filter);
    feed(sink, 0, copy);
    road.controller().addNode(&copy);
    road.controller().addNode(&sink);
    road.controller().setImageSink(sink);
    for (int frame = 0; frame < 2; ++frame) {
        road.launch(world(0, 0, 16, 16));
        EXPECT_LE(largestDifference(Texels(*sink.getImageGPU()),
                                    filtered(Texels(*upImage), region, {2, 2, 0.15F, true}), true),
                  2.0 / 255.0);
    }
    road.controller().flushGraph();
    sink.disconnect();
}

TEST_F(FastBilateralFilterGPUTest, EveryCallThatFailsFailsTheFrameAndNotTheNext) {
    PositionExtentInPixelSpace const region = pixels(0, 0, 9, 7);
    ImageGPUPtr const upImage = textureOf(scene(region, 1), ImageGPU::PIXEL_FORMAT_RGBA8, false);
    Settings const s{2, 2, 0.15F, true};
    Texels const expected = filtered(Texels(*upImage), region, s);
    FastBilateralFilterGPU filter;
    filter.spatialSigma().setValue(float2(2.0F, 2.0F));
    filter.colorize().setValue(true);
    ShaderRoad road(frameContext(), filter);
    road.setInput(0, *upImage);
    road.run(world(0, 0, 9, 7));
    road.run(world(0, 0, 9, 7));
    long const nTextures = objects("texture");
    long const nBuffers = objects("buffer");
    float width = 9;
    failEveryCallBeforeThePool(
        [&] {
            // Alternating sizes, so that buffers and textures are made.
            width = width == 9 ? 8.0F : 9.0F;
            road.run(world(0, 0, width, 7));
        },
        [&] {
            // None is current where the driver did not give it back.
            host().makeCurrent();
            EXPECT_EQ(-1, upImage->boundTexUnit());
            Texels const result(*road.run(world(0, 0, 9, 7)));
            EXPECT_LE(largestDifference(result, expected, true), 2.0 / 255.0);
            width = 9;
            EXPECT_EQ(nBuffers, objects("buffer"));
            EXPECT_LE(objects("texture"), nTextures + 16);
        },
        {"glBufferData", "glReadPixels", "glFinish", "glFramebufferTexture2D", "glCheckFramebufferStatus"});
}

TEST_F(FastBilateralFilterGPUTest, EveryAllocationThatFailsFailsTheFrameAndNotTheNext) {
    PositionExtentInPixelSpace const region = pixels(0, 0, 9, 7);
    ImageGPUPtr const upImage = textureOf(scene(region, 1), ImageGPU::PIXEL_FORMAT_RGBA8, false);
    Texels const expected = filtered(Texels(*upImage), region, {2, 2, 0.15F, true});
    FastBilateralFilterGPU filter;
    filter.spatialSigma().setValue(float2(2.0F, 2.0F));
    filter.colorize().setValue(true);
    ShaderRoad road(frameContext(), filter);
    road.setInput(0, *upImage);
    EXPECT_LE(largestDifference(Texels(*road.run(world(0, 0, 9, 7))), expected, true), 2.0 / 255.0);
    // Without textures in the pool, so that they are made, too.
    TexturePool::Instance()->clearAll();
    road.run(world(0, 0, 9, 7));
    Usage const before;
    int nFailed = 0;
    bool bMore = true;
    for (std::uint64_t n = 1; bMore; ++n) {
        SCOPED_TRACE(n);
        ASSERT_LT(n, 200U);
        TexturePool::Instance()->clearAll();
        bool bThrown = false;
        {
            Core::AllocationFailure const failure(n);
            try {
                road.launch(world(0, 0, 9, 7));
            } catch (std::bad_alloc const&) {
                bThrown = true;
            }
            bMore = failure.hasFired();
        }
        EXPECT_EQ(bMore, bThrown);
        nFailed += bThrown ? 1 : 0;
        host().makeCurrent();
        EXPECT_EQ(GLenum(GL_NO_ERROR), glGetError());
        EXPECT_EQ(-1, upImage->boundTexUnit());
        ImageGPU const* const pResult = road.run(world(0, 0, 9, 7));
        expectSame(before, Usage());
        EXPECT_LE(largestDifference(Texels(*pResult), expected, true), 2.0 / 255.0);
    }
    EXPECT_GE(nFailed, 5); // an image, a copy of the input, two grids, and a state that is restored
}

TEST_F(FastBilateralFilterGPUTest, AThousandFramesOfChangingSizesGrowNothing) {
    ImageGPUPtr const upImage = textureOf(scene(pixels(0, 0, 12, 12), 1), ImageGPU::PIXEL_FORMAT_RGBA8);
    FastBilateralFilterGPU filter;
    filter.rangeSigma().setValue(1.0F);
    ShaderRoad road(frameContext(), filter);
    road.setInput(0, *upImage);
    auto const frames = [&](int nFrames) {
        for (int frame = 0; frame < nFrames; ++frame) {
            filter.colorize().setValue(frame % 3 == 0);
            road.run(world(0, 0, float(4 + frame % 7), float(3 + frame % 5)));
        }
    };
    frames(2 * 105); // all sizes, with and without colours
    Usage const before;
    std::uint64_t const nPrograms = GLHooks::calls("glCreateProgram");
    frames(8 * 105); // ends as the measurement began
    expectSame(before, Usage());
    EXPECT_EQ(nPrograms, GLHooks::calls("glCreateProgram"));
}

} // namespace
