// Region passes on random graphs against a recursive evaluation of their rules, written with plain numbers.

#include "tests/image_flow/support/TestNodes.h"
#include "tests/support/ImageFlowLayers.h"

#include <gtest/gtest.h>

#include <optional>
#include <random>

namespace ORVO {

namespace {

using Test::feed;
using Test::plant;
using Test::TestFilter;
using Test::world;

/// A rectangle by its edges.
struct Box {
    double left, top, right, bottom;
};
using Region = std::optional<Box>;

Region united(Region const& a, Region const& b) {
    if (!a || !b) {
        return a ? a : b;
    }
    return Box{std::min(a->left, b->left), std::min(a->top, b->top), std::max(a->right, b->right),
               std::max(a->bottom, b->bottom)};
}

Region grown(Region region, double x, double y) {
    if (region) {
        region = Box{region->left - x, region->top - y, region->right + x, region->bottom + y};
    }
    return region;
}

Region overlap(Region const& a, Region const& b) {
    if (!a || !b) {
        return std::nullopt;
    }
    return Box{std::max(a->left, b->left), std::max(a->top, b->top), std::min(a->right, b->right),
               std::min(a->bottom, b->bottom)};
}

/// One node of a random graph, with what the passes must find for it.
struct Model {
    std::unique_ptr<TestFilter> upFilter_;
    std::vector<std::size_t> aProducers_;
    std::vector<std::size_t> aConsumers_;
    Region oGenerated_;
    std::optional<PixelExtentInWorldSpace> oForced_;
};

class RandomGraph {
public:
    explicit RandomGraph(unsigned seed) : oRandom_(seed) {
        std::size_t const nNodes = 2 + pick(29);
        for (std::size_t i = 0; i < nNodes; ++i) {
            addNode(i, i + 1 == nNodes);
        }
        std::vector<std::size_t> order(nNodes);
        for (std::size_t i = 0; i < nNodes; ++i) {
            order[i] = i;
        }
        std::shuffle(order.begin(), order.end(), oRandom_);
        for (std::size_t i : order) {
            oController_.addNode(aNodes_[i].upFilter_.get());
        }
        oController_.setImageSink(*aNodes_.back().upFilter_);
    }

    ~RandomGraph() {
        for (Model& node : aNodes_) {
            node.upFilter_->disconnect();
        }
    }

    void check() {
        int const x = int(pick(200)) - 100;
        int const y = int(pick(200)) - 100;
        int const width = 1 + int(pick(100));
        int const height = 1 + int(pick(100));
        oAsked_ = Box{double(x), double(y), double(x) + width, double(y) + height};
        oController_.computeRegions(world(float(x), float(y), float(width), float(height)));
        for (std::size_t i = 0; i < aNodes_.size(); ++i) {
            TestFilter const& filter = *aNodes_[i].upFilter_;
            EXPECT_EQ(pixelExtent(i), filter.outputPixelExtent()) << "node " << i;
            expectEqual(domain(i), filter.domainOfDefinition(), "DOD", i);
            expectEqual(interest(i), filter.regionOfInterest(), "ROI", i);
            Region const region = overlap(domain(i), interest(i));
            PositionExtentInWorldSpace const& computed = filter.spComputeRegion_->value();
            if (region && (region->left >= region->right || region->top >= region->bottom)) {
                EXPECT_TRUE(computed.isEmpty()) << "node " << i;
            } else {
                expectEqual(region, computed, "compute region", i);
            }
        }
    }

private:
    std::size_t pick(std::size_t n) { return std::uniform_int_distribution<std::size_t>(0, n - 1)(oRandom_); }

