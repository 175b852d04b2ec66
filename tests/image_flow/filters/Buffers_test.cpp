// Nodes that keep an image and give it again, in host memory and in textures.

#include "orvo/core/memory/AllocationFailure.h"
#include "orvo/core/memory/MemoryStatistics.h"
#include "orvo/image_flow/filters/BufferCPU.h"
#include "orvo/image_flow/filters/BufferGPU.h"
#include "tests/image_flow/support/GPURoads.h"
#include "tests/image_flow/support/ShaderRoad.h"
#include "tests/support/ImageFlowLayers.h"

namespace {

using namespace ORVO;
using namespace ORVO::Test;

/// With what only the graph calls made public.
class OpenBufferCPU : public BufferCPU {
public:
    using BufferCPU::BufferCPU;
    using BufferCPU::internalProcess;
    using BufferCPU::postProcess;
};

class OpenBufferGPU : public BufferGPU {
public:
    using BufferGPU::internalProcess;
};

// In host memory

/// source -> filter that adds -> buffer -> sink.
class BufferCPUTest : public testing::Test {
protected:
    BufferCPUTest()
        : oImage_(floatImage(pixels(-2, 1, 6, 5), [](int x, int y) { return float(x + 10 * y); })) {
        oSource_.setImageCPUWithNoOwnership(oImage_.get());
        feed(oFilter_, 0, oSource_);
        feed(oBuffer_, 0, oFilter_);
        feed(oSink_, 0, oBuffer_);
        plant(oController_, {&oSource_, &oFilter_, &oBuffer_, &oSink_}, oSink_);
    }
    ~BufferCPUTest() override {
        oSink_.disconnect();
        oFilter_.disconnect();
    }

    void run(PositionExtentInPixelSpace const& region = pixels(-2, 1, 6, 5)) {
        oSource_.emit();
        oController_.computeRegions(worldOf(region));
        oController_.process();
    }
    float result(int x, int y) const { return *pixelAt(*oSink_.getImageCPU(), x, y); }

