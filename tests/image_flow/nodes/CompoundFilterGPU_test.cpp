// Nodes that run a graph of their own in OpenGL, in the context of the frame that they are part of.

#include "tests/image_flow/support/Compounds.h"
#include "tests/image_flow/support/DisplayFilters.h"

#include <algorithm>
#include <random>

#include "orvo/core/exceptions/SharedException.h"
#include "orvo/core/memory/AllocationFailure.h"
#include "orvo/core/memory/MemoryStatistics.h"
#include "orvo/image_flow/filters/BufferGPU.h"
#include "orvo/image_flow/filters/ConstTeeJointGPU.h"
#include "orvo/image_flow/filters/FastBilateralFilterGPU.h"
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

TEST_P(CompoundFilterGPUTest, EveryAllocationThatFailsLeavesTheNextFrameRight) {
    TextureCompoundGraph graph(frameContext(), GetParam());
    graph.expectRight();
    graph.expectRight();
    ObjectCounts const objects = GLHooks::objects();
    std::size_t const nBlocks = Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT);
    std::uint64_t n = 1;
    for (bool bMore = true; bMore && n < 200; ++n) {
        {
            Core::AllocationFailure const failure(n);
            try {
                graph.run();
            } catch (std::bad_alloc const&) {
                EXPECT_TRUE(failure.hasFired());
            }
            bMore = failure.hasFired();
        }
        EXPECT_EQ(GLenum(GL_NO_ERROR), glGetError());
        graph.expectRight();
        EXPECT_EQ(objects, GLHooks::objects()) << n;
        EXPECT_EQ(nBlocks, Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT)) << n;
    }
    EXPECT_GT(n, 3U);
    EXPECT_LT(n, 200U);
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

// Random graphs of the bilateral filter, the filters for previews, tee joints, buffers and compounds

/// A filter that draws: those for previews, and behind them the bilateral one.
std::unique_ptr<ImageFilter> makeDrawingFilter(std::size_t iRow) {
    if (iRow < std::size(aDisplayFilters))
        return aDisplayFilters[iRow].pMake_();
    auto upFilter = std::make_unique<FastBilateralFilterGPU>();
    upFilter->spatialSigma().setValue(float2(1.5f, 1.0f));
    upFilter->rangeSigma().setValue(0.4f);
    upFilter->colorize().setValue(true);
    return upFilter;
}

/// Each of the filters once, to be run by itself.
using ReferenceFilters = std::vector<std::unique_ptr<ImageFilter>>;