    void addNode(std::size_t iNode, bool bLast) {
        Model node;
        if (bLast) { // all that nobody consumes yet meets in the sink
            for (std::size_t i = 0; i < iNode; ++i) {
                if (aNodes_[i].aConsumers_.empty()) {
                    node.aProducers_.push_back(i);
                }
            }
        } else if (iNode > 0) {
            for (std::size_t n = pick(4); n > 0; --n) {
                node.aProducers_.push_back(pick(iNode));
            }
        }
        node.upFilter_ = std::make_unique<TestFilter>(node.aProducers_.size());
        node.upFilter_->iRadius_ = int(pick(4));
        if (node.aProducers_.empty() && pick(8) != 0) {
            int const x = int(pick(100)) - 50;
            int const y = int(pick(100)) - 50;
            int const width = 1 + int(pick(80));
            int const height = 1 + int(pick(80));
            node.oGenerated_ = Box{double(x), double(y), double(x) + width, double(y) + height};
            node.upFilter_->setGeneratedRegion(world(float(x), float(y), float(width), float(height)));
        }
        if (pick(4) == 0) {
            node.oForced_ = PixelExtentInWorldSpace(0.5f * float(1 + pick(4)), 0.25f * float(1 + pick(8)));
            node.upFilter_->setOutputPixelExtent(*node.oForced_);
        }
        for (std::size_t i = 0; i < node.aProducers_.size(); ++i) {
            aNodes_[node.aProducers_[i]].aConsumers_.push_back(iNode);
            feed(*node.upFilter_, i, *aNodes_[node.aProducers_[i]].upFilter_);
        }
        aNodes_.push_back(std::move(node));
    }

    PixelExtentInWorldSpace pixelExtent(std::size_t i) const {
        Model const& node = aNodes_[i];
        if (node.oForced_) {
            return *node.oForced_;
        }
        return node.aProducers_.empty() ? PixelExtentInWorldSpace(1, 1) : pixelExtent(node.aProducers_[0]);
    }

    Region withMargin(Region const& region, std::size_t i) const {
        double const radius = aNodes_[i].upFilter_->iRadius_;
        return grown(region, radius * double(pixelExtent(i).width()),
                     radius * double(pixelExtent(i).height()));
    }

    Region domain(std::size_t i) const {
        Region result;
        for (std::size_t iProducer : aNodes_[i].aProducers_) {
            result = united(result, withMargin(domain(iProducer), i));
        }
        return united(result, aNodes_[i].oGenerated_);
    }

    Region interest(std::size_t i) const {
        if (i + 1 == aNodes_.size()) {
            return oAsked_;
        }
        Region result;
        for (std::size_t iConsumer : aNodes_[i].aConsumers_) {
            result = united(result, withMargin(interest(iConsumer), iConsumer));
        }
        return result;
    }

    void expectEqual(Region const& expected, PositionExtentInWorldSpace const& actual, char const* what,
                     std::size_t i) const {
        ASSERT_EQ(expected.has_value(), actual.extent().isDefined()) << what << " of node " << i;
        if (expected) {
            EXPECT_EQ(world(float(expected->left), float(expected->top),
                            float(expected->right - expected->left), float(expected->bottom - expected->top)),
                      actual)
                << what << " of node " << i;
        }
    }

    std::mt19937 oRandom_;
    std::vector<Model> aNodes_;
    ImageFlowController oController_;
    Region oAsked_;
};

TEST(RegionsTest, randomGraphsFollowTheRules) {
    ORVO::Test::ImageFlowLayers layers;
    for (unsigned seed = 0; seed < 300; ++seed) {
        SCOPED_TRACE(testing::Message() << "seed " << seed);
        RandomGraph graph(seed);
        graph.check();
        graph.check();
        if (HasFailure()) {
            return;
        }
    }
}

TEST(RegionsTest, theRegionOfTheSinkReachesTheSourceOfAChain) {
    ORVO::Test::ImageFlowLayers layers;
    TestFilter source(0);
    TestFilter sink(1, false);
    feed(sink, 0, source);
    ImageFlowController controller;
    plant(controller, {&source, &sink}, sink);
    source.setGeneratedRegion(world(-3, -4, 20, 30));
    controller.computeRegions(world(1, 2, 3, 4));
    EXPECT_EQ(world(-3, -4, 20, 30), sink.domainOfDefinition());
    EXPECT_EQ(world(1, 2, 3, 4), source.regionOfInterest());
}

} // namespace

} // namespace ORVO