    ORVO::Test::ImageFlowLayers oLayers_;
    ImageCPUPtr oImage_;
    ImageFlowController oController_;
    ImageCPUInput oSource_;
    TestFilter oFilter_;
    OpenBufferCPU oBuffer_;
    ImageCPUOutput oSink_;
};

TEST_F(BufferCPUTest, hasTheStatedNameAndConnectors) {
    EXPECT_EQ("BufferCPU", oBuffer_.name());
    EXPECT_EQ("other", BufferCPU("other").name());
    EXPECT_EQ("InputImage", oBuffer_.imageInput(0)->name());
    EXPECT_EQ("OutputImage", oBuffer_.imageOutput()->name());
    EXPECT_EQ(ORVO_TARGET_CPU, oBuffer_.getInputTargetPlatform());
    EXPECT_EQ(ORVO_TARGET_CPU, oBuffer_.getOutputTargetPlatform());
    EXPECT_EQ(ImageFilter::OUTPUT_PRECISION_DEFAULT, oBuffer_.outputPrecisionHintParameter().value());
    EXPECT_FALSE(oBuffer_.willRunInHardware());
    EXPECT_TRUE(oBuffer_.canEmit());
    EXPECT_FALSE(oBuffer_.hasData());
    EXPECT_EQ(PositionExtentInPixelSpace(), oBuffer_.bufferDOD());
}

TEST_F(BufferCPUTest, passesOnAndGivesAgainWithoutItsInput) {
    run();
    EXPECT_EQ(1, oFilter_.nRuns_);
    EXPECT_EQ(13.0f, result(3, 1));
    EXPECT_TRUE(oBuffer_.hasData());
    EXPECT_EQ(pixels(-2, 1, 6, 5), oBuffer_.bufferDOD());
    oFilter_.oOffset_.setValue(0.5f);
    oBuffer_.emit();
    run(pixels(0, 2, 2, 2));
    EXPECT_EQ(1, oFilter_.nRuns_);
    EXPECT_EQ(13.0f, result(3, 1)); // of the old region, too
    run(pixels(0, 2, 2, 2));
    EXPECT_EQ(2, oFilter_.nRuns_);
    EXPECT_EQ(21.5f, result(1, 2));
    EXPECT_EQ(pixels(0, 2, 2, 2), oBuffer_.bufferDOD());
}

TEST_F(BufferCPUTest, keepsItsImageThroughAFlushAndAFailedFrame) {
    run();
    oController_.flushGraph();
    oFilter_.bThrow_ = true;
    EXPECT_ANY_THROW(run());
    oController_.flushGraph();
    EXPECT_TRUE(oBuffer_.hasData());
    oBuffer_.emit();
    run();
    EXPECT_EQ(13.0f, result(3, 1));
}

TEST_F(BufferCPUTest, isReadyToEmitOnlyWithAnImageAndFreeOutputs) {
    oBuffer_.emit();
    EXPECT_FALSE(oBuffer_.isReady()); // nothing is kept
    run();
    EXPECT_EQ(nullptr, oSink_.getImageCPU()); // so the frame has no result
    oBuffer_.internalProcess();
    EXPECT_FALSE(oBuffer_.hasData());
    run(); // which passes again
    EXPECT_EQ(13.0f, result(3, 1));
    EXPECT_FALSE(oBuffer_.isReady()); // passing: the input is empty
    oBuffer_.emit();
    EXPECT_TRUE(oBuffer_.isReady()); // emitting: the input does not matter
    oBuffer_.internalProcess();
    oBuffer_.emit();
    EXPECT_FALSE(oBuffer_.isReady()); // the output holds an image
    EXPECT_TRUE(oBuffer_.imageOutput()->hasData());
    oBuffer_.flushOutputs();
    EXPECT_TRUE(oBuffer_.isReady());
}

TEST_F(BufferCPUTest, passesAgainAfterEveryRun) {
    ORVO_EXPECT_INTERNAL(oBuffer_.internalProcess(), "Enforce pImage != NULL");
    oBuffer_.emit();
    oBuffer_.internalProcess(); // nothing kept, nothing given
    EXPECT_FALSE(oBuffer_.imageOutput()->hasData());
    ORVO_EXPECT_INTERNAL(oBuffer_.internalProcess(), "Enforce pImage != NULL");
}

TEST_F(BufferCPUTest, sharesItsImageWithSeveralConsumers) {
    TestFilter other;
    feed(other, 0, oBuffer_);
    TestFilter sum(2);
    oSink_.disconnect();
    feed(sum, 0, oBuffer_);
    feed(sum, 1, other);
    feed(oSink_, 0, sum);
    oController_.addNode(&other);
    oController_.addNode(&sum);
    run();
    EXPECT_EQ(13.0f, result(3, 1)); // the mean of two equals
    oBuffer_.emit();
    oController_.flushGraph();
    run();
    EXPECT_EQ(13.0f, result(3, 1));
    EXPECT_EQ(1, oFilter_.nRuns_);
    sum.disconnect();
    other.disconnect();
}

TEST_F(BufferCPUTest, copiesIntoABoundImage) {
    oSink_.disconnect();
    oController_.setImageSink(oBuffer_);
    HostImage target(ImageCPU::PIXEL_FORMAT_LUMINANCE32F, pixels(-3, 0, 9, 9), 2);
    oBuffer_.setBoundOutputImage(&target.image());
    run(pixels(-1, 2, 3, 2));
    EXPECT_EQ(21.0f, target.channel<float>(1, 2, 0));
    EXPECT_EQ(0xcdcdcdcd, target.channel<std::uint32_t>(2, 2, 0));
    target.set(std::vector<unsigned char>(target.get().size(), 0));
    oBuffer_.emit();
    EXPECT_TRUE(oBuffer_.isReady());
    run(pixels(-1, 2, 3, 2));
    EXPECT_EQ(21.0f, target.channel<float>(1, 2, 0));
    EXPECT_EQ(0.0f, target.channel<float>(2, 2, 0));
    EXPECT_EQ(1, oFilter_.nRuns_);
}

TEST_F(BufferCPUTest, aThousandFramesTakeNoMoreMemory) {
    auto const frames = [&](int nFrames) {
        for (int i = 0; i < nFrames; ++i) {
            if (i % 2 != 0)
                oBuffer_.emit();
            run(pixels(-2, 1, 1 + i % 5, 1 + i % 3));
        }
    };
    frames(30);
    std::size_t const nBytes = Core::MemoryStatistics::bytes(MEMORY_TYPE_OBJECT);
    std::size_t const nImages = Core::MemoryStatistics::blocks(MEMORY_TYPE_IMAGE);
    frames(990);
    EXPECT_EQ(nBytes, Core::MemoryStatistics::bytes(MEMORY_TYPE_OBJECT));
    EXPECT_EQ(nImages, Core::MemoryStatistics::blocks(MEMORY_TYPE_IMAGE));
}

TEST_F(BufferCPUTest, everyAllocationThatFailsLeavesTheNextFrameRight) {
    run();
    for (bool const bEmit : {false, true}) {
        run();
        std::size_t const nBlocks = Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT);
        std::size_t const nImages = Core::MemoryStatistics::blocks(MEMORY_TYPE_IMAGE);
        std::uint64_t n = 1;
        for (bool bMore = true; bMore && n < 100; ++n) {
            SCOPED_TRACE(n);
            if (bEmit)
                oBuffer_.emit();
            {
                Core::AllocationFailure const failure(n);
                try {
                    run();
                } catch (std::bad_alloc const&) {
                    EXPECT_TRUE(failure.hasFired());
                }
                bMore = failure.hasFired();
            }
            oController_.flushGraph();
            // What the buffer held it holds, if the frame brought it nothing else.
            EXPECT_TRUE(oBuffer_.hasData());
            EXPECT_EQ(pixels(-2, 1, 6, 5), oBuffer_.bufferDOD());
            run();
            EXPECT_EQ(13.0f, result(3, 1));
            EXPECT_EQ(nBlocks, Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT));
            EXPECT_EQ(nImages, Core::MemoryStatistics::blocks(MEMORY_TYPE_IMAGE));
        }
        EXPECT_LT(n, 100U);
        // One that passes lets the filter in front make an image.
        EXPECT_TRUE(bEmit || n > 2);
    }
}

