#include "orvo/core/memory/MemoryStatistics.h"
#include "tests/image_flow/support/TestNodes.h"
#include "tests/support/ImageFlowLayers.h"

#include <gtest/gtest.h>

#include <atomic>
#include <deque>

namespace ORVO {

namespace {

using Test::feed;
using Test::pixels;
using Test::TestFilter;
using Test::world;

/// Counts the images in use while it runs and touches as little of its own as it can.
class ObservingFilter : public TestFilter {
public:
    explicit ObservingFilter(std::size_t nInputs) : TestFilter(nInputs) { nForcedChannels_ = 4; }

    void processSlice(std::size_t begin, std::size_t end) override {
        std::size_t const nBlocks = Core::MemoryStatistics::blocks(MEMORY_TYPE_IMAGE);
        std::size_t nMost = nMostBlocks_;
        while (nMost < nBlocks && !nMostBlocks_.compare_exchange_weak(nMost, nBlocks)) {
        }
        int const top = oOutputRegionInPixels_.position().y();
        for (std::size_t row = begin; row < end; ++row) {
            float sum = 1;
            for (auto const& upInput : aInputs_) {
                sum += *ORVO::Test::pixelAt(**upInput, 0, top + int(row));
            }
            *ORVO::Test::pixelAt(*spOutputImage_, 0, top + int(row)) = sum;
        }
    }

    static std::atomic<std::size_t> nMostBlocks_;
};
std::atomic<std::size_t> ObservingFilter::nMostBlocks_{0};

/// Filters on a 4K picture between a client's source image and its output image.
class FrameMemoryTest : public testing::Test {
protected:
    static constexpr int nWidth = 3840;
    static constexpr int nHeight = 2160;

    FrameMemoryTest() : oIn_(image()), oOut_(image()) {
        for (int y = 0; y < nHeight; ++y) {
            *ORVO::Test::pixelAt(oIn_, 0, y) = float(y);
        }
        oSource_.setImageCPUWithNoOwnership(&oIn_);
        oController_.addNode(&oSource_);
    }

    ~FrameMemoryTest() override {
        for (ObservingFilter& filter : aFilters_) {
            filter.disconnect();
        }
    }

    static ImageCPU image() {
        return {ImageCPU::PIXEL_FORMAT_RGBA32F, pixels(0, 0, nWidth, nHeight), PixelExtentInWorldSpace(),
                ExtentInPixelSpace()};
    }

    ObservingFilter& add(std::vector<ImageFilter*> const& aProducers) {
        aFilters_.emplace_back(aProducers.size());
        for (std::size_t i = 0; i < aProducers.size(); ++i) {
            feed(aFilters_.back(), i, *aProducers[i]);
        }
        oController_.addNode(&aFilters_.back());
        return aFilters_.back();
    }

    /// Runs a frame and answers the most intermediate images that were alive at a time in it.
    std::size_t run(bool bDirtyPass) {
        oController_.setImageSink(aFilters_.back());
        aFilters_.back().setBoundOutputImage(&oOut_);
        oSource_.emit();
        oController_.computeRegions(world(0, 0, float(nWidth), float(nHeight)));
        if (bDirtyPass) {
            oController_.setDirtyState();
        }
        ObservingFilter::nMostBlocks_ = 0;
        oController_.process();
        return ObservingFilter::nMostBlocks_ - 2; // the client's two
    }

    ORVO::Test::ImageFlowLayers oLayers_;
    ImageCPU oIn_;
    ImageCPU oOut_;
    ImageFlowController oController_;
    ImageCPUInput oSource_;
    std::deque<ObservingFilter> aFilters_;
};

TEST_F(FrameMemoryTest, aChainOfTwentyFiltersKeepsTwoImagesAtATime) {
    ImageFilter* pLast = &oSource_;
    for (int i = 0; i < 20; ++i) {
        pLast = &add({pLast});
    }
    EXPECT_EQ(2u, run(false));
    EXPECT_EQ(20.0f + 2159.0f, *ORVO::Test::pixelAt(oOut_, 0, 2159));
    EXPECT_EQ(2u, Core::MemoryStatistics::blocks(MEMORY_TYPE_IMAGE)); // nothing stays but the client's two
}

TEST_F(FrameMemoryTest, theImageKeptInFrontOfAChangedFilterIsAThird) {
    ImageFilter* pLast = &oSource_;
    for (int i = 0; i < 20; ++i) {
        pLast = &add({pLast});
    }
    EXPECT_EQ(2u, run(true));
    run(true);
    aFilters_[9].oOffset_.setValue(5.0f);
    EXPECT_LE(run(true), 3u);
    EXPECT_LE(Core::MemoryStatistics::blocks(MEMORY_TYPE_IMAGE), 3u);
    EXPECT_EQ(20.0f + 2159.0f, *ORVO::Test::pixelAt(oOut_, 0, 2159));
}

TEST_F(FrameMemoryTest, imagesOfABranchDieWithTheirLastConsumer) {
    ImageFilter& first = add({&oSource_});
    ImageFilter* pLeft = &first;
    ImageFilter* pRight = &first;
    for (int i = 0; i < 5; ++i) {
        pLeft = &add({pLeft});
    }
    for (int i = 0; i < 5; ++i) {
        pRight = &add({pRight});
    }
    add({pLeft, pRight});
    // While the right branch runs, the result of the left one waits, and each filter has its input and its
    // output.
    EXPECT_LE(run(false), 3u);
    EXPECT_EQ(2u, Core::MemoryStatistics::blocks(MEMORY_TYPE_IMAGE));
}

} // namespace

} // namespace ORVO
