// Nodes that run a graph of their own in OpenGL, in the context of the frame that they are part of.

#include "tests/image_flow/support/Compounds.h"
#include "tests/image_flow/support/DisplayFilters.h"

#include <random>

#include "orvo/core/exceptions/SharedException.h"
#include "orvo/core/memory/MemoryStatistics.h"
#include "orvo/image_flow/filters/BufferGPU.h"
#include "orvo/image_flow/filters/ConstTeeJointGPU.h"
#include "orvo/ogl/ScopedContextWrapper.h"

namespace {

using namespace ORVO;
using namespace ORVO::Test;

/// A tone mapping filter that can do something more in its run.
class HookedToneMapping : public MirelToneMappingGPU {
public:
    HookedToneMapping() {
        exposure().setValue(-1.0f);
        luminanceFactor().setValue(float3(0.25f, 0.5f, 0.25f));
    }
    ~HookedToneMapping() override { disconnect(); }
    void setUniforms(OGL::Program& program) override {
        ++nRuns_;
        if (onRun_)
            onRun_();
        MirelToneMappingGPU::setUniforms(program);
    }
    std::function<void()> onRun_;
    int nRuns_ = 0;
};

/// source -> compound around a hooked filter -> the same filter by itself -> sink.
class TextureCompoundGraph {
public:
    TextureCompoundGraph(OGL::Context const& context, bool bNested)
        : oPicture_(randomTexels(pixels(-3, 2, 9, 7), 21)),
          upImage_(textureOf(oPicture_, ImageGPU::PIXEL_FORMAT_RGBA16F)) {
        auto upInner = std::make_unique<HookedToneMapping>();
        pInner_ = upInner.get();
        upCompound_ = bNested ? nestedTwice<TextureRoad>(std::move(upInner))
                              : std::make_unique<TextureCompound>(std::move(upInner));
        upCompound_->setContext(context);
        oSource_.setImageGPUWithNoOwnership(upImage_.get());
        feed(*upCompound_, 0, oSource_);
        feed(oAfter_, 0, *upCompound_);
        feed(oSink_, 0, oAfter_);
        plant(oController_, {&oSource_, upCompound_.get(), &oAfter_, &oSink_}, oSink_);
        oController_.setContextGPU(context);
    }
    ~TextureCompoundGraph() {
        oController_.flushGraph();
        oAfter_.disconnect();
        oSource_.disconnect();
    }

    void prepare(PositionExtentInPixelSpace const& region) {
        oController_.flushGraph();
        oSource_.emit();
        oController_.computeRegions(pixelToWorldSpace(region, PixelExtentInWorldSpace()));
    }
    void run(PositionExtentInPixelSpace const& region = pixels(-1, 3, 5, 4)) {
        prepare(region);
        oController_.process();
    }
    void runAsync(PositionExtentInPixelSpace const& region = pixels(-1, 3, 5, 4)) {
        prepare(region);
        oController_.processAsync();
        EXPECT_TRUE(oController_.wait(60, 0.0005));
    }
    /// Runs a frame; the colours must be a quarter of the picture's, twice clamped.
    void expectRight(PositionExtentInPixelSpace const& region = pixels(-1, 3, 5, 4)) {
        run(region);
        expectResult(region);
    }
    void expectResult(PositionExtentInPixelSpace const& region = pixels(-1, 3, 5, 4)) {
        ASSERT_NE(nullptr, oSink_.getImageGPU());
        Texels const input(*upImage_);
        Texels const expected = Texels(region).fill([&](int x, int y) {
            Pixel pixel = input.at(x, y);
            for (std::size_t c = 0; c < 3; ++c)
                pixel[c] = std::min(std::max(pixel[c] / 2, 0.0), 1.0) / 2;
            pixel[3] = std::min(std::max(pixel[3], 0.0), 1.0);
            return pixel;
        });
        Precision precision = Precision::of(ImageGPU::PIXEL_FORMAT_RGBA16F);
        precision.dRelative_ *= 2; // rounded twice
        EXPECT_EQ("", differences(Texels(*oSink_.getImageGPU()), expected, precision));
    }
    ImageFlowController& innermost() {
        auto* const pMiddle = dynamic_cast<TextureCompound*>(&upCompound_->inner());
        return pMiddle == nullptr ? upCompound_->innerController() : pMiddle->innerController();
    }

