// Random image graphs, every frame of which must equal, bit for bit, a plain recursive evaluation of the same
// graph on the whole plane, also after a frame that was cancelled.

#include "orvo/image_flow/filters/BufferCPU.h"
#include "tests/image_flow/support/Compounds.h"
#include "tests/support/ImageFlowLayers.h"

#include <gtest/gtest.h>

#include <map>
#include <random>

namespace ORVO {

namespace {

using DataFlow::Controller;
using ORVO::Test::feed;
using ORVO::Test::floatImage;
using ORVO::Test::pixelAt;
using ORVO::Test::pixels;
using ORVO::Test::TestFilter;
using ORVO::Test::world;
using ImagePtr = std::unique_ptr<ImageCPU, ORVODeleter<ImageCPU>>;

/// A picture on the whole plane: what is not there has no content.
using Plane = std::map<std::pair<int, int>, float>; // by row and column

/// One node: a source with its image, a filter with its producers, at times in a compound or two, or a
/// buffer.
struct Member {
    std::unique_ptr<ImageCPUInput> upSource_;
    ImagePtr upImage_;
    std::unique_ptr<ImageFilter> upFilter_;
    TestFilter* pFilter_ = nullptr; // none for sources and buffers
    std::vector<std::size_t> aProducers_;
    bool bConsumed_ = false;

    ImageFilter& node() const { return upSource_ ? static_cast<ImageFilter&>(*upSource_) : *upFilter_; }
};

class RandomImageGraph {
public:
    explicit RandomImageGraph(unsigned seed) : oRandom_(seed) {
        std::size_t const nMembers = 3 + pick(10);
        for (std::size_t i = 0; i < nMembers; ++i) {
            add(i, i + 1 == nMembers);
        }
        feed(oSink_, 0, aMembers_.back().node());
        oController_.addNode(&oSink_);
        oController_.setImageSink(oSink_);
    }

    ~RandomImageGraph() {
        oSink_.disconnect();
        for (Member& member : aMembers_) {
            member.node().disconnect();
        }
    }

    /// Changes something, runs a frame for a random region and compares it.
    void frame() {
        change();
        int const x = int(pick(24)) - 12;
        int const y = int(pick(24)) - 12;
        int const width = 1 + int(pick(16));
        int const height = 1 + int(pick(16));
        oController_.setSingleThreadMode(pick(3) == 0);
        if (pick(4) == 0) {
            prepare(world(float(x), float(y), float(width), float(height)));
            oController_.processAsync();
            oController_.cancelProcess();
            ASSERT_TRUE(oController_.wait(60, 0.0002));
            oController_.checkException();
        }
        prepare(world(float(x), float(y), float(width), float(height)));
        if (pick(2) == 0) {
            oController_.process();
        } else {
            oController_.processAsync();
            ASSERT_TRUE(oController_.wait(60, 0.0002));
            oController_.checkException();
        }
        compare(pixels(x, y, width, height));
    }

private:
    std::size_t pick(std::size_t n) { return std::uniform_int_distribution<std::size_t>(0, n - 1)(oRandom_); }

    void prepare(PositionExtentInWorldSpace const& region) {
        oController_.flushGraph();
        for (Member& member : aMembers_) {
            // Not the buffers, which would give again what they gave before.
            if (member.upSource_) {
                member.upSource_->emit();
            }
        }
        oController_.computeRegions(region);
    }

    void add(std::size_t iMember, bool bLast) {
        aMembers_.emplace_back();
        Member& member = aMembers_.back();
        if (bLast) {
            for (std::size_t i = 0; i < iMember; ++i) {
                if (!aMembers_[i].bConsumed_) {
                    member.aProducers_.push_back(i);
                }
            }
        } else if (iMember > 0 && pick(4) != 0) {
            for (std::size_t n = 1 + pick(2); n > 0; --n) {
                member.aProducers_.push_back(pick(iMember));
            }
        }
        if (member.aProducers_.empty()) {
            member.upSource_ = std::make_unique<ImageCPUInput>();
            newImage(member);
        } else {
            if (member.aProducers_.size() == 1 && !bLast && pick(5) == 0) {
                member.upFilter_ = std::make_unique<BufferCPU>();
            } else {
                auto upFilter = std::make_unique<TestFilter>(member.aProducers_.size());
                member.pFilter_ = upFilter.get();
                member.pFilter_->iRadius_ = int(pick(3));
                member.upFilter_ =
                    member.aProducers_.size() == 1 ? atTimesInside(std::move(upFilter)) : std::move(upFilter);
            }
            for (std::size_t i = 0; i < member.aProducers_.size(); ++i) {
                aMembers_[member.aProducers_[i]].bConsumed_ = true;
                feed(*member.upFilter_, i, aMembers_[member.aProducers_[i]].node());
            }
        }
        oController_.addNode(&member.node());
    }

    std::unique_ptr<ImageFilter> atTimesInside(std::unique_ptr<TestFilter> upFilter) {
        switch (pick(4)) {
        case 0:
            return std::make_unique<ORVO::Test::HostCompound>(std::move(upFilter));
        case 1:
            return ORVO::Test::nestedTwice<ORVO::Test::HostRoad>(std::move(upFilter));
        default:
            return upFilter;
        }
    }