/// A chain of nodes at random, each of which is also run by itself on what the one before gave.
class RandomTextureGraph {
public:
    RandomTextureGraph(OGL::Context const& context, ReferenceFilters const& aReferences, unsigned seed)
        : context_(context),
          aReferences_(aReferences),
          oRandom_(seed),
          oPicture_(randomTexels(oRegion_, seed)) {
        for (int y = oPicture_.top(); y < oPicture_.top() + oPicture_.height(); ++y)
            for (int x = oPicture_.left(); x < oPicture_.left() + oPicture_.width(); ++x)
                for (double& value : oPicture_.at(x, y))
                    value = (value + 0.75) / 2.25;
        upImage_ = textureOf(oPicture_, ImageGPU::PIXEL_FORMAT_RGBA8);
        oController_.setContextGPU(context);
        oController_.addNode(&oSource_);
        ImageFilter* pLast = &oSource_;
        for (unsigned n = 2 + pick(4); n > 0; --n)
            pLast = &append(*pLast);
        // A buffer goes on holding what it gives, and the sink takes images alone: so a filter comes last.
        pLast = &keep(makeDrawingFilter(0), *pLast, 0);
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

    /// A frame of a random region must give what the filters give one after the other, also after one that
    /// was cancelled, and whatever the picture holds outside of what the frame asks for.
    void frame() {
        // At times beyond the picture, where the bilateral filter has something still.
        auto const region = pixels(int(pick(10)) - 8, int(pick(7)) - 4, 6 + int(pick(5)), 5 + int(pick(4)));
        if (pick(3) == 0) {
            prepare(region);
            oController_.processAsync();
            oController_.cancelProcess();
            EXPECT_TRUE(oController_.wait(60, 0.0005));
            EXPECT_NO_THROW(oController_.checkException());
        }
        prepare(region);
        if (pick(2) == 0) {
            oController_.process();
        } else {
            oController_.processAsync();
            EXPECT_TRUE(oController_.wait(60, 0.0005));
            EXPECT_NO_THROW(oController_.checkException());
        }
        ASSERT_NE(nullptr, oSink_.getImageGPU());
        // Two steps of 8 bits: textures between the nodes are larger than those of the references.
        EXPECT_EQ("", differences(Texels(*oSink_.getImageGPU()), stepByStep(region),
                                  {4, true, 2.0 / 255.0 + 1e-6, 0}));
    }

    bool has(std::size_t iRow) const { return std::count(aiRows_.begin(), aiRows_.end(), iRow) > 0; }

    static constexpr std::size_t iBilateral = std::size(aDisplayFilters);

private:
    unsigned pick(unsigned n) { return static_cast<unsigned>(oRandom_() % n); }

    void prepare(PositionExtentInPixelSpace const& region) {
        oController_.flushGraph();
        oSource_.setImageGPUWithNoOwnership(upImage_.get());
        oSource_.emit();
        oController_.computeRegions(pixelToWorldSpace(region, PixelExtentInWorldSpace()));
        // Other pixels outside of what is asked for, each time.
        Texels const asked(
            worldToPixelSpace(oSource_.computeRegionParameter().value(), PixelExtentInWorldSpace()));
        Texels const other = randomTexels(oRegion_, pick(1000));
        upSpoiled_ = textureOf(Texels(oRegion_).fill([&](int x, int y) {
            return asked.contains(x, y) ? oPicture_.at(x, y) : other.at(x, y);
        }),
                               ImageGPU::PIXEL_FORMAT_RGBA8);
        oSource_.setImageGPUWithNoOwnership(upSpoiled_.get());
        oSource_.emit();
    }

    ImageFilter& keep(std::unique_ptr<ImageFilter> upNode, ImageFilter& producer, std::size_t iRow) {
        feed(*upNode, 0, producer);
        oController_.addNode(upNode.get());
        aupNodes_.push_back(std::move(upNode));
        aiRows_.push_back(iRow);
        return *aupNodes_.back();
    }

    static constexpr std::size_t iNone = iBilateral + 1;

    ImageFilter& append(ImageFilter& last) {
        std::size_t const iRow = pick(unsigned(iNone) + 2);
        if (iRow == iNone)
            return keep(std::make_unique<BufferGPU>(), last, iNone);
        if (iRow > iNone) {
            // In a compound, or two.
            std::size_t const iInner = pick(4) == 3 ? iBilateral : pick(3);
            std::unique_ptr<ImageFilter> upInner = makeDrawingFilter(iInner);
            auto upCompound = pick(2) == 0 ? nestedTwice<TextureRoad>(std::move(upInner))
                                           : std::make_unique<TextureCompound>(std::move(upInner));
            upCompound->setContext(context_);
            return keep(std::move(upCompound), last, iInner);
        }
        if (iRow == iBilateral || std::string(aDisplayFilters[iRow].pName_) != "GamutTestComposite")
            return keep(makeDrawingFilter(iRow), last, iRow);
        // One image for both inputs, through a tee joint.
        ImageFilter& tee = keep(std::make_unique<ConstTeeJointGPU>(), last, iNone);
        ImageFilter& composite = keep(makeDrawingFilter(iRow), tee, iRow);
        DataFlow::Connect(*composite.imageInput(1), *tee.clonedImageOutput(0));
        return composite;
    }

    /// What each node of the chain computes: of its domain that which is asked for.
    std::vector<PositionExtentInPixelSpace> computedRegions(PositionExtentInPixelSpace const& region) const {
        std::vector<PositionExtentInWorldSpace> aRegions;
        PositionExtentInWorldSpace domain = pixelToWorldSpace(oRegion_, PixelExtentInWorldSpace());
        for (std::size_t const iRow : aiRows_) {
            if (iRow == iBilateral)
                domain.outset(oReach_);
            aRegions.push_back(domain);
        }
        PositionExtentInWorldSpace asked = pixelToWorldSpace(region, PixelExtentInWorldSpace());
        std::vector<PositionExtentInPixelSpace> aComputed(aRegions.size());
        for (std::size_t i = aRegions.size(); i-- > 0;) {
            aRegions[i].intersect(asked);
            aComputed[i] = worldToPixelSpace(aRegions[i], PixelExtentInWorldSpace());
            if (aiRows_[i] == iBilateral)
                asked.outset(oReach_);
        }
        return aComputed;
    }

    Texels stepByStep(PositionExtentInPixelSpace const& region) {
        std::vector<PositionExtentInPixelSpace> const aComputed = computedRegions(region);
        ImageGPUPtr upPicture;
        for (std::size_t iNode = 0; iNode < aiRows_.size(); ++iNode) {
            if (aiRows_[iNode] == iNone)
                continue;
            ImageFilter& filter = *aReferences_[aiRows_[iNode]];
            // The first one sees the picture, where cells begin; the others images of just their regions.
            ImageGPU& input = upPicture ? *upPicture : *upImage_;
            ImageGPUPtr upNext = textureImage(aComputed[iNode], ImageGPU::PIXEL_FORMAT_RGBA8);
            {
                ShaderRoad road(context_, filter);
                for (std::size_t i = 0; i < filter.numberOfImageInputs(); ++i)
                    road.setInput(i, input);
                road.runInto(*upNext, pixelToWorldSpace(aComputed[iNode], PixelExtentInWorldSpace()));
            }
            upPicture = std::move(upNext);
        }
        return Texels(*upPicture);
    }

    PositionExtentInPixelSpace const oRegion_ = pixels(-3, 0, 11, 9);
    float2 const oReach_{4.0f, 3.0f}; // ceil(2.146 * 1.5), ceil(2.146 * 1)
    OGL::Context const& context_;
    ReferenceFilters const& aReferences_;
    std::minstd_rand oRandom_;
    Texels oPicture_;
    ImageGPUPtr upImage_;
    ImageGPUPtr upSpoiled_; // what the source gives in the frame
    ImageFlowController oController_;
    ImageGPUInput oSource_;
    ImageGPUOutput oSink_;
    std::vector<std::unique_ptr<ImageFilter>> aupNodes_;
    /// The rows of the filters in the order of the chain; iNone for what changes nothing.
    std::vector<std::size_t> aiRows_;
};

TEST_F(TextureGraphsTest, EveryFrameGivesWhatTheFiltersGiveOneAfterTheOther) {
    ReferenceFilters aReferences;
    for (std::size_t iRow = 0; iRow <= RandomTextureGraph::iBilateral; ++iRow)
        aReferences.push_back(makeDrawingFilter(iRow));
    int nWithBilateral = 0;
    for (unsigned seed = 1; seed <= 16 && !HasFailure(); ++seed) {
        SCOPED_TRACE(testing::Message() << "seed " << seed);
        RandomTextureGraph graph(frameContext(), aReferences, seed);
        for (int i = 0; i < 3; ++i)
            graph.frame();
        nWithBilateral += graph.has(RandomTextureGraph::iBilateral) ? 1 : 0;
    }
    EXPECT_GT(nWithBilateral, 4);
}

} // namespace
