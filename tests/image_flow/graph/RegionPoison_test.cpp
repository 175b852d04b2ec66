// No pixel outside the region that a filter declares by `needed` may have an influence: such pixels are
// filled with NaN, and, under address sanitizer, made inaccessible.

#include "orvo/image_flow/filters/BufferCPU.h"
#include "orvo/image_flow/filters/ConvertFromSIMDOptimized.h"
#include "orvo/image_flow/filters/ConvertToSIMDOptimized.h"
#include "orvo/image_flow/filters/FastBilateralFilterCPUNode.h"
#include "orvo/image_flow/filters/LABToRGBCPU.h"
#include "orvo/image_flow/filters/RGBToLABCPU.h"
#include "orvo/image_flow/filters/SimpleBilateralFilterCPU.h"
#include "tests/image_flow/support/Compounds.h"
#include "tests/support/ImageFlowLayers.h"

#include <gtest/gtest.h>

#include <cmath>
#include <random>

#if defined(__SANITIZE_ADDRESS__)
#include <sanitizer/asan_interface.h>
#define ORVO_TEST_POISON(address, bytes) ASAN_POISON_MEMORY_REGION(address, bytes)
#define ORVO_TEST_UNPOISON(address, bytes) ASAN_UNPOISON_MEMORY_REGION(address, bytes)
#else
#define ORVO_TEST_POISON(address, bytes) static_cast<void>(address), static_cast<void>(bytes)
#define ORVO_TEST_UNPOISON(address, bytes) static_cast<void>(address), static_cast<void>(bytes)
#endif

namespace ORVO {

namespace {

using Test::feed;
using Test::pixelAt;
using Test::pixels;
using Test::TestFilter;
using Test::world;

enum class Poison { NONE, NAN_ONLY, NAN_AND_MEMORY };

/// A client's RGBA float picture, in which all pixels outside a region can be poisoned.
class Picture {
public:
    explicit Picture(PositionExtentInPixelSpace const& region)
        : oImage_(ImageCPU::PIXEL_FORMAT_RGBA32F, region, PixelExtentInWorldSpace(),
                  ExtentInPixelSpace(region.extent().width() + 3, region.extent().height())) {
        std::mt19937 random(7);
        std::uniform_real_distribution<float> value(0.0f, 1.0f);
        for (int y = 0; y < region.extent().height(); ++y) {
            for (int x = 0; x < region.extent().width(); ++x) {
                for (int c = 0; c < 4; ++c) {
                    pixelAt(oImage_, region.position().x() + x, region.position().y() + y)[c] = value(random);
                }
            }
        }
    }

    ~Picture() { ORVO_TEST_UNPOISON(oImage_.pixels(), bytes()); }

    void poisonOutside(PositionExtentInPixelSpace const& region, Poison poison) {
        PositionInPixelSpace const origin = oImage_.position();
        for (int row = 0; row < oImage_.capacityExtent().height(); ++row) {
            for (int column = 0; column < oImage_.capacityExtent().width(); ++column) {
                int const x = origin.x() + column - region.position().x();
                int const y = origin.y() + row - region.position().y();
                if (x >= 0 && x < region.extent().width() && y >= 0 && y < region.extent().height()) {
                    continue;
                }
                float* const pPixel = pixelAt(oImage_, origin.x() + column, origin.y() + row);
                std::fill_n(pPixel, 4, std::nanf(""));
                if (poison == Poison::NAN_AND_MEMORY) {
                    ORVO_TEST_POISON(pPixel, 16);
                }
            }
        }
    }

    std::size_t bytes() const {
        return std::size_t(oImage_.capacityExtent().width()) *
               std::size_t(oImage_.capacityExtent().height()) * 16;
    }

    ImageCPU oImage_;
};

/// A graph between one source and one sink; `build` puts the nodes between them.
class PoisonTest : public testing::Test {
protected:
    /// Nodes between source and sink, of which the last feeds the sink.
    using Nodes = std::vector<std::unique_ptr<ImageFilter>>;
    using Builder = void (*)(Nodes&, ImageFilter& source);