TEST_F(BufferCPUTest, everyAllocationThatFailsOnTheWayToABoundImageLeavesTheNextFrameRight) {
    oSink_.disconnect();
    oController_.setImageSink(oBuffer_);
    HostImage target(ImageCPU::PIXEL_FORMAT_LUMINANCE32F, pixels(-3, 0, 9, 9));
    oBuffer_.setBoundOutputImage(&target.image());
    run(pixels(-1, 2, 3, 2));
    std::size_t const nBlocks = Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT);
    bool bMore = true;
    for (std::uint64_t n = 1; bMore; ++n) {
        ASSERT_LT(n, 100U);
        {
            Core::AllocationFailure const failure(n);
            try {
                run(pixels(-1, 2, 3, 2));
            } catch (std::bad_alloc const&) {
                EXPECT_TRUE(failure.hasFired());
            }
            bMore = failure.hasFired();
        }
        oController_.flushGraph();
        target.set(std::vector<unsigned char>(target.get().size(), 0));
        run(pixels(-1, 2, 3, 2));
        EXPECT_EQ(21.0f, target.channel<float>(1, 2, 0));
        EXPECT_EQ(0.0f, target.channel<float>(2, 2, 0));
        EXPECT_EQ(nBlocks, Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT));
    }
}

/// Makes a node with each allocation failing in turn; how many there are.
template <typename Make>
std::uint64_t failWhileMade(Make const& make) {
    for (std::uint64_t n = 1;; ++n) {
        std::size_t const nBlocks = Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT);
        Core::AllocationFailure const failure(n);
        try {
            make();
        } catch (std::bad_alloc const&) {
            EXPECT_TRUE(failure.hasFired());
        }
        EXPECT_EQ(nBlocks, Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT));
        if (!failure.hasFired())
            return n - 1;
    }
}

TEST_F(BufferCPUTest, isMadeOrNot) {
    failWhileMade([] { BufferCPU const buffer; });
    failWhileMade([] { BufferGPU const buffer; });
}

// In textures

class BufferGPUTest : public ShaderFlowTest {};

/// source -> buffer -> node that looks at its input.
class BufferGPURoad {
public:
    explicit BufferGPURoad(OGL::Context const& context)
        : oEnd_(1, false), oChain_(context, {&oSource_, &oBuffer_, &oEnd_}) {}

    void run() {
        oSource_.emit();
        oChain_.oController_.computeRegions(world(0, 0, 4, 4));
        oChain_.oController_.process();
    }

