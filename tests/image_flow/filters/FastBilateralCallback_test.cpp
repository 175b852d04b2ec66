#include "orvo/image_flow/filters/FastBilateralCPUFilter.h"

#include "orvo/image_runtime/images/ImageCPUReadAccessor.h"
#include "orvo/image_runtime/images/ImageCPUWriteAccessor.h"
#include "tests/image_flow/support/FastBilateralTesting.h"

#include <gtest/gtest.h>

#include <thread>
#include <vector>

namespace {

using namespace ORVO;
using namespace ORVO::Test;
using ImageRuntime::InstructionSet;

/// Counts the questions and answers no to one of them.
struct Progress {
    std::size_t nAsked = 0;
    std::size_t nAllowed = ~std::size_t(0);
    std::thread::id thread = std::this_thread::get_id();
    bool onlyOneThread = true;
    std::vector<std::size_t> aPixelsRead = {}; ///< how many pixels had been read at each question
    std::size_t const* pPixelsRead = nullptr;

    static bool ask(void* pData) {
        auto& progress = *static_cast<Progress*>(pData);
        progress.onlyOneThread = progress.onlyOneThread && std::this_thread::get_id() == progress.thread;
        if (progress.pPixelsRead != nullptr) {
            progress.aPixelsRead.push_back(*progress.pPixelsRead);
        }
        return progress.nAsked++ < progress.nAllowed;
    }
};

class CountingReader : public PictureReader {
public:
    using PictureReader::PictureReader;
    float4 getRGBAFloat4PixelAt(int x, int y) const override {
        ++nRead_;
        return PictureReader::getRGBAFloat4PixelAt(x, y);
    }
    mutable std::size_t nRead_ = 0;
};

class FastBilateralCallbackOf : public testing::TestWithParam<InstructionSet> {
protected:
    ScopedInstructionSet oActive_{GetParam()};

    /// Runs the filter on a picture of 31 by 22 pixels; at a sigma of 5 the grid has 14 columns and 12 rows.
    bool run(Progress& progress, float rangeSigma, bool colorize, float scale = 1.0F) {
        Picture const source = randomPicture(0, 0, 31, 22, 1, 0.0F, scale);
        oResult_ = Picture(0, 0, 31, 22, float4(7.0F));
        PictureReader reader(source);
        PictureWriter writer(oResult_);
        FastBilateralCPUFilter filter;
        filter.registerProcessingCallback(&Progress::ask, &progress);
        bool const done = filter.applyFilter(&reader, &writer, rangeSigma, 5.0F, 5.0F, colorize);
        nWritten_ = writer.written();
        return done;
    }