    void newImage(Member& member) {
        std::uniform_real_distribution<float> value(-1.0f, 1.0f);
        ImagePtr upImage =
            floatImage(pixels(int(pick(12)) - 6, int(pick(12)) - 6, 1 + int(pick(9)), 1 + int(pick(9))),
                       [&](int, int) { return value(oRandom_); });
        member.upSource_->setImageCPUWithNoOwnership(upImage.get());
        member.upImage_ = std::move(upImage);
    }

    void change() {
        Member& member = aMembers_[pick(aMembers_.size())];
        if (member.upSource_) {
            oController_.flushGraph(); // outputs let go of the image
            newImage(member);
        } else if (member.pFilter_ != nullptr) {
            member.pFilter_->oOffset_.setValue(float(pick(100)) / 8);
            member.pFilter_->iRadius_ = int(pick(3));
        }
    }

    /// One member's picture, out of those of its producers.
    Plane evaluate(std::size_t iMember, std::vector<Plane> const& aPlanes) const {
        Member const& member = aMembers_[iMember];
        Plane result;
        if (member.upSource_) {
            ImageCPU const& image = *member.upImage_;
            for (int row = 0; row < image.extent().height(); ++row) {
                for (int column = 0; column < image.extent().width(); ++column) {
                    int const x = image.position().x() + column;
                    int const y = image.position().y() + row;
                    result[{y, x}] = *pixelAt(image, x, y);
                }
            }
            return result;
        }
        if (member.pFilter_ == nullptr) {
            return aPlanes[member.aProducers_[0]];
        }
        std::vector<Plane> aInputs;
        PositionExtentInWorldSpace domain;
        for (std::size_t iProducer : member.aProducers_) {
            aInputs.push_back(aPlanes[iProducer]);
            PositionExtentInWorldSpace region = boundsOf(aInputs.back());
            region.outset(float2(float(member.pFilter_->iRadius_)));
            domain.include(region);
        }
        PositionExtentInPixelSpace const box = worldToPixelSpace(domain, PixelExtentInWorldSpace());
        for (int y = box.position().y(); y < box.position().y() + box.extent().height(); ++y) {
            for (int x = box.position().x(); x < box.position().x() + box.extent().width(); ++x) {
                result[{y, x}] = windowMean(*member.pFilter_, aInputs, x, y);
            }
        }
        return result;
    }

    static PositionExtentInWorldSpace boundsOf(Plane const& plane) {
        PositionExtentInWorldSpace region;
        for (auto const& [place, value] : plane) {
            region.include(world(float(place.second), float(place.first), 1, 1));
        }
        return region;
    }

    static float windowMean(TestFilter const& filter, std::vector<Plane> const& aInputs, int x, int y) {
        double sum = 0;
        double n = 0;
        for (Plane const& input : aInputs) {
            for (int v = y - filter.iRadius_; v <= y + filter.iRadius_; ++v) {
                for (int u = x - filter.iRadius_; u <= x + filter.iRadius_; ++u) {
                    if (auto const found = input.find({v, u}); found != input.end()) {
                        sum += double(found->second);
                        n += 1;
                    }
                }
            }
        }
        return float((n == 0 ? 0.0 : sum / n) + double(filter.oOffset_.value()));
    }

    void compare(PositionExtentInPixelSpace const& asked) const {
        std::vector<Plane> aPlanes;
        for (std::size_t i = 0; i < aMembers_.size(); ++i) {
            aPlanes.push_back(evaluate(i, aPlanes));
        }
        Plane const& expected = aPlanes.back();
        ImageCPU const* const pResult = oSink_.getImageCPU();
        ASSERT_NE(nullptr, pResult);
        std::size_t nPixels = 0;
        for (auto const& [place, value] : expected) {
            auto const [y, x] = place;
            if (x < asked.position().x() || x >= asked.position().x() + asked.extent().width() ||
                y < asked.position().y() || y >= asked.position().y() + asked.extent().height()) {
                continue;
            }
            ++nPixels;
            ASSERT_GE(x, pResult->position().x());
            ASSERT_LT(x, pResult->position().x() + pResult->extent().width());
            ASSERT_GE(y, pResult->position().y());
            ASSERT_LT(y, pResult->position().y() + pResult->extent().height());
            ASSERT_EQ(value, *pixelAt(*pResult, x, y)) << x << ", " << y;
        }
        // The frame computes no pixel more than the part of the region that has content.
        ASSERT_EQ(nPixels, pResult->numberOfPixels());
    }

    std::mt19937 oRandom_;
    std::vector<Member> aMembers_;
    ImageFlowController oController_;
    ImageCPUOutput oSink_;
};

TEST(RandomImageGraphsTest, everyFrameEqualsThePlainEvaluation) {
    ORVO::Test::ImageFlowLayers layers;
    std::size_t const nThreads = Controller::getNumberOfThreads();
    for (unsigned seed = 0; seed < 150; ++seed) {
        SCOPED_TRACE(testing::Message() << "seed " << seed);
        Controller::setNumberOfThreads(seed % 3 == 0 ? 1 : seed % 3 == 1 ? 2 : 8);
        Controller::setMinimumGrainSize(seed % 5 * 7);
        RandomImageGraph graph(seed);
        for (int i = 0; i < 4 && !HasFailure(); ++i) {
            graph.frame();
        }
        if (HasFailure()) {
            break;
        }
    }
    Controller::setNumberOfThreads(nThreads);
    Controller::setMinimumGrainSize(1);
}

} // namespace

} // namespace ORVO