    ImageGPUInput oSource_;
    OpenBufferGPU oBuffer_;
    TextureNode oEnd_;
    Chain oChain_;
};

TEST_F(BufferGPUTest, hasTheStatedNameAndConnectors) {
    OpenBufferGPU buffer;
    EXPECT_EQ("BufferGPU", buffer.name());
    EXPECT_EQ("InputImage", buffer.imageInput(0)->name());
    EXPECT_EQ("OutputImage", buffer.imageOutput()->name());
    EXPECT_EQ(ORVO_TARGET_GL, buffer.getInputTargetPlatform());
    EXPECT_EQ(ORVO_TARGET_GL, buffer.getOutputTargetPlatform());
    EXPECT_EQ(ImageFilter::OUTPUT_PRECISION_DEFAULT, buffer.outputPrecisionHintParameter().value());
    EXPECT_TRUE(buffer.willRunInHardware());
    EXPECT_TRUE(buffer.canEmit());
    EXPECT_FALSE(buffer.hasData());
    EXPECT_EQ(PositionExtentInPixelSpace(), buffer.bufferDOD());
    ORVO_EXPECT_INTERNAL(buffer.internalProcess(), "Enforce pImage != NULL");
    buffer.emit();
    EXPECT_FALSE(buffer.isReady());
    buffer.internalProcess();
    ORVO_EXPECT_INTERNAL(buffer.internalProcess(), "Enforce pImage != NULL");
}

TEST_F(BufferGPUTest, passesOnAndGivesAgainWithoutItsInput) {
    BufferGPURoad road(frameContext());
    ImageGPUPtr const upFirst = textureImage(pixels(-1, 2, 4, 4), ImageGPU::PIXEL_FORMAT_RGBA8);
    ImageGPUPtr const upSecond = textureImage(pixels(0, 0, 3, 5), ImageGPU::PIXEL_FORMAT_RGB8);
    road.oSource_.setImageGPUWithNoOwnership(upFirst.get());
    road.run();
    EXPECT_EQ(upFirst.get(), road.oEnd_.pSeen_);
    EXPECT_EQ(pixels(-1, 2, 4, 4), road.oBuffer_.bufferDOD());
    road.oSource_.setImageGPUWithNoOwnership(upSecond.get());
    road.oChain_.oController_.flushGraph();
    road.oBuffer_.emit();
    EXPECT_TRUE(road.oBuffer_.isReady());
    road.run();
    EXPECT_EQ(upFirst.get(), road.oEnd_.pSeen_);
    EXPECT_FALSE(road.oSource_.imageOutput()->hasData());
    road.run();
    EXPECT_EQ(upSecond.get(), road.oEnd_.pSeen_);
    EXPECT_EQ(pixels(0, 0, 3, 5), road.oBuffer_.bufferDOD());
}

TEST_F(BufferGPUTest, copiesIntoABoundTexture) {
    OpenBufferGPU buffer;
    ImageGPUPtr const upInput = textureOf(randomTexels(pixels(-2, 1, 7, 5), 3), ImageGPU::PIXEL_FORMAT_RGBA8);
    ImageGPUPtr const upTarget =
        textureOf(randomTexels(pixels(-3, 0, 9, 9), 4), ImageGPU::PIXEL_FORMAT_RGBA32F);
    Texels const input(*upInput);
    Texels const before(*upTarget);
    Texels const region(pixels(-1, 2, 4, 3));
    Texels const expected = Texels(upTarget->positionExtent()).fill([&](int x, int y) {
        return region.contains(x, y) ? input.at(x, y) : before.at(x, y);
    });
    ShaderRoad road(frameContext(), buffer);
    road.setInput(0, *upInput);
    road.runInto(*upTarget, world(-1, 2, 4, 3));
    expectTexels(Texels(*upTarget), expected, Precision::of(ImageGPU::PIXEL_FORMAT_RGBA32F));
    EXPECT_EQ(upTarget.get(), buffer.imageOutput()->data());
    ImageGPUPtr const upOther = textureImage(pixels(-3, 0, 9, 9), ImageGPU::PIXEL_FORMAT_LUMINANCE8);
    ORVO_EXPECT_PARAMETER(road.runInto(*upOther, world(-1, 2, 4, 3)),
                          "Source and bound output image differ in their channels");
}

