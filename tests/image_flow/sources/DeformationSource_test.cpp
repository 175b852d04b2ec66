#include "orvo/image_flow/sources/DeformationSource.h"

#include "orvo/core/memory/AllocationFailure.h"
#include "orvo/core/memory/MemoryStatistics.h"
#include "orvo/image_runtime/TexturePool.h"
#include "tests/image_flow/support/ShaderRoad.h"

#include <limits>

namespace {

using namespace ORVO;
using namespace ORVO::Test;

class OpenDeformationSource : public DeformationSource {
public:
    using DeformationSource::DeformationSource;
    using DeformationSource::internalProcess;
    ~OpenDeformationSource() override { disconnect(); }
    ImageGPU const* image() const { return static_cast<ImageGPU const*>(imageOutput()->data()); }
};

class DeformationSourceTest : public ShaderFlowTest {
protected:
    static std::vector<float> values(std::size_t nPairs) { return channelValues<float>(2 * nPairs); }
};

TEST_F(DeformationSourceTest, PutsTheMapIntoATexture) {
    std::vector<float> const aValues = values(7 * 5);
    DeformationMap map{7, 5, aValues.data()};
    OpenDeformationSource source("deform", &map);
    EXPECT_EQ("deform", source.name());
    EXPECT_EQ(0U, source.numberOfImageInputs());
    EXPECT_EQ("OutputImage", source.imageOutput()->name());
    EXPECT_EQ(ORVO_TARGET_GL, source.getOutputTargetPlatform());
    EXPECT_EQ(ExtentInPixelSpace(7, 5), source.size());
    EXPECT_EQ(7, source.width());
    EXPECT_EQ(5, source.height());
    EXPECT_TRUE(source.canEmit());
    source.internalProcess();
    ASSERT_NE(nullptr, source.image());
    ImageGPU const& image = *source.image();
    EXPECT_EQ(ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F, image.pixelFormat());
    EXPECT_EQ(pixels(0, 0, 7, 5), image.positionExtent());
    EXPECT_EQ(ExtentInPixelSpace(7, 5), image.capacityExtent());
    EXPECT_EQ(PixelExtentInWorldSpace(1.0f, 1.0f), image.pixelExtent());
    EXPECT_EQ(bytesOf(aValues), readTexels(image));
    EXPECT_EQ(-1, image.boundTexUnit());
    glBindTexture(GL_TEXTURE_2D, image.texture()->objectID());
    for (GLenum const eName : {GL_TEXTURE_WRAP_S, GL_TEXTURE_WRAP_T}) {
        GLint nWrap = 0;
        glGetTexParameteriv(GL_TEXTURE_2D, eName, &nWrap);
        EXPECT_EQ(GL_CLAMP_TO_EDGE, nWrap);
    }
    glBindTexture(GL_TEXTURE_2D, 0);
}

TEST_F(DeformationSourceTest, NoMapIsAnImageWithoutPixels) {
    OpenDeformationSource source("deform", nullptr);
    EXPECT_EQ(ExtentInPixelSpace(0, 0), source.size());
    EXPECT_TRUE(source.isReady());
    source.internalProcess();
    ASSERT_NE(nullptr, source.image());
    EXPECT_EQ(pixels(0, 0, 0, 0), source.image()->positionExtent());
    EXPECT_EQ(world(0, 0, 0, 0), source.generated({}));
    // Floats for no place.
    float const fValue = 1;
    DeformationMap map{0, 4, &fValue};
    source.setDeformationMap(&map);
    EXPECT_EQ(ExtentInPixelSpace(0, 4), source.size());
}

TEST_F(DeformationSourceTest, AMapWithoutDataHasItsSizeAlone) {
    DeformationMap map{3, 2, nullptr};
    OpenDeformationSource const source("deform", &map);
    EXPECT_EQ(ExtentInPixelSpace(3, 2), source.size());
}

TEST_F(DeformationSourceTest, GeneratesItsRectangleWhateverIsAskedFor) {
    DeformationMap map{7, 5, nullptr};
    OpenDeformationSource source("deform", &map);
    source.setGeneratedRegion(world(1, 2, 3, 4));
    EXPECT_EQ(world(0, 0, 7, 5), source.generated({}));
    EXPECT_EQ(world(0, 0, 7, 5), source.generated({{"in", world(9, 9, 9, 9)}}));
}

TEST_F(DeformationSourceTest, GivesItsImageOnceForEachRound) {
    std::vector<float> const aValues = values(4);
    DeformationMap map{2, 2, aValues.data()};
    OpenDeformationSource source("deform", &map);
    TextureNode end(1, false);
    feed(end, 0, source);
    ImageFlowController controller;
    plant(controller, {&source, &end}, end);
    controller.setContextGPU(frameContext());
    auto const run = [&] {
        controller.computeRegions(world(0, 0, 2, 2));
        controller.process();
    };
    EXPECT_TRUE(source.isReady());
    run();
    EXPECT_EQ(1, end.nRuns_);
    EXPECT_FALSE(source.isReady());
    run();
    EXPECT_EQ(1, end.nRuns_);
    ImageGPU const* const pFirst = end.pSeen_;
    source.emit();
    EXPECT_TRUE(source.isReady());
    run();
    EXPECT_EQ(2, end.nRuns_);
    EXPECT_EQ(pFirst, end.pSeen_);
    controller.flushGraph();
    source.emit();
    run();
    EXPECT_EQ(3, end.nRuns_);
}

TEST_F(DeformationSourceTest, TakesANewMapAndKeepsTheOldOneIfItCannot) {
    std::vector<float> const aValues = values(6);
    DeformationMap map{3, 2, aValues.data()};
    OpenDeformationSource source("deform", &map);
    DeformationMap const aTooLarge[] = {{0x80000000u, 1, nullptr}, {40000, 40000, nullptr}};
    for (DeformationMap tooLarge : aTooLarge)
        ORVO_EXPECT_PARAMETER(source.setDeformationMap(&tooLarge), "Image size exceeds 4294967295 bytes");
    EXPECT_EQ(ExtentInPixelSpace(3, 2), source.size());
    std::vector<float> const aOthers = values(5 * 4);
    DeformationMap other{5, 4, aOthers.data()};
    failEveryCallBeforeThePool(
        [&] {
            OpenDeformationSource second("deform", &map);
            second.setDeformationMap(&other);
            // Reached only where nothing failed.
            EXPECT_EQ(ExtentInPixelSpace(5, 4), second.size());
        },
        [] {}, {"glTexSubImage2D"});
    source.setDeformationMap(&other);
    source.internalProcess();
    EXPECT_EQ(bytesOf(aOthers), readTexels(*source.image()));
}

TEST_F(DeformationSourceTest, EveryAllocationThatFailsLeavesTheMapAsItWas) {
    std::vector<float> const aValues = values(6);
    DeformationMap map{3, 2, aValues.data()};
    std::vector<float> const aOthers = values(5 * 4);
    DeformationMap other{5, 4, aOthers.data()};
    OpenDeformationSource source("deform", &map);
    auto const usage = [] {
        TexturePool::Instance()->clearAll();
        return std::pair(Core::MemoryStatistics::bytes(MEMORY_TYPE_OBJECT), GLHooks::objects());
    };
    auto const before = usage();
    std::uint64_t nFailed = 0;
    for (bool bMore = true; bMore; ++nFailed) {
        ASSERT_LT(nFailed, 100U);
        bool bThrown = false;
        {
            Core::AllocationFailure const failure(nFailed + 1);
            try {
                OpenDeformationSource const second("second", &other); // is made or not
                source.setDeformationMap(&other);
            } catch (std::bad_alloc const&) {
                bThrown = true;
            }
            bMore = failure.hasFired();
        }
        EXPECT_EQ(bMore, bThrown);
        EXPECT_EQ(bThrown ? ExtentInPixelSpace(3, 2) : ExtentInPixelSpace(5, 4), source.size());
        source.internalProcess();
        EXPECT_EQ(bytesOf(bThrown ? aValues : aOthers), readTexels(*source.image()));
        source.flushOutputs();
        if (bThrown) {
            EXPECT_EQ(before, usage());
        }
    }
    EXPECT_GT(nFailed, 4U); // an image and its texture, twice
}

TEST_F(DeformationSourceTest, TakesItsMapFromMemoryWhateverBufferTheHostHasBound) {
    std::vector<float> const aValues = values(6);
    DeformationMap map{3, 2, aValues.data()};
    GLuint nBuffer = 0;
    glGenBuffers(1, &nBuffer);
    glBindBuffer(GL_PIXEL_UNPACK_BUFFER, nBuffer);
    glPixelTransferf(GL_RED_SCALE, 0.5f);
    OpenDeformationSource source("deform", &map);
    glPixelTransferf(GL_RED_SCALE, 1.0f);
    glBindBuffer(GL_PIXEL_UNPACK_BUFFER, 0);
    glDeleteBuffers(1, &nBuffer);
    source.internalProcess();
    EXPECT_EQ(bytesOf(aValues), readTexels(*source.image()));
}

TEST_F(DeformationSourceTest, EveryFailureOfAFrameIntoABoundTextureLeavesTheNextRight) {
    std::vector<float> const aValues = values(3 * 2);
    DeformationMap map{3, 2, aValues.data()};
    OpenDeformationSource source("deform", &map);
    ImageGPUPtr const upTarget = textureImage(pixels(0, 0, 3, 2), ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F);
    source.setBoundOutputImage(upTarget.get());
    ImageFlowController controller;
    plant(controller, {&source}, source);
    controller.setContextGPU(frameContext());
    auto const run = [&] {
        controller.flushGraph();
        source.emit();
        controller.computeRegions(world(0, 0, 3, 2));
        controller.process();
    };
    auto const expectRight = [&] {
        writeTexels(*upTarget, bytesOf(std::vector<float>(12, 7.0f)));
        run();
        EXPECT_EQ(bytesOf(aValues), readTexels(*upTarget));
    };
    expectRight();
    std::set<std::string> const aFailed = failEveryCall(run,
                                                        [&] {
                                                            host().makeCurrent();
                                                            EXPECT_EQ(0U, drainErrors());
                                                            expectRight();
                                                        },
                                                        {"eglMakeCurrent"});
    EXPECT_EQ(1U, aFailed.count("glCheckFramebufferStatus"));
    bool bMore = true;
    for (std::uint64_t n = 1; bMore; ++n) {
        ASSERT_LT(n, 100U);
        {
            Core::AllocationFailure const failure(n);
            try {
                run();
            } catch (std::bad_alloc const&) {
                EXPECT_TRUE(failure.hasFired());
            }
            bMore = failure.hasFired();
        }
        expectRight();
    }
}

TEST_F(DeformationSourceTest, CopiesIntoABoundTexture) {
    std::vector<float> aValues(2 * 7 * 5);
    for (std::size_t i = 0; i < aValues.size(); ++i)
        aValues[i] = float(i) * 0.25f - 3.0f;
    DeformationMap map{7, 5, aValues.data()};
    OpenDeformationSource source("deform", &map);
    ImageGPUPtr const upTarget =
        textureImage(pixels(1, 1, 4, 3), ImageGPU::PIXEL_FORMAT_LUMINANCE_ALPHA32F, false);
    source.setBoundOutputImage(upTarget.get());
    ImageFlowController controller;
    plant(controller, {&source}, source);
    controller.setContextGPU(frameContext());
    controller.computeRegions(world(1, 1, 4, 3));
    controller.process();
    std::vector<float> aExpected;
    for (std::size_t y = 1; y < 4; ++y)
        for (std::size_t i = 2; i < 10; ++i)
            aExpected.push_back(aValues[14 * y + i]);
    EXPECT_EQ(bytesOf(aExpected), readTexels(*upTarget));
    ImageGPUPtr const upOther = textureImage(pixels(0, 0, 7, 5), ImageGPU::PIXEL_FORMAT_RGBA32F);
    source.setBoundOutputImage(upOther.get());
    source.emit();
    ORVO_EXPECT_PARAMETER(controller.process(), "Source and bound output image differ in their channels");
}

TEST_F(DeformationSourceTest, AThousandMapsLeaveNothingBehind) {
    std::vector<float> const aValues = values(7 * 5);
    DeformationMap map{1, 1, aValues.data()};
    OpenDeformationSource source("deform", &map);
    TextureNode end(1, false);
    feed(end, 0, source);
    ImageFlowController controller;
    plant(controller, {&source, &end}, end);
    controller.setContextGPU(frameContext());
    std::size_t nBytes = 0;
    for (std::uint32_t i = 0; i < 1000; ++i) {
        DeformationMap next{1 + i % 7, 1 + i % 5, aValues.data()};
        controller.flushGraph();
        source.setDeformationMap(&next);
        source.emit();
        controller.computeRegions(world(0, 0, float(next.width), float(next.height)));
        controller.process();
        nBytes = i == 69 ? Core::MemoryStatistics::bytes(MEMORY_TYPE_OBJECT) : nBytes;
    }
    EXPECT_EQ(1000, end.nRuns_);
    EXPECT_EQ(nBytes, Core::MemoryStatistics::bytes(MEMORY_TYPE_OBJECT));
    EXPECT_LE(GLHooks::objects()["texture"], 37L); // one for each size, the pool's and the one that is held
}

} // namespace