    Picture oResult_{0, 0, 0, 0};
    std::size_t nWritten_ = 0;
};

constexpr std::size_t kRows = 22;
constexpr std::size_t kGridColumns = 14;
constexpr std::size_t kGridRows = 12;
constexpr std::size_t kBlurRows = kGridRows + 2 * kGridColumns;

TEST_P(FastBilateralCallbackOf, GridRoadAsksAfterEachRowOfEachPhase) {
    Progress grey;
    EXPECT_TRUE(run(grey, 0.15F, false));
    EXPECT_EQ(3 * kRows + kBlurRows, grey.nAsked);
    Progress colour;
    EXPECT_TRUE(run(colour, 0.15F, true));
    EXPECT_EQ(2 * kRows + kBlurRows, colour.nAsked);
    EXPECT_TRUE(grey.onlyOneThread && colour.onlyOneThread);
}

TEST_P(FastBilateralCallbackOf, DirectRoadAsksAfterEachRow) {
    for (bool colorize : {false, true}) {
        Progress progress;
        EXPECT_TRUE(run(progress, 0.15F, colorize, 1e5F));
        EXPECT_EQ(2 * kRows, progress.nAsked);
    }
}

TEST_P(FastBilateralCallbackOf, IdentityAsksForTheConversionAlone) {
    Progress progress;
    EXPECT_TRUE(run(progress, 0.01F, false));
    EXPECT_EQ(kRows, progress.nAsked);
}

TEST_P(FastBilateralCallbackOf, NoAtAnyQuestionEndsTheWorkWithNothingWritten) {
    for (bool colorize : {false, true}) {
        Progress counting;
        ASSERT_TRUE(run(counting, 0.15F, colorize));
        for (std::size_t n = 0; n < counting.nAsked; ++n) {
            Progress progress;
            progress.nAllowed = n;
            ASSERT_FALSE(run(progress, 0.15F, colorize));
            ASSERT_EQ(n + 1, progress.nAsked);
            ASSERT_EQ(0U, nWritten_);
        }
    }
}

TEST_P(FastBilateralCallbackOf, NoOnTheDirectRoadEndsTheWork) {
    Progress progress;
    progress.nAllowed = kRows + 3;
    EXPECT_FALSE(run(progress, 0.15F, false, 1e5F));
    EXPECT_EQ(kRows + 4, progress.nAsked);
    EXPECT_EQ(0U, nWritten_);
}

TEST_P(FastBilateralCallbackOf, RowsAreConvertedOneAfterTheOther) {
    Picture const source = randomPicture(0, 0, 31, 22, 1);
    Picture result(0, 0, 31, 22);
    CountingReader reader(source);
    PictureWriter writer(result);
    Progress progress;
    progress.pPixelsRead = &reader.nRead_;
    FastBilateralCPUFilter filter;
    filter.registerProcessingCallback(&Progress::ask, &progress);
    ASSERT_TRUE(filter.applyFilter(&reader, &writer, 0.15F, 5.0F, 5.0F, true));
    for (std::size_t row = 0; row < kRows; ++row) {
        EXPECT_EQ(31 * (row + 1), progress.aPixelsRead[row]);
    }
}

TEST_P(FastBilateralCallbackOf, ResultIsThatWithoutACallback) {
    Progress progress;
    ASSERT_TRUE(run(progress, 0.15F, true));
    Picture const source = randomPicture(0, 0, 31, 22, 1);
    EXPECT_TRUE(areIdentical(applied(source, source, {0.15, 5, 5, true}), oResult_));
}

TEST_P(FastBilateralCallbackOf, ARunnerIsNotUsedWhileACallbackIsRegistered) {
    Picture const source = randomPicture(0, 0, 31, 22, 1);
    FilterImage input(ImageCPU::PIXEL_FORMAT_RGBA32F, source, 31);
    FilterImage output(ImageCPU::PIXEL_FORMAT_RGBA32F, source, 31);
    ImageCPUReadAccessor reader(input.image());
    ImageCPUWriteAccessor writer(output.image());
    Progress progress;
    FastBilateralCPUFilter filter;
    filter.registerProcessingCallback(&Progress::ask, &progress);
    ThreadedRunner runner(4, 1);
    EXPECT_TRUE(filter.applyFilter(&reader, &writer, 0.15F, 5.0F, 5.0F, true, runner));
    EXPECT_TRUE(progress.onlyOneThread);
    EXPECT_EQ(2 * kRows + kBlurRows, progress.nAsked);
}

TEST_P(FastBilateralCallbackOf, AResetCallbackIsAskedNoMore) {
    Picture source = randomPicture(0, 0, 9, 9, 1);
    PictureReader reader(source);
    PictureWriter writer(source);
    Progress progress;
    progress.nAllowed = 0;
    FastBilateralCPUFilter filter;
    filter.registerProcessingCallback(&Progress::ask, &progress);
    EXPECT_FALSE(filter.applyFilter(&reader, &writer, 0.15F, 5.0F, 5.0F, false));
    // A copy takes the callback along.
    FastBilateralCPUFilter copy(filter);
    EXPECT_FALSE(copy.applyFilter(&reader, &writer, 0.15F, 5.0F, 5.0F, false));
    EXPECT_EQ(2U, progress.nAsked);
    filter.resetProcessingCallback();
    EXPECT_TRUE(filter.applyFilter(&reader, &writer, 0.15F, 5.0F, 5.0F, false));
    copy.registerProcessingCallback(nullptr, nullptr);
    EXPECT_TRUE(copy.applyFilter(&reader, &writer, 0.15F, 5.0F, 5.0F, false));
    EXPECT_EQ(2U, progress.nAsked);
}

INSTANTIATE_TEST_SUITE_P(All, FastBilateralCallbackOf, testing::ValuesIn(instructionSets()));

} // namespace
