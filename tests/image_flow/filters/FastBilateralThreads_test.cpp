#include "orvo/image_flow/filters/FastBilateralCPUFilter.h"

#include "orvo/core/Check.h"
#include "orvo/image_flow/filters/bilateral/PlainBilateralFilter.h"
#include "orvo/image_runtime/images/ImageCPUReadAccessor.h"
#include "orvo/image_runtime/images/ImageCPUWriteAccessor.h"
#include "tests/image_flow/support/FastBilateralTesting.h"
#include "tests/support/Expect.h"

#include <gtest/gtest.h>

#include <mutex>
#include <set>
#include <thread>

namespace {

using namespace ORVO;
using namespace ORVO::Test;
using ImageRuntime::InstructionSet;
using ORVO::Test::reference::Settings;

Picture filtered(Picture const& source, Settings const& s, ImageFlow::bilateral::BandRunner& runner) {
    FilterImage input(ImageCPU::PIXEL_FORMAT_RGBA32F, source, source.width + 3);
    FilterImage output(ImageCPU::PIXEL_FORMAT_RGBA32F,
                       Picture(source.x, source.y, source.width, source.height), source.width + 1);
    ImageCPUReadAccessor reader(input.image());
    ImageCPUWriteAccessor writer(output.image());
    FastBilateralCPUFilter filter;
    EXPECT_TRUE(filter.applyFilter(&reader, &writer, float(s.rangeSigma), float(s.sigmaX), float(s.sigmaY),
                                   s.colorize, runner));
    EXPECT_TRUE(output.paddingIsUntouched());
    return output.picture();
}

class FastBilateralThreadsOf : public testing::TestWithParam<InstructionSet> {
protected:
    ScopedInstructionSet oActive_{GetParam()};
};

TEST_P(FastBilateralThreadsOf, ResultIsTheSameBitForBitHoweverRowsAreSpread) {
    for (Settings const& settings :
         {Settings{0.15, 7, 9, false}, Settings{0.15, 7, 9, true}, Settings{0.06, 2, 3, true}}) {
        Picture const source = randomPicture(0, 0, 131, 117, 3);
        ThreadedRunner one(1, 1000);
        Picture const expected = filtered(source, settings, one);
        for (std::size_t nThreads : {1U, 2U, 8U}) {
            for (std::size_t nGrain : {1U, 3U, 50U}) {
                ThreadedRunner runner(nThreads, nGrain);
                EXPECT_TRUE(areIdentical(expected, filtered(source, settings, runner)))
                    << nThreads << " threads, " << nGrain << " bands at a time";
            }
        }
    }
}

TEST_P(FastBilateralThreadsOf, DirectRoadIsTheSameBitForBitToo) {
    Picture source = randomPicture(0, 0, 61, 43, 4);
    source.at(3, 3).x = 1e6F;
    for (bool colorize : {false, true}) {
        Settings const settings = {0.2, 2, 2, colorize};
        ThreadedRunner one(1, 1000);
        ThreadedRunner many(8, 1);
        EXPECT_TRUE(areIdentical(filtered(source, settings, one), filtered(source, settings, many)));
    }
}

TEST_P(FastBilateralThreadsOf, FastAgreesWithPlain) {
    std::uint32_t seed = 100;
    for (Settings const& settings :
         {Settings{0.15, 10, 10, false}, Settings{0.15, 10, 10, true}, Settings{0.08, 3, 4, false},
          Settings{0.08, 3, 4, true}, Settings{0.3, 25, 60, true}, Settings{0.055, 20, 20, false}}) {
        Picture const source = randomPicture(0, 0, 161, 97, ++seed);
        PictureReader reader(source);
        Picture expected(0, 0, 161, 97);
        PictureWriter writer(expected);
        ImageFlow::bilateral::PlainBilateralFilter plain(nullptr, nullptr);
        ASSERT_TRUE(plain.applyFilter(reader, writer, float(settings.rangeSigma), float(settings.sigmaX),
                                      float(settings.sigmaY), settings.colorize));
        expectNear(applied(source, source, settings), expected, settings.colorize ? 2e-5F : 5e-6F);
    }
}

/// Notes the threads that ask it.
class ThreadNotingReader : public PictureReader {
public:
    using PictureReader::PictureReader;
    float4 getRGBAFloat4PixelAt(int x, int y) const override {
        std::lock_guard<std::mutex> const lock(oLock_);
        aThreads_.insert(std::this_thread::get_id());
        return PictureReader::getRGBAFloat4PixelAt(x, y);
    }
    mutable std::mutex oLock_;
    mutable std::set<std::thread::id> aThreads_;
};

TEST_P(FastBilateralThreadsOf, ForeignAccessorsAreAskedOnTheCallingThread) {
    Picture const source = randomPicture(0, 0, 64, 64, 5);
    Picture result(0, 0, 64, 64);
    ThreadNotingReader reader(source);
    PictureWriter writer(result);
    ThreadedRunner runner(4, 1);
    EXPECT_TRUE(FastBilateralCPUFilter().applyFilter(&reader, &writer, 0.15F, 5.0F, 5.0F, false, runner));
    EXPECT_EQ(std::set<std::thread::id>{std::this_thread::get_id()}, reader.aThreads_);
    EXPECT_EQ(64U * 64U, writer.written());
    EXPECT_TRUE(areIdentical(applied(source, source, {0.15, 5, 5, false}), result));
}

/// Runs no more than a number of bands, as a cancelled frame does.
class StoppingRunner : public ImageFlow::bilateral::BandRunner {
public:
    explicit StoppingRunner(std::size_t nAllowed) : nAllowed_(nAllowed) {}
    void run(std::size_t nBands, std::size_t /*nUnits*/, Body const& body) override {
        for (std::size_t band = 0; band < nBands && nAllowed_ > 0; ++band, --nAllowed_) {
            body(band, band + 1);
        }
    }
    std::size_t nAllowed_;
};

TEST_P(FastBilateralThreadsOf, AStoppedRunnerEndsTheWork) {
    if (GetParam() == InstructionSet::PLAIN) {
        return; // The plain version works on the calling thread alone.
    }
    Picture const source = randomPicture(0, 0, 50, 50, 6);
    FilterImage input(ImageCPU::PIXEL_FORMAT_RGBA32F, source, 50);
    std::size_t n = 0;
    for (bool done = false; !done; ++n) {
        FilterImage output(ImageCPU::PIXEL_FORMAT_RGBA32F, source, 50);
        ImageCPUReadAccessor reader(input.image());
        ImageCPUWriteAccessor writer(output.image());
        StoppingRunner runner(n);
        done = FastBilateralCPUFilter().applyFilter(&reader, &writer, 0.15F, 5.0F, 5.0F, true, runner);
        ASSERT_EQ(done, runner.nAllowed_ > 0 || n == 4 + 17 + 5 + 4) << n;
        ASSERT_LT(n, 100U);
    }
    // 4 bands of rows to convert, 17 rows of the grid to fill, 5 bands of them to blur, 4 bands of rows to
    // write.
    EXPECT_EQ(4U + 17U + 5U + 4U, n - 1);
}

/// Throws in a band.
class ThrowingRunner : public ImageFlow::bilateral::BandRunner {
public:
    void run(std::size_t, std::size_t, Body const&) override { ORVO_FAIL("band"); }
};

TEST_P(FastBilateralThreadsOf, AFailureOfTheRunnerPassesThrough) {
    if (GetParam() == InstructionSet::PLAIN) {
        return; // The plain version works on the calling thread alone.
    }
    Picture const source = randomPicture(0, 0, 20, 20, 7);
    FilterImage input(ImageCPU::PIXEL_FORMAT_RGBA32F, source, 20);
    FilterImage output(ImageCPU::PIXEL_FORMAT_RGBA32F, source, 20);
    ImageCPUReadAccessor reader(input.image());
    ImageCPUWriteAccessor writer(output.image());
    ThrowingRunner runner;
    ORVO_EXPECT_INTERNAL(
        FastBilateralCPUFilter().applyFilter(&reader, &writer, 0.15F, 5.0F, 5.0F, true, runner), "band");
}

INSTANTIATE_TEST_SUITE_P(All, FastBilateralThreadsOf, testing::ValuesIn(instructionSets()));

} // namespace