/// A buffer that gives into a bound texture by itself, and what it has to give.
class BoundBufferGPU {
public:
    explicit BoundBufferGPU(OGL::Context const& context)
        : upInput_(textureOf(randomTexels(pixels(-2, 1, 7, 5), 3), ImageGPU::PIXEL_FORMAT_RGBA8)),
          upTarget_(textureImage(pixels(-3, 0, 9, 9), ImageGPU::PIXEL_FORMAT_RGBA8)),
          oRoad_(context, oBuffer_) {
        oRoad_.setInput(0, *upInput_);
    }

    /// A frame that passes, or one that emits.
    void run(bool bEmit) {
        if (bEmit)
            oBuffer_.emit();
        oRoad_.runInto(*upTarget_, world(-1, 2, 4, 3));
    }
    /// The next frames of both kinds must be right.
    void expectRight() {
        Texels const input(*upInput_);
        for (bool const bEmit : {false, true}) {
            writeTexels(*upTarget_, std::vector<unsigned char>(4 * 9 * 9, 7));
            run(bEmit);
            Texels const region(pixels(-1, 2, 4, 3));
            Texels const expected = Texels(upTarget_->positionExtent()).fill([&](int x, int y) {
                return region.contains(x, y) ? input.at(x, y)
                                             : Pixel{7 / 255.0, 7 / 255.0, 7 / 255.0, 7 / 255.0};
            });
            EXPECT_EQ("",
                      differences(Texels(*upTarget_), expected, Precision::of(ImageGPU::PIXEL_FORMAT_RGBA8)));
        }
    }

private:
    ImageGPUPtr upInput_;
    ImageGPUPtr upTarget_;
    OpenBufferGPU oBuffer_;
    ShaderRoad oRoad_;
};

TEST_F(BufferGPUTest, everyCallThatFailsOnTheWayToABoundTextureLeavesTheNextFrameRight) {
    BoundBufferGPU bound(frameContext());
    for (bool const bEmit : {false, true}) {
        bound.expectRight();
        ObjectCounts const before = GLHooks::objects();
        std::set<std::string> const aFailed = failEveryCall([&] { bound.run(bEmit); },
                                                            [&] {
                                                                // None is current where the driver did not
                                                                // give it back.
                                                                host().makeCurrent();
                                                                EXPECT_EQ(0U, drainErrors());
                                                                bound.expectRight();
                                                            },
                                                            {"eglMakeCurrent"});
        for (char const* pName : {"glFramebufferTexture2D", "glCheckFramebufferStatus"})
            EXPECT_EQ(1U, aFailed.count(pName)) << pName;
        EXPECT_EQ(before, GLHooks::objects());
    }
}

TEST_F(BufferGPUTest, everyAllocationThatFailsLeavesTheNextFrameRight) {
    BoundBufferGPU bound(frameContext());
    for (bool const bEmit : {false, true}) {
        bound.expectRight();
        std::size_t const nBlocks = Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT);
        bool bMore = true;
        for (std::uint64_t n = 1; bMore; ++n) {
            ASSERT_LT(n, 100U);
            {
                Core::AllocationFailure const failure(n);
                try {
                    bound.run(bEmit);
                } catch (std::bad_alloc const&) {
                    EXPECT_TRUE(failure.hasFired());
                }
                bMore = failure.hasFired();
            }
            EXPECT_EQ(GLenum(GL_NO_ERROR), glGetError());
            bound.expectRight();
            EXPECT_EQ(nBlocks, Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT));
        }
    }
}

TEST_F(BufferGPUTest, holdsOneTextureHoweverManyFrames) {
    BufferGPURoad road(frameContext());
    for (int i = 0; i < 1000; ++i) {
        // Each image dies with the buffer's hold on it.
        road.oSource_.setImageGPU(
            textureImage(pixels(0, 0, 1 + i % 4, 1 + i % 3), ImageGPU::PIXEL_FORMAT_RGBA8, false).release());
        if (i % 3 == 2)
            road.oBuffer_.emit();
        road.run();
        road.oSource_.clear();
        road.oChain_.oController_.flushGraph();
        ASSERT_LE(GLHooks::objects()["texture"], 12L); // one for each size, one that is kept
    }
}

} // namespace