    static std::vector<float> run(Builder build, PositionExtentInWorldSpace const& asked, Poison poison) {
        Picture picture(pixels(-10, 5, 60, 40));
        ImageCPUInput source;
        Nodes nodes;
        ImageCPUOutput sink;
        build(nodes, source);
        feed(sink, 0, *nodes.back());
        ImageFlowController controller;
        controller.addNode(&source);
        for (auto const& upNode : nodes) {
            controller.addNode(upNode.get());
        }
        controller.addNode(&sink);
        controller.setImageSink(sink);
        source.setImageCPUWithNoOwnership(&picture.oImage_);
        source.emit();
        controller.computeRegions(asked);
        if (poison != Poison::NONE) {
            picture.poisonOutside(
                worldToPixelSpace(source.computeRegionParameter().value(), PixelExtentInWorldSpace()),
                poison);
        }
        controller.process();
        std::vector<float> result = pixelsOf(*sink.getImageCPU());
        sink.disconnect();
        for (auto const& upNode : nodes) {
            upNode->disconnect();
        }
        return result;
    }

    static std::vector<float> pixelsOf(ImageCPU const& image) {
        std::vector<float> result;
        for (int y = 0; y < image.extent().height(); ++y) {
            for (int x = 0; x < image.extent().width(); ++x) {
                float const* const p = pixelAt(image, image.position().x() + x, image.position().y() + y);
                result.insert(result.end(), p, p + 4);
            }
        }
        return result;
    }

    /// Asks for parts inside, at the corners and beyond the edges of the picture.
    static void check(Builder build) {
        checkInside(build);
        check(build, {world(-10, 5, 60, 40), world(-14, 0, 9, 9), world(43, 38, 20, 20)});
    }

    /// Asks for parts inside alone.
    static void checkInside(Builder build, Poison poison = Poison::NAN_AND_MEMORY) {
        check(build, {world(0, 10, 8, 6), world(7, 9, 1, 1), world(20.25f, 20.5f, 3.5f, 2.25f)}, poison);
    }

    static void check(Builder build, std::vector<PositionExtentInWorldSpace> const& aAsked,
                      Poison poison = Poison::NAN_AND_MEMORY) {
        for (auto const& asked : aAsked) {
            SCOPED_TRACE(testing::Message() << asked);
            std::vector<float> const clean = run(build, asked, Poison::NONE);
            EXPECT_FALSE(clean.empty());
            EXPECT_EQ(0, std::count_if(clean.begin(), clean.end(), [](float f) { return std::isnan(f); }));
            EXPECT_EQ(clean, run(build, asked, poison));
        }
    }

    static TestFilter& addFilter(Nodes& nodes, std::size_t nInputs, int radius) {
        auto upFilter = std::make_unique<TestFilter>(nInputs);
        upFilter->nForcedChannels_ = 4;
        upFilter->iRadius_ = radius;
        nodes.push_back(std::move(upFilter));
        return static_cast<TestFilter&>(*nodes.back());
    }