    Texels oPicture_;
    ImageGPUPtr upImage_;
    ImageFlowController oController_;
    ImageGPUInput oSource_;
    HookedToneMapping* pInner_ = nullptr;
    std::unique_ptr<TextureCompound> upCompound_;
    HookedToneMapping oAfter_;
    ImageGPUOutput oSink_;
};

class TextureGraphsTest : public ShaderFlowTest {};
class CompoundFilterGPUTest : public ShaderFlowTest, public testing::WithParamInterface<bool> {};

TEST_P(CompoundFilterGPUTest, DoesWhatTheInnerGraphDoes) {
    TextureCompoundGraph graph(frameContext(), GetParam());
    graph.expectRight();
    graph.expectRight(pixels(-3, 2, 9, 7));
    graph.runAsync();
    graph.oController_.checkException();
    graph.expectResult();
}

TEST_P(CompoundFilterGPUTest, LeavesTheStateOfTheOuterFrame) {
    TextureCompoundGraph graph(frameContext(), GetParam());
    graph.run();
    OGL::ScopedContextWrapper const restore;
    frameContext().makeCurrent();
    auto const before = GLState::capture();
    graph.run();
    EXPECT_EQ("", before.differencesTo(GLState::capture()));
    graph.pInner_->onRun_ = [] { ORVO_FAIL("run failed"); };
    ORVO_EXPECT_INTERNAL(graph.run(), "run failed");
    EXPECT_EQ("", before.differencesTo(GLState::capture()));
}

TEST_P(CompoundFilterGPUTest, NeedsAContextOfItsOwn) {
    // An inner graph that was given none draws nowhere.
    auto upInner = std::make_unique<HookedToneMapping>();
    std::unique_ptr<TextureCompound> const upCompound =
        GetParam() ? nestedTwice<TextureRoad>(std::move(upInner))
                   : std::make_unique<TextureCompound>(std::move(upInner));
    ImageGPUPtr const upImage = textureImage(pixels(0, 0, 3, 3), ImageGPU::PIXEL_FORMAT_RGBA8);
    ShaderRoad road(frameContext(), *upCompound);
    road.setInput(0, *upImage);
    ORVO_EXPECT_INTERNAL(road.run(world(0, 0, 3, 3)), "Enforce pFramebuffer_ != NULL");
}

TEST_P(CompoundFilterGPUTest, EveryCallThatFailsCrossesTheLevelsAndLeavesTheNextFrameRight) {
    TextureCompoundGraph graph(frameContext(), GetParam());
    graph.expectRight();
    graph.expectRight();
    ObjectCounts const before = GLHooks::objects();
    std::uint64_t n = 1;
    for (; n < 200; ++n) {
        std::string sFailed;
        {
            GLCallFailure const failure(n);
            try {
                graph.run();
            } catch (LogicalException const&) {
                EXPECT_TRUE(failure.hasFired());
            }
            sFailed = failure.name();
        }
        host().makeCurrent();
        drainErrors();
        if (sFailed.empty())
            break;
        graph.expectRight();
        EXPECT_EQ(before, GLHooks::objects()) << sFailed;
    }
    EXPECT_GT(n, 4U);
    EXPECT_LT(n, 200U);
    // On a frame's own thread, in the compound's graph.
    GLCallFailure const failure("glCheckFramebufferStatus", 1);
    graph.runAsync();
    try {
        graph.oController_.checkException();
        ADD_FAILURE() << "no exception";
    } catch (SharedException const& shared) {
        EXPECT_NE(nullptr, dynamic_cast<OGL::ExceptionOGL const*>(shared.exception().get()));
    }
    graph.expectRight();
}

TEST_P(CompoundFilterGPUTest, CancellationCrossesTheLevels) {
    TextureCompoundGraph graph(frameContext(), GetParam());
    graph.expectRight();
    for (ImageFlowController* pController :
         {&graph.oController_, &graph.upCompound_->innerController(), &graph.innermost()}) {
        for (bool const bAsync : {false, true}) {
            int const nAfter = graph.oAfter_.nRuns_;
            int const nInner = graph.pInner_->nRuns_;
            graph.pInner_->onRun_ = [&] { pController->cancelProcess(); };
            if (bAsync)
                graph.runAsync();
            else
                graph.run();
            graph.oController_.checkException();
            EXPECT_EQ(nInner + 1, graph.pInner_->nRuns_);
            EXPECT_EQ(nAfter, graph.oAfter_.nRuns_);
            graph.pInner_->onRun_ = nullptr;
            graph.expectRight();
        }
    }
}

TEST_F(TextureGraphsTest, AThousandFramesOfACompoundTakeNothingMore) {
    TextureCompoundGraph graph(frameContext(), true);
    auto const frames = [&](int nFrames) {
        for (int i = 0; i < nFrames; ++i)
            graph.run(pixels(-1, 3, 1 + i % 4, 1 + i % 3));
    };
    frames(24);
    ObjectCounts const objects = GLHooks::objects();
    std::size_t const nBytes = Core::MemoryStatistics::bytes(MEMORY_TYPE_OBJECT);
    std::uint64_t const nPrograms = GLHooks::calls("glCreateProgram");
    frames(984);
    EXPECT_EQ(objects, GLHooks::objects());
    EXPECT_EQ(nBytes, Core::MemoryStatistics::bytes(MEMORY_TYPE_OBJECT));
    EXPECT_EQ(nPrograms, GLHooks::calls("glCreateProgram"));
}

INSTANTIATE_TEST_SUITE_P(, CompoundFilterGPUTest, testing::Bool(),
                         [](testing::TestParamInfo<bool> const& row) {
                             return row.param ? "NestedTwice" : "Once";
                         });

// Random graphs of all of the filters for previews, tee joints, buffers and compounds

/// Each of the filters once, to be run by itself.
using ReferenceFilters = std::vector<std::unique_ptr<DisplayFilterGPU>>;

/// A chain of nodes at random, each of which is also run by itself on what the one before gave.
class RandomTextureGraph {
public:
    RandomTextureGraph(OGL::Context const& context, ReferenceFilters const& aReferences, unsigned seed)
        : context_(context), aReferences_(aReferences), oRandom_(seed) {
        Texels picture = randomTexels(oRegion_, seed);
        for (int y = picture.top(); y < picture.top() + picture.height(); ++y)
            for (int x = picture.left(); x < picture.left() + picture.width(); ++x)
                for (double& value : picture.at(x, y))
                    value = (value + 0.75) / 2.25;
        upImage_ = textureOf(picture, ImageGPU::PIXEL_FORMAT_RGBA8);
        oSource_.setImageGPUWithNoOwnership(upImage_.get());
        oController_.setContextGPU(context);
        oController_.addNode(&oSource_);
        ImageFilter* pLast = &oSource_;
        for (unsigned n = 2 + pick(4); n > 0; --n)
            pLast = &append(*pLast);
        // A buffer goes on holding what it gives, and the sink takes images alone: so a filter comes last.
        pLast = &keep(aDisplayFilters[0].pMake_(), *pLast, 0);
        feed(oSink_, 0, *pLast);
        oController_.addNode(&oSink_);
        oController_.setImageSink(oSink_);
    }
    ~RandomTextureGraph() {
        oController_.flushGraph();
        oSink_.disconnect();
        for (auto const& upNode : aupNodes_)
            upNode->disconnect();
    }

