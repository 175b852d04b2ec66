// All filters that the library registers, in one graph for each target: many frames of changing sizes, and
// frames in which calls and allocations fail.
#include "orvo/core/exceptions/ExceptionBase.h"
#include "orvo/core/memory/AllocationFailure.h"
#include "orvo/core/memory/MemoryStatistics.h"
#include "orvo/filter_graph/filters/StandardFilters.h"
#include "orvo/filter_graph/impl/FilterFactory.h"
#include "orvo/filter_graph/impl/Input.h"
#include "orvo/filter_graph/impl/Parameter.h"
#include "orvo/image_runtime/ShaderManagerOGL.h"
#include "orvo/image_runtime/TexturePool.h"
#include "orvo/ogl/Framebuffer.h"
#include "tests/support/gl/GLFrameTest.h"

#include <set>
#include <utility>

namespace ORVO::FilterGraph {
namespace {

using namespace ORVO::Test;

/// A filter of the library by its name.
struct FilterName {
    char const* pName_;
    char const* pNameSpace_ = "ImageFlow";
    char const* pVendor_ = "Norvane";
};

/// In an order in which each takes what the one before gives. Those that scale fewer channels come first:
/// what follows gives four again.
constexpr FilterName aFiltersOnGL[] = {{"scaleUp1channel", "ORVO"},
                                       {"scaleDown1channel", "ORVO"},
                                       {"scaleUp2channel", "ORVO"},
                                       {"scaleDown2channel", "ORVO"},
                                       {"scaleUp3channel", "ORVO"},
                                       {"scaleDown3channel", "ORVO"},
                                       {"premultiply", "ORVO"},
                                       {"FastBilateralBlur", "Motion Loft", "Norvane Works"},
                                       {"unpremultiply", "ORVO"},
                                       {"MirelCheckerBoardGPU"},
                                       {"MirelToneMappingGPU"},
                                       {"MirelGamutComposite"},
                                       {"ColorspaceTransformer", "com.norvane.orvo"},
                                       {"FastBilateralFilter"},
                                       {"scaleUp4channel", "ORVO"},
                                       {"scaleDown4channel", "ORVO"}};

constexpr FilterName aFiltersOnCPU[] = {{"FastBilateralBlur", "Motion Loft", "Norvane Works"},
                                        {"ColorspaceTransformer", "com.norvane.orvo"},
                                        {"SimpleBilateralCPU"},
                                        {"RGBToLABCPU"},
                                        {"LABToRGBCPU"},
                                        {"VantleFilterCPU"},
                                        {"ConvertToSIMDOptimized"},
                                        {"ConvertFromSIMDOptimized"}};

/// source -> the filters, one after the other -> sink; two inputs of a filter get the same picture.
class ChainOfAll {
public:
    template <std::size_t n>
    ChainOfAll(FilterName const (&aNames)[n], OptimizationOptions const& options,
               OGL::Context const* pContext)
        : oOptions_(options) {
        for (FilterName const& name : aNames) {
            FilterPtr const spFilter =
                FilterFactory::Instance()->create({name.pName_, name.pNameSpace_, name.pVendor_});
            for (Input* const pInput : spFilter->inputs()) {
                if (aFilters_.empty()) {
                    Connect(spSource_, pInput);
                } else {
                    Connect(aFilters_.back(), pInput);
                }
            }
            if (spFilter->parameter("spatialSigma") != nullptr && name.pName_[0] == 'F') {
                spFilter->parameter("spatialSigma")->as<float2>().setValue(float2(2.0F, 2.0F));
                spFilter->parameter("rangeSigma")->as<float>().setValue(0.5F);
            }
            aFilters_.push_back(spFilter);
        }
        Connect(aFilters_.back(), spSink_);
        spProcessor_ = createProcessor(spSink_, pContext);
    }