    ORVO::Test::ImageFlowLayers oLayers_;
};

TEST_F(PoisonTest, aChainOfBlurs) {
    check([](Nodes& nodes, ImageFilter& source) {
        ImageFilter* pLast = &source;
        for (int radius : {2, 0, 3, 1}) {
            ImageFilter& filter = addFilter(nodes, 1, radius);
            feed(filter, 0, *pLast);
            pLast = &filter;
        }
    });
}

TEST_F(PoisonTest, aDiamond) {
    check([](Nodes& nodes, ImageFilter& source) {
        ImageFilter& left = addFilter(nodes, 1, 4);
        ImageFilter& right = addFilter(nodes, 1, 1);
        ImageFilter& join = addFilter(nodes, 3, 2);
        feed(left, 0, source);
        feed(right, 0, source);
        feed(join, 0, left);
        feed(join, 1, right);
        feed(join, 2, source);
    });
}

TEST_F(PoisonTest, throughTheSIMDConversions) {
    check([](Nodes& nodes, ImageFilter& source) {
        nodes.push_back(std::make_unique<ConvertToSIMDOptimized>());
        feed(*nodes.back(), 0, source);
        ImageFilter& blur = addFilter(nodes, 1, 2);
        feed(blur, 0, *nodes.front());
        nodes.push_back(std::make_unique<ConvertFromSIMDOptimized>());
        feed(*nodes.back(), 0, blur);
    });
}

TEST_F(PoisonTest, throughTheFiltersOfTheLibrary) {
    for (Builder const build :
         std::initializer_list<Builder>{[](Nodes&nodes, ImageFilter&source) {
                                            auto upFilter = std::make_unique<FastBilateralFilterCPUNode>();
                                            upFilter->spatialSigma().setValue(float2(2.0f, 1.5f));
                                            nodes.push_back(std::move(upFilter));
                                            feed(*nodes.back(), 0, source);
                                        },
                                        [](Nodes&nodes, ImageFilter&source) {
                                            auto upFilter = std::make_unique<FastBilateralFilterCPUNode>();
                                            upFilter->colorize().setValue(true);
                                            nodes.push_back(std::move(upFilter));
                                            feed(*nodes.back(), 0, source);
                                        },
                                        [](Nodes&nodes, ImageFilter&source) {
                                            nodes.push_back(std::make_unique<RGBToLABCPU>());
                                            feed(*nodes.back(), 0, source);
                                            nodes.push_back(std::make_unique<LABToRGBCPU>());
                                            feed(*nodes.back(), 0, *nodes.front());
                                        }}) {
        check(build);
    }
}

TEST_F(PoisonTest, throughTheSimpleBilateralFilterAwayFromTheEdges) {
    // What stands beyond the edges of the picture comes from elsewhere in it, as the filter's header says: it
    // is read for every row, and used at the edges alone.
    checkInside(
        [](Nodes& nodes, ImageFilter& source) {
            auto upFilter = std::make_unique<SimpleBilateralFilterCPU>();
            upFilter->spatialSigma().setValue(3.0f);
            upFilter->rangeSigma().setValue(0.5f);
            nodes.push_back(std::move(upFilter));
            feed(*nodes.back(), 0, source);
        },
        Poison::NAN_ONLY);
}

TEST_F(PoisonTest, throughGraphsInsideNodesAndABuffer) {
    check([](Nodes& nodes, ImageFilter& source) {
        auto upBlur = std::make_unique<TestFilter>();
        upBlur->nForcedChannels_ = 4;
        upBlur->iRadius_ = 2;
        nodes.push_back(ORVO::Test::nestedTwice<ORVO::Test::HostRoad>(std::move(upBlur)));
        feed(*nodes.back(), 0, source);
        nodes.push_back(std::make_unique<BufferCPU>());
        feed(*nodes.back(), 0, *nodes.front());
        ImageFilter& last = addFilter(nodes, 1, 1);
        feed(last, 0, *nodes[1]);
    });
}

/// Reads one pixel more than it declares.
class LiarFilter : public TestFilter {
public:
    PositionExtentInWorldSpace needed(PositionExtentInWorldSpace const& outputRegion, std::string,
                                      RegionMap const&) override {
        return outputRegion;
    }
};

TEST_F(PoisonTest, findsAFilterThatReadsMoreThanItDeclares) {
    Builder const build = [](Nodes& nodes, ImageFilter& source) {
        auto upLiar = std::make_unique<LiarFilter>();
        upLiar->nForcedChannels_ = 4;
        upLiar->iRadius_ = 1;
        nodes.push_back(std::move(upLiar));
        feed(*nodes.back(), 0, source);
    };
    EXPECT_NE(run(build, world(0, 10, 8, 6), Poison::NONE), run(build, world(0, 10, 8, 6), Poison::NAN_ONLY));
}

} // namespace

} // namespace ORVO