    /// A frame of a random region must give what the filters give one after the other.
    void frame() {
        auto const region = pixels(int(pick(4)) - 2, 1 + int(pick(3)), 1 + int(pick(6)), 1 + int(pick(5)));
        oController_.flushGraph();
        oSource_.emit();
        oController_.computeRegions(pixelToWorldSpace(region, PixelExtentInWorldSpace()));
        oController_.process();
        ASSERT_NE(nullptr, oSink_.getImageGPU());
        EXPECT_EQ("", differences(Texels(*oSink_.getImageGPU()), stepByStep(region),
                                  Precision::of(ImageGPU::PIXEL_FORMAT_RGBA8)));
    }

private:
    unsigned pick(unsigned n) { return static_cast<unsigned>(oRandom_() % n); }

    ImageFilter& keep(std::unique_ptr<ImageFilter> upNode, ImageFilter& producer, std::size_t iRow) {
        feed(*upNode, 0, producer);
        oController_.addNode(upNode.get());
        aupNodes_.push_back(std::move(upNode));
        aiRows_.push_back(iRow);
        return *aupNodes_.back();
    }

    static constexpr std::size_t iNone = std::size(aDisplayFilters);

    ImageFilter& append(ImageFilter& last) {
        std::size_t const iRow = pick(unsigned(iNone) + 2);
        if (iRow == iNone)
            return keep(std::make_unique<BufferGPU>(), last, iNone);
        if (iRow > iNone) {
            // In a compound, or two.
            std::size_t const iInner = pick(3);
            std::unique_ptr<ImageFilter> upInner = aDisplayFilters[iInner].pMake_();
            auto upCompound = pick(2) == 0 ? nestedTwice<TextureRoad>(std::move(upInner))
                                           : std::make_unique<TextureCompound>(std::move(upInner));
            upCompound->setContext(context_);
            return keep(std::move(upCompound), last, iInner);
        }
        if (std::string(aDisplayFilters[iRow].pName_) != "GamutTestComposite")
            return keep(aDisplayFilters[iRow].pMake_(), last, iRow);
        // One image for both inputs, through a tee joint.
        ImageFilter& tee = keep(std::make_unique<ConstTeeJointGPU>(), last, iNone);
        ImageFilter& composite = keep(aDisplayFilters[iRow].pMake_(), tee, iRow);
        DataFlow::Connect(*composite.imageInput(1), *tee.clonedImageOutput(0));
        return composite;
    }