    void run(ImageBase* pInput, ImageBase* pOutput) {
        spSource_->setImage(pInput);
        spSink_->setImage(pOutput);
        spProcessor_->processFrame(oOptions_);
    }

private:
    OptimizationOptions oOptions_;
    SourcePtr spSource_ = createInputAdapter(IAdapter::REGION_SYNC_FROM_IMAGE);
    SinkPtr spSink_ = createOutputAdapter(IAdapter::REGION_SYNC_FROM_IMAGE);
    std::vector<FilterPtr> aFilters_;
    std::shared_ptr<IProcessor> spProcessor_;
};

/// What is in use, and how many programs were ever made.
struct InUse {
    std::size_t nBlocks_ = Core::MemoryStatistics::blocks(MEMORY_TYPE_OBJECT);
    std::size_t nBytes_ = Core::MemoryStatistics::bytes(MEMORY_TYPE_OBJECT);
    std::size_t nImages_ = Core::MemoryStatistics::blocks(MEMORY_TYPE_IMAGE);
    ObjectCounts oObjects_ = GLHooks::objects();
    std::uint64_t nPrograms_ = GLHooks::calls("glCreateProgram");
};

void expectSameUse(InUse const& before, InUse const& after) {
    EXPECT_EQ(before.nBlocks_, after.nBlocks_);
    EXPECT_EQ(before.nBytes_, after.nBytes_);
    EXPECT_EQ(before.nImages_, after.nImages_);
    EXPECT_EQ(before.oObjects_, after.oObjects_);
    EXPECT_EQ(before.nPrograms_, after.nPrograms_);
}

class EveryFilterTest : public GLFrameTest {
protected:
    void SetUp() override {
        GLFrameTest::SetUp();
        insertStandardFilters();
    }
    void TearDown() override {
        removeStandardFilters();
        GLFrameTest::TearDown();
    }

    /// Frames of twelve sizes in turn, between pictures in host memory.
    static void expectNoGrowth(ChainOfAll& chain) {
        std::vector<std::unique_ptr<ByteImage>> aupImages;
        for (int i = 0; i < 12; ++i) {
            for (int end = 0; end < 2; ++end) {
                aupImages.push_back(std::make_unique<ByteImage>(0, 0, 1 + i % 4, 1 + i % 3, 100));
            }
        }
        auto const frames = [&](int nRounds) {
            for (int round = 0; round < nRounds; ++round) {
                for (std::size_t i = 0; i < aupImages.size(); i += 2) {
                    chain.run(aupImages[i]->handle(), aupImages[i + 1]->handle());
                }
            }
        };
        frames(4);
        InUse const before;
        frames(84); // 1,008 frames, which end as the measurement began
        expectSameUse(before, InUse());
    }
};

TEST_F(EveryFilterTest, StandsInOneOfTheGraphs) {
    std::set<std::string> aNames;
    for (auto const& pPrototype : FilterFactory::Instance()->prototypes()) {
        aNames.insert(pPrototype->identifier().name());
    }
    std::set<std::string> aSeen;
    for (FilterName const& name : aFiltersOnGL) {
        aSeen.insert(name.pName_);
    }
    for (FilterName const& name : aFiltersOnCPU) {
        aSeen.insert(name.pName_);
    }
    EXPECT_EQ(aNames, aSeen);
}

TEST_F(EveryFilterTest, GrowsNothingInAThousandFramesOnOpenGL) {
    ChainOfAll chain(aFiltersOnGL, glOptions(), context());
    expectNoGrowth(chain);
}

TEST_F(EveryFilterTest, GrowsNothingInAThousandFramesOnTheCPU) {
    ChainOfAll chain(aFiltersOnCPU, cpuOptions(), context());
    expectNoGrowth(chain);
}

/// One picture of random bytes through a chain, again and again.
class RepeatedFrame {
public:
    explicit RepeatedFrame(ChainOfAll& chain) : chain_(chain) {
        oInput_.write(pattern(7, 5));
        run();
        aExpected_ = oOutput_.bytes();
        // Not what any filter gives for nothing.
        EXPECT_GT(std::set<std::uint8_t>(aExpected_.begin(), aExpected_.end()).size(), 10U);
        run();
        EXPECT_EQ(aExpected_, oOutput_.bytes());
    }

    void run() {
        oOutput_.fill(std::uint8_t(3));
        chain_.run(oInput_.handle(), oOutput_.handle());
    }
    void expectRight() {
        ASSERT_NO_THROW(run());
        EXPECT_EQ(aExpected_, oOutput_.bytes());
    }

private:
    ChainOfAll& chain_;
    ByteImage oInput_{0, 0, 7, 5};
    ByteImage oOutput_{0, 0, 7, 5};
    std::vector<std::uint8_t> aExpected_;
};

TEST_F(EveryFilterTest, GivesTheSameAfterEachCallThatFails) {
    ChainOfAll chain(aFiltersOnGL, glOptions(), context());
    RepeatedFrame frame(chain);
    TexturePool::Instance()->clearAll();
    frame.run();
    ObjectCounts const before = GLHooks::objects();
    std::set<std::string> aFailed;
    bool bMore = true;
    for (std::uint64_t n = 1; bMore; ++n) {
        ASSERT_LT(n, 1000U);
        // Nothing is there to be used again.
        TexturePool::Instance()->clearAll();
        std::string sFailed;
        {
            GLCallFailure const failure(n);
            try {
                frame.run();
            } catch (ExceptionBase const&) {
                EXPECT_TRUE(failure.hasFired());
            }
            sFailed = failure.name();
        }
        bMore = !sFailed.empty();
        // None is current where the driver did not give it back.
        host().makeCurrent();
        drainErrors();
        TexturePool::Instance()->clearAll();
        frame.expectRight();
        EXPECT_EQ(before, GLHooks::objects()) << "after a failed " << sFailed;
        ASSERT_FALSE(HasFailure()) << "after a failed " << sFailed << ", call " << n;
        aFailed.insert(sFailed);
    }
    for (char const* pName : {"glGenTextures", "glTexImage2D", "glFramebufferTexture2D",
                              "glCheckFramebufferStatus", "glReadPixels", "glTexSubImage2D"}) {
        EXPECT_EQ(1U, aFailed.count(pName)) << pName;
    }
}

TEST_F(EveryFilterTest, GivesTheSameAfterEachAllocationThatFails) {
    for (bool const bGL : {true, false}) {
        ChainOfAll chain = bGL ? ChainOfAll(aFiltersOnGL, glOptions(), context())
                               : ChainOfAll(aFiltersOnCPU, cpuOptions(), context());
        RepeatedFrame frame(chain);
        auto const usage = [&] {
            TexturePool::Instance()->clearAll();
            frame.expectRight();
            return std::pair(Core::MemoryStatistics::bytes(MEMORY_TYPE_OBJECT), GLHooks::objects());
        };
        auto const before = usage();
        std::uint64_t n = 1;
        for (bool bMore = true; bMore; ++n) {
            ASSERT_LT(n, 1000U);
            TexturePool::Instance()->clearAll();
            {
                Core::AllocationFailure const failure(n);
                try {
                    frame.run();
                } catch (std::bad_alloc const&) {
                    EXPECT_TRUE(failure.hasFired());
                } catch (ExceptionBase const&) { // where it crossed a thread
                    EXPECT_TRUE(failure.hasFired());
                }
                bMore = failure.hasFired();
            }
            host().makeCurrent();
            EXPECT_EQ(before, usage()) << n;
            ASSERT_FALSE(HasFailure()) << n;
        }
        EXPECT_GT(n, 15U); // an image for each filter at least
    }
}

/// The composite, whose build makes most: a node, its programs and two companions.
constexpr FilterName aBilateralAlone[] = {{"FastBilateralBlur", "Motion Loft", "Norvane Works"}};

TEST_F(EveryFilterTest, EveryAllocationOfTheBilateralFiltersBuildMayFail) {
    // A graph that is built, run and gone, with an allocation failing if n is not 0: what the next frame
    // gives, and whether one failed.
    auto const buildFailing = [this](std::uint64_t n) {
        ByteImage input(0, 0, 7, 5);
        ByteImage output(0, 0, 7, 5);
        input.write(pattern(7, 5));
        ChainOfAll chain(aBilateralAlone, glOptions(), context());
        bool bFailed = false;
        {
            Core::AllocationFailure const failure(n);
            try {
                chain.run(input.handle(), output.handle());
            } catch (std::bad_alloc const&) {
                EXPECT_TRUE(failure.hasFired());
            } catch (ExceptionBase const&) {
                // A node that could not be made whole says that it does not run in hardware.
                EXPECT_TRUE(failure.hasFired());
            }
            bFailed = failure.hasFired();
        }
        host().makeCurrent();
        EXPECT_NO_THROW(chain.run(input.handle(), output.handle())) << n;
        return std::pair(bFailed, output.bytes());
    };
    auto const usage = [] {
        TexturePool::Instance()->clearAll();
        // Programs of prototypes are given up when they are old.
        ShaderManagerOGL::Instance()->clearAll();
        // A framebuffer's name that was left waiting for this context is deleted when another one is made.
        static_cast<void>(OGL::Framebuffer());
        return std::pair(Core::MemoryStatistics::bytes(MEMORY_TYPE_OBJECT), GLHooks::objects());
    };
    std::vector<std::uint8_t> const aExpected = buildFailing(0).second;
    auto const before = usage();
    std::uint64_t n = 1;
    for (bool bMore = true; bMore; ++n) {
        ASSERT_LT(n, 1000U);
        auto const [bFailed, aResult] = buildFailing(n);
        EXPECT_EQ(aExpected, aResult) << n;
        EXPECT_EQ(before, usage()) << n;
        ASSERT_FALSE(HasFailure());
        bMore = bFailed;
    }
    EXPECT_GT(n, 50U);
}

} // namespace
} // namespace ORVO::FilterGraph