    Texels stepByStep(PositionExtentInPixelSpace const& region) {
        ImageGPUPtr upPicture;
        for (std::size_t const iRow : aiRows_) {
            if (iRow == iNone)
                continue;
            DisplayFilterGPU& filter = *aReferences_[iRow];
            // The first one sees the picture, where cells begin; the others images of just the region.
            ImageGPU& input = upPicture ? *upPicture : *upImage_;
            ImageGPUPtr upNext = textureImage(region, ImageGPU::PIXEL_FORMAT_RGBA8);
            {
                ShaderRoad road(context_, filter);
                for (std::size_t i = 0; i < filter.numberOfImageInputs(); ++i)
                    road.setInput(i, input);
                road.runInto(*upNext, pixelToWorldSpace(region, PixelExtentInWorldSpace()));
            }
            upPicture = std::move(upNext);
        }
        return Texels(*upPicture);
    }

    PositionExtentInPixelSpace const oRegion_ = pixels(-3, 0, 11, 9);
    OGL::Context const& context_;
    ReferenceFilters const& aReferences_;
    std::minstd_rand oRandom_;
    ImageGPUPtr upImage_;
    ImageFlowController oController_;
    ImageGPUInput oSource_;
    ImageGPUOutput oSink_;
    std::vector<std::unique_ptr<ImageFilter>> aupNodes_;
    /// The rows of the filters in the order of the chain; iNone for what changes nothing.
    std::vector<std::size_t> aiRows_;
};

TEST_F(TextureGraphsTest, EveryFrameGivesWhatTheFiltersGiveOneAfterTheOther) {
    ReferenceFilters aReferences;
    for (DisplayFilterRow const& row : aDisplayFilters)
        aReferences.push_back(row.pMake_());
    for (unsigned seed = 1; seed <= 16 && !HasFailure(); ++seed) {
        SCOPED_TRACE(testing::Message() << "seed " << seed);
        RandomTextureGraph graph(frameContext(), aReferences, seed);
        for (int i = 0; i < 3; ++i)
            graph.frame();
    }
}

} // namespace
